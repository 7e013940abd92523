#include "WideString.h"

#include "Utf8Codec.h"

#include <cstring>
#include <cwchar>

namespace WideString
{
std::string toUtf8(const ACE_WString& text)
{
    std::string result;
    Utf8Codec::encode(text.fast_rep(), text.length(), result);
    return result;
}

std::string toUtf8(const wchar_t* text)
{
    std::string result;
    if (text != nullptr)
        Utf8Codec::encode(text, std::wcslen(text), result);
    return result;
}

ACE_WString fromUtf8(const std::string& text)
{
    std::wstring wide;
    Utf8Codec::decode(text.data(), text.size(), wide);
    return fromStd(wide);
}

ACE_WString fromUtf8(const char* text)
{
    if (text == nullptr)
        return ACE_WString();
    std::wstring wide;
    Utf8Codec::decode(text, std::strlen(text), wide);
    return fromStd(wide);
}

std::wstring toStd(const ACE_WString& text)
{
    return std::wstring(text.fast_rep(), text.length());
}

ACE_WString fromStd(const std::wstring& text)
{
    return ACE_WString(text.data(), text.size());
}
}
