#include "CBText.h"

#include "BSet.h"
#include "BString.h"
#include "IComponentManager.h"
#include "PBText.h"
#include "TesselLog_Static.h"
#include "WideString.h"

#include <charconv>
#include <map>
#include <mutex>
#include <string>

namespace
{
const char* const kComponent = "tesselComponents";
const char* const kFile = "tesselComponents.dll";
const char* const kClass = "CBText";

// A number's decimal text, as std::to_wstring writes it, without the C library's formatting.
std::wstring decimal(int number)
{
    char digits[16];
    const char* end = std::to_chars(digits, digits + sizeof(digits), number).ptr;
    return std::wstring(static_cast<const char*>(digits), end);
}
}

struct CBText::Impl
{
    mutable std::mutex mutex;
    std::map<std::wstring, ACE_WString> texts;

    ACE_WString lookup(const std::wstring& key, const ACE_WString& defaultText) const
    {
        std::lock_guard<std::mutex> lock(mutex);
        const auto found = texts.find(key);
        return found != texts.end() ? found->second : defaultText;
    }
};

const wchar_t* const CBText::componentID = L"tessel:BText?BText";

CBText::CBText() : CComponent_Thread_NoRef(ID(componentID)), m_impl(std::make_unique<Impl>())
{
}

CBText::~CBText() = default;

CBText* CBText::registerWith(IComponentManager& manager)
{
    auto component = std::make_unique<CBText>();
    CBText* registered = component.get();
    const int result =
        manager.registerComponent(std::move(component), [](IComponent* served) { return new PBText(served); });
    return result == 0 ? registered : nullptr;
}

bool CBText::loadCatalogue(const ACE_WString& path)
{
    BSet catalogue;
    if (!catalogue.load(path))
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, 0, "[CBText::loadCatalogue()] cannot read '%S'",
                                          path.c_str());
        return false;
    }
    std::map<std::wstring, ACE_WString> texts;
    for (int i = 0; i < catalogue.size(); ++i)
    {
        const BData& value = catalogue.valueAt(i);
        if (value.type() != BData::eSTRING)
        {
            TesselLog_Static::logError_static(kComponent, kFile, kClass, 0,
                                              "[CBText::loadCatalogue()] '%S' in '%S' is not a text; skipped",
                                              catalogue.keyAt(i).c_str(), path.c_str());
            continue;
        }
        texts[WideString::toStd(catalogue.keyAt(i))] = static_cast<const BString&>(value).value();
    }
    std::lock_guard<std::mutex> lock(m_impl->mutex);
    m_impl->texts.swap(texts);
    return true;
}

void CBText::setText(const ACE_WString& textId, const ACE_WString& text)
{
    std::lock_guard<std::mutex> lock(m_impl->mutex);
    m_impl->texts[WideString::toStd(textId)] = text;
}

ACE_WString CBText::getText(const ACE_WString& textId, const ACE_WString& defaultText) const
{
    return m_impl->lookup(WideString::toStd(textId), defaultText);
}

ACE_WString CBText::getText(int textId, const ACE_WString& defaultText) const
{
    return m_impl->lookup(decimal(textId), defaultText);
}
