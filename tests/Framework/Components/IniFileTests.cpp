#include "CIniFile.h"

#include "TempDir.h"
#include "WideString.h"

#include <gtest/gtest.h>

namespace
{
ACE_WString wide(const char* text)
{
    return WideString::fromUtf8(text);
}

const char* const kIni = "; network settings\n"
                         "top=before any section\n"
                         "[Network]\n"
                         "Host = server.local\n"
                         "Port=8080\n"
                         "Host=second value ignored\n"
                         "[Names]\n"
                         "Town=Łódź\n"
                         "empty=\n"
                         "[network]\n"
                         "Host=lower-case section\n";

struct IniCase
{
    const char* section;
    const char* key;
    int result;
    const char* value;  // expected value; for a failed read the value must stay "untouched"
};

class IniFileRead : public ::testing::TestWithParam<IniCase>
{
};

TEST_P(IniFileRead, ReadsValuesBySectionAndKey)
{
    TempDir dir;
    const std::string path = dir.file("settings.ini");
    TempDir::write(path, kIni);
    CIniFile ini;
    ASSERT_EQ(ini.openIniFile(CIniFile::eREAD, WideString::fromUtf8(path)), CIniFile::eOK);

    const IniCase& c = GetParam();
    ACE_WString value = wide("untouched");
    EXPECT_EQ(ini.readAttribute(WideString::fromUtf8(c.section), WideString::fromUtf8(c.key), value), c.result);
    EXPECT_EQ(WideString::toUtf8(value), c.value);
}

INSTANTIATE_TEST_SUITE_P(
    Cases, IniFileRead,
    ::testing::Values(IniCase{"Network", "Host", CIniFile::eOK, "server.local"},
                      IniCase{"Network", "Port", CIniFile::eOK, "8080"},
                      IniCase{"Names", "Town", CIniFile::eOK, "Łódź"},
                      IniCase{"Names", "empty", CIniFile::eOK, ""},
                      IniCase{"", "top", CIniFile::eOK, "before any section"},
                      IniCase{"network", "Host", CIniFile::eOK, "lower-case section"},
                      IniCase{"Network", "host", CIniFile::eNO_SUCH_ATTRIBUTE, "untouched"},
                      IniCase{"Network", "Missing", CIniFile::eNO_SUCH_ATTRIBUTE, "untouched"},
                      IniCase{"Nowhere", "Host", CIniFile::eNO_SUCH_ATTRIBUTE, "untouched"}));

TEST(IniFile, MissingFileFailsAndReadsNothing)
{
    TempDir dir;
    CIniFile ini;
    EXPECT_EQ(ini.openIniFile(CIniFile::eREAD, WideString::fromUtf8(dir.file("absent.ini"))),
              CIniFile::eFILE_NOT_OPENED);
    ACE_WString value = wide("untouched");
    EXPECT_EQ(ini.readAttribute(wide("Network"), wide("Host"), value), CIniFile::eFILE_NOT_OPENED);
    EXPECT_EQ(WideString::toUtf8(value), "untouched");
}

TEST(IniFile, UnknownModeIsRefused)
{
    TempDir dir;
    const std::string path = dir.file("settings.ini");
    TempDir::write(path, kIni);
    CIniFile ini;
    EXPECT_EQ(ini.openIniFile(2, WideString::fromUtf8(path)), CIniFile::eBAD_MODE);
    ACE_WString value;
    EXPECT_EQ(ini.readAttribute(wide("Network"), wide("Host"), value), CIniFile::eFILE_NOT_OPENED);
}

TEST(IniFile, MalformedLineIsReportedAndTheRestStaysReadable)
{
    TempDir dir;
    const std::string path = dir.file("broken.ini");
    TempDir::write(path, "[A]\nkey=1\nthis line has no equals sign\n[B]\nother=2\n");
    CIniFile ini;
    EXPECT_EQ(ini.openIniFile(CIniFile::eREAD, WideString::fromUtf8(path)), CIniFile::ePARSE_ERROR);
    ACE_WString value;
    EXPECT_EQ(ini.readAttribute(wide("A"), wide("key"), value), CIniFile::eOK);
    EXPECT_EQ(WideString::toUtf8(value), "1");
    EXPECT_EQ(ini.readAttribute(wide("B"), wide("other"), value), CIniFile::eOK);
    EXPECT_EQ(WideString::toUtf8(value), "2");
}

TEST(IniFile, ReopeningForgetsTheEarlierFile)
{
    TempDir dir;
    const std::string first = dir.file("first.ini");
    const std::string second = dir.file("second.ini");
    TempDir::write(first, "[S]\nonly_in_first=1\n");
    TempDir::write(second, "[S]\nonly_in_second=2\n");
    CIniFile ini;
    ASSERT_EQ(ini.openIniFile(CIniFile::eREAD, WideString::fromUtf8(first)), CIniFile::eOK);
    ASSERT_EQ(ini.openIniFile(CIniFile::eREAD, WideString::fromUtf8(second)), CIniFile::eOK);
    ACE_WString value;
    EXPECT_EQ(ini.readAttribute(wide("S"), wide("only_in_first"), value), CIniFile::eNO_SUCH_ATTRIBUTE);
    EXPECT_EQ(ini.readAttribute(wide("S"), wide("only_in_second"), value), CIniFile::eOK);
    // A failed reopen leaves nothing readable either.
    ASSERT_EQ(ini.openIniFile(CIniFile::eREAD, WideString::fromUtf8(dir.file("gone.ini"))),
              CIniFile::eFILE_NOT_OPENED);
    EXPECT_EQ(ini.readAttribute(wide("S"), wide("only_in_second"), value), CIniFile::eFILE_NOT_OPENED);
}
}
