#pragma once

#include "WideString.h"

#include <ace/SString.h>

#include <QString>

#include <cstddef>
#include <string>

// Conversions between the tests' UTF-8 text and the library's wide and Qt strings.
inline ACE_WString wide(const std::string& utf8)
{
    return WideString::fromUtf8(utf8);
}

inline std::string utf8(const ACE_WString& text)
{
    return WideString::toUtf8(text);
}

inline QString qs(const std::string& utf8Text)
{
    return QString::fromUtf8(utf8Text.c_str());
}

// Literals with an explicit length: GCC 12 warns falsely inside ACE's NUL-terminated string
// constructor when many literals are converted implicitly.
inline ACE_WString operator""_w(const wchar_t* text, std::size_t length)
{
    return ACE_WString(text, length);
}
