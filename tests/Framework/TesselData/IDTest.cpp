#include "ID.h"
#include "WideString.h"

#include <gtest/gtest.h>

namespace
{
struct IDCase
{
    const char* text;
    const char* scheme;
    const char* library;
    bool hasQuery;
    const char* query;
    const char* parameter;
    const char* path;
};

void PrintTo(const IDCase& c, std::ostream* out)
{
    *out << '"' << c.text << '"';
}

std::string u8(const ACE_WString& text)
{
    return WideString::toUtf8(text);
}

class IDParse : public ::testing::TestWithParam<IDCase>
{
};

TEST_P(IDParse, SplitsEveryPart)
{
    const IDCase& c = GetParam();
    const ID id(c.text);
    EXPECT_EQ(u8(id.getString()), c.text);
    EXPECT_EQ(u8(id.getScheme()), c.scheme);
    EXPECT_EQ(u8(id.getLibrary()), c.library);
    ACE_WString query(L"stale");
    EXPECT_EQ(id.getQuery(query), c.hasQuery);
    EXPECT_EQ(u8(query), c.query);
    EXPECT_EQ(u8(id.getParameter()), c.parameter);
    EXPECT_EQ(u8(id.getPath()), c.path);
    EXPECT_EQ(id.isNull(), std::string(c.text).empty());
}

INSTANTIATE_TEST_SUITE_P(
    Forms, IDParse,
    ::testing::Values(
        IDCase{"tessel:DM?DataManager", "tessel", "DM", true, "DataManager", "", "DM?DataManager"},
        IDCase{"gui:GuiToolConfiguration?MedToolConfiguration#ToolConfiguaration.ui", "gui", "GuiToolConfiguration",
               true, "MedToolConfiguration", "ToolConfiguaration.ui",
               "GuiToolConfiguration?MedToolConfiguration#ToolConfiguaration.ui"},
        IDCase{"proc:ProcToolConfiguration?ToolConfigControllersFactory", "proc", "ProcToolConfiguration", true,
               "ToolConfigControllersFactory", "", "ProcToolConfiguration?ToolConfigControllersFactory"},
        IDCase{"data:/Auto/SystemMenu/NameEdit", "data", "", false, "", "", "/Auto/SystemMenu/NameEdit"},
        IDCase{"util:FileSystemUtilities", "util", "", false, "", "", "FileSystemUtilities"},
        IDCase{"tessel:BText?", "tessel", "BText", true, "", "", "BText?"},
        IDCase{"", "", "", false, "", "", ""}));

TEST(ID, ComparesByExactText)
{
    EXPECT_TRUE(ID::null.isNull());
    EXPECT_EQ(ID(), ID::null);
    EXPECT_EQ(ID("tessel:DM?DataManager"), ID(L"tessel:DM?DataManager"));
    EXPECT_EQ(ID(ACE_WString(L"data:/Ä")), ID("data:/Ä"));
    EXPECT_NE(ID("tessel:DM?DataManager"), ID("tessel:dm?DataManager"));
    EXPECT_NE(ID("data:/a"), ID("data:/a "));
    EXPECT_TRUE(ID("data:/a") < ID("data:/b"));
    EXPECT_FALSE(ID("data:/b") < ID("data:/a"));
    EXPECT_TRUE(ID(static_cast<const char*>(nullptr)).isNull());
    EXPECT_TRUE(ID(static_cast<const wchar_t*>(nullptr)).isNull());
}
}
