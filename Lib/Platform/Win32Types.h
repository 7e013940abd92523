#pragma once

// Base types and the per-thread last error of our Windows layer.

#include <cstdint>

#include "Export.h"

typedef uint8_t BYTE;
typedef uint16_t WORD;
typedef uint32_t DWORD;
typedef int BOOL;
typedef unsigned int UINT;
typedef int32_t LONG;
typedef uint32_t ULONG;
typedef int32_t HRESULT;
typedef wchar_t WCHAR;
typedef wchar_t* LPWSTR;
typedef const wchar_t* LPCWSTR;
typedef char* LPSTR;
typedef const char* LPCSTR;
typedef void* LPVOID;

#ifndef TRUE
#define TRUE 1
#endif
#ifndef FALSE
#define FALSE 0
#endif

#ifndef ERROR_SUCCESS
#define ERROR_SUCCESS 0L
#endif

// The error code of the last failed call on the calling thread.
TESSEL_EXPORT DWORD GetLastError();
TESSEL_EXPORT void SetLastError(DWORD errorCode);
