// CIniFile::openIniFile on the input written as a file. Besides never crashing: the file opens,
// and every key of the plain lines at its start ("[section]", "key=value", empty lines) reads
// back with the value of its first occurrence.

#include "CIniFile.h"
#include "FuzzSupport.h"
#include "WideString.h"

#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <utility>

namespace
{
bool isWord(const std::string& text, std::size_t minimum)
{
    if (text.size() < minimum || text.size() > 20)
        return false;
    for (const char c : text)
        if (!((c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_'))
            return false;
    return true;
}

using Values = std::map<std::pair<std::string, std::string>, std::string>;

// The values of the plain lines at the start of `text`; `whole` tells whether every line was plain.
Values plainValues(const std::string& text, bool& whole)
{
    Values values;
    std::string section;
    std::size_t start = 0;
    whole = true;
    while (start < text.size())
    {
        std::size_t end = text.find('\n', start);
        if (end == std::string::npos)
            end = text.size();
        const std::string line = text.substr(start, end - start);
        start = end + 1;
        const std::size_t equals = line.find('=');
        if (line.empty())
            continue;
        if (line.front() == '[' && line.back() == ']' && isWord(line.substr(1, line.size() - 2), 1))
            section = line.substr(1, line.size() - 2);
        else if (equals != std::string::npos && isWord(line.substr(0, equals), 1) && isWord(line.substr(equals + 1), 0))
            values.emplace(std::make_pair(section, line.substr(0, equals)), line.substr(equals + 1));
        else
        {
            whole = false;
            break;
        }
    }
    return values;
}
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    static const FuzzFolder folder;
    static const std::string path = folder.file("settings.ini");
    writeInput(path, data, size);
    const std::string text(reinterpret_cast<const char*>(data), size);
    CIniFile ini;
    const EERRORCODE result = ini.openIniFile(CIniFile::eREAD, WideString::fromUtf8(path));
    FUZZ_CHECK(result == CIniFile::eOK || result == CIniFile::ePARSE_ERROR);
    bool whole = false;
    for (const auto& [key, value] : plainValues(text, whole))
    {
        ACE_WString read;
        FUZZ_CHECK(ini.readAttribute(WideString::fromUtf8(key.first), WideString::fromUtf8(key.second), read) ==
                   CIniFile::eOK);
        FUZZ_CHECK(WideString::toUtf8(read) == value);
    }
    if (whole)
        FUZZ_CHECK(result == CIniFile::eOK);
    ACE_WString untouched(L"untouched");
    FUZZ_CHECK(ini.readAttribute(L"\x01", L"\x01", untouched) == CIniFile::eNO_SUCH_ATTRIBUTE);
    FUZZ_CHECK(untouched == ACE_WString(L"untouched"));
    return 0;
}
