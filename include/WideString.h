#pragma once

#include "Export.h"

#include <ace/SString.h>

#include <string>

// Exact conversions between the framework's wide strings and UTF-8.
namespace WideString
{
TESSEL_EXPORT std::string toUtf8(const ACE_WString& text);
TESSEL_EXPORT std::string toUtf8(const wchar_t* text);
TESSEL_EXPORT ACE_WString fromUtf8(const std::string& text);
TESSEL_EXPORT ACE_WString fromUtf8(const char* text);
TESSEL_EXPORT std::wstring toStd(const ACE_WString& text);
TESSEL_EXPORT ACE_WString fromStd(const std::wstring& text);
}
