#pragma once

#include "Export.h"

#include <ace/SString.h>

#include <map>
#include <utility>

typedef int EERRORCODE;

// Read access to an ini file (UTF-8; sections and keys exactly as written in the file; the first
// of repeated keys is the one read; keys before any section are in the section "").
// openIniFile gives ePARSE_ERROR for a file with malformed lines; the well-formed ones can still be read.
class TESSEL_EXPORT CIniFile
{
public:
    enum
    {
        eOK = 0,
        eFILE_NOT_OPENED = 1,
        eNO_SUCH_ATTRIBUTE = 2,
        eBAD_MODE = 3,
        ePARSE_ERROR = 4
    };
    enum OpenMode
    {
        eREAD = 1
    };

    CIniFile();
    virtual ~CIniFile();

    EERRORCODE openIniFile(int mode, const ACE_WString& path);
    // Value untouched unless 0 is returned.
    EERRORCODE readAttribute(const ACE_WString& section, const ACE_WString& key, ACE_WString& value) const;

private:
    bool m_opened;
    std::map<std::pair<ACE_WString, ACE_WString>, ACE_WString> m_values;
};
