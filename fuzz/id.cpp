// ID parsing of the input as UTF-8 text, through the narrow constructor (up to the first NUL)
// and through a wide string holding the whole input. The accessors must give back parts that
// put the text together again.

#include "ID.h"
#include "FuzzSupport.h"
#include "WideString.h"

#include <cstddef>
#include <cstdint>
#include <string>

namespace
{
std::wstring s(const ACE_WString& text)
{
    return WideString::toStd(text);
}

void checkParts(const ID& id, const std::wstring& text)
{
    FUZZ_CHECK(s(id.getString()) == text);
    FUZZ_CHECK(id.isNull() == text.empty());
    FUZZ_CHECK(id == id && !(id != id) && !(id < id));
    FUZZ_CHECK(ID(id.getString()) == id);

    const std::wstring scheme = s(id.getScheme());
    const std::wstring path = s(id.getPath());
    FUZZ_CHECK(scheme.find(L':') == std::wstring::npos);
    if (text.find(L':') == std::wstring::npos)
        FUZZ_CHECK(scheme.empty() && path.empty());
    else
        FUZZ_CHECK(scheme + L":" + path == text);

    ACE_WString queryText(L"untouched");
    const bool hasQuery = id.getQuery(queryText);
    const std::wstring query = s(queryText);
    const std::wstring library = s(id.getLibrary());
    const std::wstring parameter = s(id.getParameter());
    const std::size_t question = text.find(L'?');
    FUZZ_CHECK(hasQuery == (question != std::wstring::npos));
    if (!hasQuery)
    {
        FUZZ_CHECK(query.empty() && library.empty());
        const std::size_t hash = text.find(L'#');
        FUZZ_CHECK(hash == std::wstring::npos ? parameter.empty() : text.substr(hash) == L"#" + parameter);
        return;
    }
    // [scheme ":"] library "?" query ["#" parameter]
    FUZZ_CHECK(query.find(L'#') == std::wstring::npos && library.find(L'?') == std::wstring::npos);
    const std::wstring head = text.substr(0, question);
    FUZZ_CHECK(head.size() >= library.size() &&
               head.compare(head.size() - library.size(), library.size(), library) == 0);
    const std::wstring prefix = head.substr(0, head.size() - library.size());
    FUZZ_CHECK(prefix.empty() || prefix == scheme + L":");
    const bool hasHash = text.find(L'#', question + 1) != std::wstring::npos;
    FUZZ_CHECK(text == head + L"?" + query + (hasHash ? L"#" + parameter : std::wstring()));
    FUZZ_CHECK(hasHash || parameter.empty());
}
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    checkParts(ID(text.c_str()), s(WideString::fromUtf8(text.c_str())));
    const ACE_WString whole = WideString::fromUtf8(text);
    checkParts(ID(whole), s(whole));
    return 0;
}
