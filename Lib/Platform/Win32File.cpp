#include "Win32File.h"

#include "WideString.h"

#include <cerrno>
#include <cstdlib>
#include <cwchar>
#include <filesystem>
#include <string>

#include <sys/stat.h>
#include <sys/types.h>
#include <unistd.h>

namespace
{
bool isSeparator(wchar_t c)
{
    return c == L'/' || c == L'\\';
}

// The POSIX form of a Windows path: "\" becomes "/", the text is UTF-8.
std::string toPosixPath(const wchar_t* path)
{
    std::wstring text(path);
    for (wchar_t& c : text)
        if (c == L'\\')
            c = L'/';
    return WideString::toUtf8(text.c_str());
}

DWORD errorFromErrno(int error, DWORD fallback)
{
    switch (error)
    {
    case ENOENT:
        return fallback;
    case ENOTDIR:
        return ERROR_PATH_NOT_FOUND;
    case EEXIST:
        return ERROR_ALREADY_EXISTS;
    case EACCES:
    case EPERM:
    case EROFS:
        return ERROR_ACCESS_DENIED;
    case ENAMETOOLONG:
        return ERROR_FILENAME_EXCED_RANGE;
    default:
        return ERROR_PATH_NOT_FOUND;
    }
}

void clearBuffer(wchar_t* buffer, size_t size)
{
    if (buffer != nullptr && size > 0)
        buffer[0] = L'\0';
}

// Copies [begin, end) into buffer; false when it does not fit with its terminator.
bool copyPart(const wchar_t* begin, const wchar_t* end, wchar_t* buffer, size_t size)
{
    if (buffer == nullptr)
        return true;
    const size_t length = static_cast<size_t>(end - begin);
    if (length >= size)
        return false;
    std::wmemcpy(buffer, begin, length);
    buffer[length] = L'\0';
    return true;
}

// Appends text to path at position, within size; false when it does not fit.
bool append(wchar_t* path, size_t size, size_t& position, const wchar_t* text, size_t length)
{
    if (position + length >= size)
        return false;
    std::wmemcpy(path + position, text, length);
    position += length;
    path[position] = L'\0';
    return true;
}
}

DWORD GetFileAttributesW(LPCWSTR fileName)
{
    if (fileName == nullptr)
    {
        SetLastError(ERROR_INVALID_PARAMETER);
        return INVALID_FILE_ATTRIBUTES;
    }
    if (fileName[0] == L'\0')
    {
        SetLastError(ERROR_PATH_NOT_FOUND);
        return INVALID_FILE_ATTRIBUTES;
    }
    const std::string path = toPosixPath(fileName);
    struct stat info;
    if (::stat(path.c_str(), &info) != 0)
    {
        SetLastError(errorFromErrno(errno, ERROR_FILE_NOT_FOUND));
        return INVALID_FILE_ATTRIBUTES;
    }
    if (S_ISDIR(info.st_mode))
        return FILE_ATTRIBUTE_DIRECTORY;
    DWORD attributes = FILE_ATTRIBUTE_NORMAL;
    if (::access(path.c_str(), W_OK) != 0)
        attributes |= FILE_ATTRIBUTE_READONLY;
    return attributes;
}

BOOL CreateDirectoryW(LPCWSTR pathName, SECURITY_ATTRIBUTES* /*securityAttributes*/)
{
    if (pathName == nullptr)
    {
        SetLastError(ERROR_INVALID_PARAMETER);
        return FALSE;
    }
    if (pathName[0] == L'\0')
    {
        SetLastError(ERROR_PATH_NOT_FOUND);
        return FALSE;
    }
    const std::string path = toPosixPath(pathName);
    if (::mkdir(path.c_str(), 0777) != 0)
    {
        SetLastError(errorFromErrno(errno, ERROR_PATH_NOT_FOUND));
        return FALSE;
    }
    return TRUE;
}

