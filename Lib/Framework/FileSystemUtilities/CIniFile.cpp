#include "CIniFile.h"

#include "TesselLog_Static.h"
#include "WideString.h"

#include <ini.h>

#include <string>

namespace
{
const char* const kComponent = "FileSystemUtilities";
const char* const kFile = "FileSystemUtilities.dll";
const char* const kClass = "CIniFile";

using ValueMap = std::map<std::pair<ACE_WString, ACE_WString>, ACE_WString>;

// The first occurrence of a key in a section is the one read, later ones are ignored.
int storeValue(void* user, const char* section, const char* name, const char* value)
{
    auto* values = static_cast<ValueMap*>(user);
    values->emplace(std::make_pair(WideString::fromUtf8(section), WideString::fromUtf8(name)),
                    WideString::fromUtf8(value));
    return 1;
}
}

CIniFile::CIniFile() : m_opened(false)
{
}

CIniFile::~CIniFile() = default;

EERRORCODE CIniFile::openIniFile(int mode, const ACE_WString& path)
{
    m_opened = false;
    m_values.clear();
    if (mode != eREAD)
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, eBAD_MODE,
                                          L"CIniFile::openIniFile: unsupported open mode %d for %s", mode,
                                          path.c_str());
        return eBAD_MODE;
    }
    ValueMap values;
    const std::string narrowPath = WideString::toUtf8(path);
    const int result = ini_parse(narrowPath.c_str(), &storeValue, &values);
    if (result < 0)
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, eFILE_NOT_OPENED,
                                          "CIniFile::openIniFile: cannot open %s", narrowPath.c_str());
        return eFILE_NOT_OPENED;
    }
    m_values.swap(values);
    m_opened = true;
    if (result > 0)
    {
        // The lines that could be read stay readable; the caller decides what a partial file is worth.
        TesselLog_Static::logError_static(kComponent, kFile, kClass, ePARSE_ERROR,
                                          "CIniFile::openIniFile: %s: malformed line %d", narrowPath.c_str(), result);
        return ePARSE_ERROR;
    }
    return eOK;
}

EERRORCODE CIniFile::readAttribute(const ACE_WString& section, const ACE_WString& key, ACE_WString& value) const
{
    if (!m_opened)
        return eFILE_NOT_OPENED;
    const auto found = m_values.find(std::make_pair(section, key));
    if (found == m_values.end())
        return eNO_SUCH_ATTRIBUTE;
    value = found->second;
    return eOK;
}
