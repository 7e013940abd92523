#pragma once

// Our layer for the Windows file and path calls: attributes, folder creation, splitting and
// joining of paths, absolute paths. Paths keep their Windows meaning: "X:" at the start is a
// drive, both "/" and "\" separate folders. Underneath they are POSIX calls, where "\" is
// turned into "/" and a drive such as "C:" is just the start of a relative name.

#include "Win32Types.h"

#include <ace/Global_Macros.h>

#include <cstddef>

typedef int errno_t;

#ifndef MAX_PATH
#define MAX_PATH 260
#endif
#ifndef _MAX_PATH
#define _MAX_PATH 260
#endif
#ifndef _MAX_DRIVE
#define _MAX_DRIVE 3
#endif
#ifndef _MAX_DIR
#define _MAX_DIR 256
#endif
#ifndef _MAX_FNAME
#define _MAX_FNAME 256
#endif
#ifndef _MAX_EXT
#define _MAX_EXT 256
#endif

// ACE stands in a 0 for FILE_ATTRIBUTE_NORMAL off Windows; ours carries the real value.
#undef FILE_ATTRIBUTE_NORMAL
#define INVALID_FILE_ATTRIBUTES ((DWORD)-1)
#define FILE_ATTRIBUTE_READONLY 0x00000001u
#define FILE_ATTRIBUTE_DIRECTORY 0x00000010u
#define FILE_ATTRIBUTE_NORMAL 0x00000080u

#ifndef ERROR_FILE_NOT_FOUND
#define ERROR_FILE_NOT_FOUND 2L
#endif
#ifndef ERROR_PATH_NOT_FOUND
#define ERROR_PATH_NOT_FOUND 3L
#endif
#ifndef ERROR_ACCESS_DENIED
#define ERROR_ACCESS_DENIED 5L
#endif
#ifndef ERROR_INVALID_PARAMETER
#define ERROR_INVALID_PARAMETER 87L
#endif
#ifndef ERROR_FILENAME_EXCED_RANGE
#define ERROR_FILENAME_EXCED_RANGE 206L
#endif
#ifndef ERROR_ALREADY_EXISTS
#define ERROR_ALREADY_EXISTS 183L
#endif

// ACE defines LPSECURITY_ATTRIBUTES as int off Windows, so the calls below name the struct.
struct SECURITY_ATTRIBUTES
{
    DWORD nLength;
    LPVOID lpSecurityDescriptor;
    BOOL bInheritHandle;
};

// FILE_ATTRIBUTE_DIRECTORY for a folder, FILE_ATTRIBUTE_NORMAL (plus READONLY when not
// writable) for anything else; INVALID_FILE_ATTRIBUTES with the last error set on failure.
TESSEL_EXPORT DWORD GetFileAttributesW(LPCWSTR fileName);

// Creates one folder; its parent must exist. FALSE with ERROR_ALREADY_EXISTS when something
// is there already, ERROR_PATH_NOT_FOUND when the parent is missing. Security attributes
// are accepted and ignored.
TESSEL_EXPORT BOOL CreateDirectoryW(LPCWSTR pathName, SECURITY_ATTRIBUTES* securityAttributes);

// Splits a path into drive, folder (with its trailing separator), file name and extension
// (with its dot). Each out buffer may be null with a size of 0. EINVAL for a null path or a
// buffer whose pointer and size disagree, ERANGE when a part does not fit its buffer; on
// failure every given buffer is emptied.
TESSEL_EXPORT errno_t _wsplitpath_s(const wchar_t* path, wchar_t* drive, size_t driveNumberOfElements, wchar_t* dir,
                                    size_t dirNumberOfElements, wchar_t* fname, size_t nameNumberOfElements,
                                    wchar_t* ext, size_t extNumberOfElements);

// Joins drive, folder, file name and extension (each may be null or empty); a separator is
// put after a folder without one, a dot before an extension without one. EINVAL for a null
// buffer or a size of 0, ERANGE (buffer emptied) when the result does not fit.
TESSEL_EXPORT errno_t _wmakepath_s(wchar_t* path, size_t sizeInWords, const wchar_t* drive, const wchar_t* dir,
                                   const wchar_t* fname, const wchar_t* ext);

// The absolute form of `relPath` against the current folder, with "." and ".." resolved by
// text only (the path need not exist). With a null `absPath` the result is allocated with
// malloc and the caller frees it; otherwise it is written into `absPath` of `maxLength`
// characters. Null on failure with errno set (ERANGE: does not fit).
TESSEL_EXPORT wchar_t* _wfullpath(wchar_t* absPath, const wchar_t* relPath, size_t maxLength);
