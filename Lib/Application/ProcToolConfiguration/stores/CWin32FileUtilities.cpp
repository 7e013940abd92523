#include "CWin32FileUtilities.h"

#include "TesselLog_Static.h"
#include "Win32File.h"

namespace
{
const size_t kBufferSize = 260;

bool isExistingFolder(const wchar_t* path)
{
    const DWORD attributes = GetFileAttributesW(path);
    return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
}
}

ACE_WString CWin32FileUtilities::getParentFolderName(const wchar_t* path)
{
    wchar_t drive[kBufferSize];
    wchar_t dir[kBufferSize];
    wchar_t fname[kBufferSize];
    wchar_t ext[kBufferSize];
    const errno_t error =
        _wsplitpath_s(path, drive, kBufferSize, dir, kBufferSize, fname, kBufferSize, ext, kBufferSize);
    if (error != 0)
    {
        TesselLog_Static::logError_static(
            "win32Utilities", "", "", -1,
            L"CWin32FileUtilities::getParentFolderName: _wsplitpath_s failed with error '%i' ", error);
        return ACE_WString();
    }
    wchar_t joined[kBufferSize];
    if (_wmakepath_s(joined, kBufferSize, drive, dir, nullptr, nullptr) != 0)
        return ACE_WString();
    ACE_WString parent(joined);
    const size_t length = parent.length();
    if (length > 0 && (parent[length - 1] == L'\\' || parent[length - 1] == L'/'))
        parent = parent.substring(0, length - 1);
    return parent;
}

bool CWin32FileUtilities::createFolderTree(const wchar_t* folder)
{
    if (isExistingFolder(folder))
        return true;
    const ACE_WString parent = getParentFolderName(folder);
    // A folder that is its own parent (a drive) ends the walk.
    if (parent.length() != 0 && (folder == nullptr || parent != ACE_WString(folder)) &&
        !isExistingFolder(parent.c_str()))
    {
        if (!createFolderTree(parent.c_str()))
            return false;
    }
    if (CreateDirectoryW(folder, nullptr) != FALSE)
        return true;
    // "a/b/" names the folder "a/b" that the walk above may just have made.
    return GetLastError() == ERROR_ALREADY_EXISTS && isExistingFolder(folder);
}

bool CWin32FileUtilities::createParentFolder(const wchar_t* filePath)
{
    return createFolderTree(getParentFolderName(filePath).c_str());
}
