#pragma once

// User and clock calls of our Windows layer.

#include "Win32Types.h"

#ifndef UNLEN
#define UNLEN 256
#endif
#ifndef ERROR_INSUFFICIENT_BUFFER
#define ERROR_INSUFFICIENT_BUFFER 122L
#endif
#ifndef ERROR_NONE_MAPPED
#define ERROR_NONE_MAPPED 1332L
#endif
#ifndef ERROR_INVALID_PARAMETER
#define ERROR_INVALID_PARAMETER 87L
#endif

struct SYSTEMTIME
{
    WORD wYear;
    WORD wMonth;
    WORD wDayOfWeek;
    WORD wDay;
    WORD wHour;
    WORD wMinute;
    WORD wSecond;
    WORD wMilliseconds;
};
typedef SYSTEMTIME* LPSYSTEMTIME;

// The login name of the effective user. `pcbBuffer` holds the buffer's size in characters and
// receives the characters written with the terminating null; FALSE with
// ERROR_INSUFFICIENT_BUFFER (and the size needed) when the name does not fit.
TESSEL_EXPORT BOOL GetUserNameW(LPWSTR lpBuffer, DWORD* pcbBuffer);

// The current local date and time.
TESSEL_EXPORT void GetLocalTime(LPSYSTEMTIME lpSystemTime);

// The leading decimal number of a wide string (optional blanks and sign first), 0 when there
// is none; out-of-range values are clamped to the int range.
TESSEL_EXPORT int _wtoi(const wchar_t* str);