errno_t _wsplitpath_s(const wchar_t* path, wchar_t* drive, size_t driveNumberOfElements, wchar_t* dir,
                      size_t dirNumberOfElements, wchar_t* fname, size_t nameNumberOfElements, wchar_t* ext,
                      size_t extNumberOfElements)
{
    auto clearAll = [&]() {
        clearBuffer(drive, driveNumberOfElements);
        clearBuffer(dir, dirNumberOfElements);
        clearBuffer(fname, nameNumberOfElements);
        clearBuffer(ext, extNumberOfElements);
    };
    const bool buffersValid =
        (drive == nullptr) == (driveNumberOfElements == 0) && (dir == nullptr) == (dirNumberOfElements == 0) &&
        (fname == nullptr) == (nameNumberOfElements == 0) && (ext == nullptr) == (extNumberOfElements == 0);
    if (path == nullptr || !buffersValid)
    {
        clearAll();
        errno = EINVAL;
        return EINVAL;
    }

    const wchar_t* rest = path;
    const wchar_t* driveEnd = path;
    if (path[0] != L'\0' && path[1] == L':')
        driveEnd = rest = path + 2;

    const wchar_t* afterLastSeparator = nullptr;
    const wchar_t* lastDot = nullptr;
    const wchar_t* end = rest;
    for (; *end != L'\0'; ++end)
    {
        if (isSeparator(*end))
            afterLastSeparator = end + 1;
        else if (*end == L'.')
            lastDot = end;
    }
    const wchar_t* nameBegin = afterLastSeparator != nullptr ? afterLastSeparator : rest;
    const wchar_t* nameEnd = (lastDot != nullptr && lastDot >= nameBegin) ? lastDot : end;

    if (!copyPart(path, driveEnd, drive, driveNumberOfElements) ||
        !copyPart(rest, nameBegin, dir, dirNumberOfElements) ||
        !copyPart(nameBegin, nameEnd, fname, nameNumberOfElements) || !copyPart(nameEnd, end, ext, extNumberOfElements))
    {
        clearAll();
        errno = ERANGE;
        return ERANGE;
    }
    return 0;
}

errno_t _wmakepath_s(wchar_t* path, size_t sizeInWords, const wchar_t* drive, const wchar_t* dir, const wchar_t* fname,
                     const wchar_t* ext)
{
    if (path == nullptr || sizeInWords == 0)
    {
        errno = EINVAL;
        return EINVAL;
    }
    path[0] = L'\0';
    size_t position = 0;
    bool fits = true;
    if (drive != nullptr && drive[0] != L'\0')
    {
        const wchar_t letter[2] = {drive[0], L':'};
        fits = append(path, sizeInWords, position, letter, 2);
    }
    if (fits && dir != nullptr && dir[0] != L'\0')
    {
        const size_t length = std::wcslen(dir);
        fits = append(path, sizeInWords, position, dir, length);
        if (fits && !isSeparator(dir[length - 1]))
            fits = append(path, sizeInWords, position, L"\\", 1);
    }
    if (fits && fname != nullptr && fname[0] != L'\0')
        fits = append(path, sizeInWords, position, fname, std::wcslen(fname));
    if (fits && ext != nullptr && ext[0] != L'\0')
    {
        if (ext[0] != L'.')
            fits = append(path, sizeInWords, position, L".", 1);
        if (fits)
            fits = append(path, sizeInWords, position, ext, std::wcslen(ext));
    }
    if (!fits)
    {
        path[0] = L'\0';
        errno = ERANGE;
        return ERANGE;
    }
    return 0;
}

wchar_t* _wfullpath(wchar_t* absPath, const wchar_t* relPath, size_t maxLength)
{
    if (absPath != nullptr && maxLength == 0)
    {
        errno = EINVAL;
        return nullptr;
    }
    std::error_code error;
    const std::filesystem::path current = std::filesystem::current_path(error);
    if (error)
    {
        errno = error.value();
        return nullptr;
    }

    std::filesystem::path full = current;
    bool trailingSeparator = false;
    if (relPath != nullptr && relPath[0] != L'\0')
    {
        const std::filesystem::path relative(toPosixPath(relPath));
        full = relative.is_absolute() ? relative : current / relative;
        trailingSeparator = isSeparator(relPath[std::wcslen(relPath) - 1]);
    }
    std::string text = full.lexically_normal().string();
    if (!trailingSeparator && text.size() > 1 && text.back() == '/')
        text.pop_back();

    const ACE_WString wide = WideString::fromUtf8(text);
    const size_t length = wide.length();
    if (absPath == nullptr)
    {
        absPath = static_cast<wchar_t*>(std::malloc((length + 1) * sizeof(wchar_t)));
        if (absPath == nullptr)
        {
            errno = ENOMEM;
            return nullptr;
        }
    }
    else if (length + 1 > maxLength)
    {
        absPath[0] = L'\0';
        errno = ERANGE;
        return nullptr;
    }
    std::wmemcpy(absPath, wide.c_str(), length);
    absPath[length] = L'\0';
    return absPath;
}
