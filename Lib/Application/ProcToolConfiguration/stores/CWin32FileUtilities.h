#pragma once

#include "Export.h"

#include <ace/SString.h>

// Folder operations on wide paths of at most 260 characters per part.
class TESSEL_EXPORT CWin32FileUtilities
{
public:
    // Drive and folder of the path without a trailing separator; empty when there is none
    // or the path cannot be split.
    static ACE_WString getParentFolderName(const wchar_t* path);
    // True when the folder exists afterwards, creating missing ancestors outermost first.
    static bool createFolderTree(const wchar_t* folder);
    // createFolderTree of the folder holding the file.
    static bool createParentFolder(const wchar_t* filePath);
};
