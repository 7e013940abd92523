#pragma once

// Between POSIX errno values and Win32 error codes, for the calls of this layer that sit on
// POSIX calls. Internal to the layer.

#include "Win32Types.h"

#include <cerrno>

namespace Win32ErrnoMap
{
struct Pair
{
    int errnoValue;
    DWORD win32Error;
};

// The first pair of an errno value gives its Win32 code, the first of a code its errno.
inline constexpr Pair kPairs[] = {
    {ENOENT, 2},        // ERROR_FILE_NOT_FOUND
    {ENOENT, 3},        // ERROR_PATH_NOT_FOUND
    {ENOTDIR, 3},       // ERROR_PATH_NOT_FOUND
    {EACCES, 5},        // ERROR_ACCESS_DENIED
    {EPERM, 5},         // ERROR_ACCESS_DENIED
    {EBADF, 6},         // ERROR_INVALID_HANDLE
    {ENOMEM, 8},        // ERROR_NOT_ENOUGH_MEMORY
    {ENOMEM, 14},       // ERROR_OUTOFMEMORY
    {EROFS, 19},        // ERROR_WRITE_PROTECT
    {EIO, 29},          // ERROR_WRITE_FAULT
    {EIO, 30},          // ERROR_READ_FAULT
    {EBUSY, 32},        // ERROR_SHARING_VIOLATION
    {ENOTSUP, 50},      // ERROR_NOT_SUPPORTED
    {EEXIST, 80},       // ERROR_FILE_EXISTS
    {EINVAL, 87},       // ERROR_INVALID_PARAMETER
    {ENOSPC, 112},      // ERROR_DISK_FULL
    {EFBIG, 112},       // ERROR_DISK_FULL
    {ERANGE, 122},      // ERROR_INSUFFICIENT_BUFFER
    {EEXIST, 183},      // ERROR_ALREADY_EXISTS
    {ENAMETOOLONG, 206} // ERROR_FILENAME_EXCED_RANGE
};

// The Win32 code of an errno value; ERROR_GEN_FAILURE (31) when there is none.
inline DWORD win32ErrorFromErrno(int value)
{
    for (const Pair& pair : kPairs)
        if (pair.errnoValue == value)
            return pair.win32Error;
    return 31;
}

// The errno value of a Win32 code, 0 when there is none.
inline int errnoFromWin32Error(DWORD error)
{
    for (const Pair& pair : kPairs)
        if (pair.win32Error == error)
            return pair.errnoValue;
    return 0;
}
}
