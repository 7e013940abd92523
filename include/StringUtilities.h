#pragma once

#include "Export.h"

#include <ace/SString.h>

#include <cstdarg>

// Printf-style formatting with the platform's conventions (see TesselLog_Static.h):
// in a wide format "%s" takes a wide string and "%S" a narrow one; in a narrow format the reverse.
class TESSEL_EXPORT StringUtilities
{
public:
    static ACE_WString wideSprintf(const wchar_t* format, ...);
    static ACE_WString wideVsprintf(const wchar_t* format, va_list args);
    // A narrow format, formatted to a wide string.
    static ACE_WString narrowVsprintf(const char* format, va_list args);
    // `prefix` followed by `number` in decimal, as "%s%u" gives it, without the formatter.
    static ACE_WString withNumber(const wchar_t* prefix, unsigned int number);

    // The integer at the start of `text`, as atoi reads it (leading blanks, a sign, then digits),
    // but taking only the digits 0-9; 0 when there is none, clamped to the range of int.
    static int toInt(const wchar_t* text);
};
