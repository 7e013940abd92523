#include "BInt.h"
#include "BSet.h"
#include "BString.h"
#include "LogCapture.h"
#include "TempDir.h"
#include "WideString.h"

#include <gtest/gtest.h>

#include <cmath>
#include <csignal>
#include <filesystem>
#include <limits>
#include <string>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace
{
ACE_WString wide(const std::string& path)
{
    return WideString::fromUtf8(path);
}

BSet sampleSet()
{
    BSet user;
    user.setString(L"name", L"Łukasz Żółć");
    user.setString(L"phone", L"王小明 😀");
    user.setString(L"address", L"");
    BSet users;
    users.setSet(L"User#0", user);
    users.setSet(L"empty", BSet());

    BSet set;
    set.setString(L"spaces", L"  lead and trail  ");
    set.setString(L"blank", L" \t ");
    set.setString(L"lines", L"one\ntwo\r\nthree\r");
    set.setString(L"markup", L"<a href=\"x\">&amp; 'q'</a> ]]> \x01\x1f\x7f");
    set.setString(L"k\u00e9y <&> \"q\" \t\n", L"odd key");
    set.setInt(L"min", std::numeric_limits<long>::min());
    set.setInt(L"max", std::numeric_limits<long>::max());
    set.setInt(L"negative", -42);
    set.setBool(L"yes", true);
    set.setBool(L"no", false);
    set.setDouble(L"tenth", 0.1);
    set.setDouble(L"tiny", 1e-300);
    set.setDouble(L"denormal", std::numeric_limits<double>::denorm_min());
    set.setDouble(L"third", 1.0 / 3.0);
    set.setDouble(L"huge", std::numeric_limits<double>::max());
    set.setDouble(L"minusZero", -0.0);
    set.setDouble(L"infinite", -std::numeric_limits<double>::infinity());
    set.setSet(L"Users", users);
    return set;
}

TEST(XmlFile, RoundTripKeepsOrderTypesAndEveryValue)
{
    TempDir dir;
    const std::string path = dir.file("settings.xml");
    const BSet original = sampleSet();
    ASSERT_TRUE(original.save(wide(path), false));

    BSet loaded;
    loaded.setInt(L"stale", 1); // a load replaces the whole content
    ASSERT_TRUE(loaded.load(wide(path)));
    EXPECT_TRUE(loaded.equals(original));
    double zero = 1.0;
    ASSERT_EQ(loaded.getDouble(L"minusZero", zero), BSet::eOK);
    EXPECT_TRUE(std::signbit(zero));

    // Saving what was loaded writes the same bytes.
    const std::string again = dir.file("again.xml");
    ASSERT_TRUE(loaded.save(wide(again), true));
    EXPECT_EQ(TempDir::read(path), TempDir::read(again));
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(dir.path()), {}), 2);
}

TEST(XmlFile, ReadsHandWrittenFiles)
{
    TempDir dir;
    const std::string path = dir.file("hand.xml");
    TempDir::write(path, "\xEF\xBB\xBF<?xml version=\"1.0\" encoding=\"UTF-8\"?>\r\n"
                         "<!-- edited by hand -->\r\n<BSet>\r\n"
                         "  <Int key=\"port\"> 8080 </Int>\r\n"
                         "  <Bool key=\"on\">\ttrue\n</Bool>\r\n"
                         "  <Set key=\"inner\">\n    <String key=\"s\"><![CDATA[a<b]]> &#x1F600;</String>\n  </Set>\n"
                         "  <String key=\"empty\"/>\n"
                         "</BSet>\n");
    BSet set;
    ASSERT_TRUE(set.load(wide(path)));
    long port = 0;
    bool on = false;
    BSet inner;
    ACE_WString s;
    EXPECT_EQ(set.getInt(L"port", port), BSet::eOK);
    EXPECT_EQ(port, 8080);
    EXPECT_EQ(set.getBool(L"on", on), BSet::eOK);
    EXPECT_TRUE(on);
    ASSERT_EQ(set.getSet(L"inner", inner), BSet::eOK);
    EXPECT_EQ(inner.getString(L"s", s), BSet::eOK);
    EXPECT_EQ(std::wstring(s.c_str()), L"a<b \U0001F600");
    EXPECT_EQ(set.getString(L"empty", s), BSet::eOK);
    EXPECT_EQ(s.length(), 0u);
    EXPECT_EQ(set.size(), 4);
}

std::string nested(int levels)
{
    std::string text = "<BSet>";
    for (int i = 0; i < levels; ++i)
        text += "<Set key=\"k\">";
    for (int i = 0; i < levels; ++i)
        text += "</Set>";
    return text + "</BSet>";
}

struct BadFile
{
    const char* name;
    std::string content;
};

void PrintTo(const BadFile& file, std::ostream* out)
{
    *out << file.name;
}

class XmlBadFile : public ::testing::TestWithParam<BadFile>
{
};

TEST_P(XmlBadFile, IsRefusedAndLeavesTheSetUnchanged)
{
    TempDir dir;
    const std::string path = dir.file("bad.xml");
    TempDir::write(path, GetParam().content);
    BSet set = sampleSet();
    LogCapture log;
    EXPECT_FALSE(set.load(wide(path)));
    EXPECT_TRUE(set.equals(sampleSet()));
    EXPECT_TRUE(log.containsSubstring("BData::load", TesselLog_Static::eWARNING));
}

const std::string kValid = "<?xml version=\"1.0\"?><BSet><String key=\"a\">text</String><Int key=\"n\">3</Int></BSet>";

INSTANTIATE_TEST_SUITE_P(
    Files, XmlBadFile,
    ::testing::Values(
        BadFile{"Empty", ""}, BadFile{"NotXml", "just text"}, BadFile{"Truncated", kValid.substr(0, 60)},
        BadFile{"WrongRoot", "<Set><Int key=\"n\">1</Int></Set>"},
        BadFile{"TwoRoots", "<BSet/><BSet/>"},
        BadFile{"UnknownType", "<BSet><Float key=\"f\">1</Float></BSet>"},
        BadFile{"IntWithLetters", "<BSet><Int key=\"n\">12abc</Int></BSet>"},
        BadFile{"EmptyInt", "<BSet><Int key=\"n\"/></BSet>"},
        BadFile{"IntOverflow", "<BSet><Int key=\"n\">99999999999999999999</Int></BSet>"},
        BadFile{"BadBool", "<BSet><Bool key=\"b\">yes</Bool></BSet>"},
        BadFile{"BadDouble", "<BSet><Double key=\"d\">1.5x</Double></BSet>"},
        BadFile{"MissingKey", "<BSet><String>x</String></BSet>"},
        BadFile{"DuplicateKey", "<BSet><Int key=\"n\">1</Int><Int key=\"n\">2</Int></BSet>"},
        BadFile{"ElementInValue", "<BSet><String key=\"s\">a<b/></String></BSet>"},
        BadFile{"TextBetweenEntries", "<BSet>junk<Int key=\"n\">1</Int></BSet>"},
        BadFile{"InternalEntity",
                "<!DOCTYPE BSet [<!ENTITY x \"boom\">]><BSet><String key=\"s\">&x;</String></BSet>"},
        BadFile{"ExternalEntity", "<?xml version=\"1.0\"?><!DOCTYPE BSet SYSTEM \"file:///etc/passwd\"><BSet/>"},
        BadFile{"TooDeep", nested(64)}, BadFile{"TenThousandLevels", nested(10000)},
        BadFile{"Oversize", "<BSet>" + std::string(16 * 1024 * 1024, ' ') + "</BSet>"}),
    [](const ::testing::TestParamInfo<BadFile>& info) { return std::string(info.param.name); });

TEST(XmlFile, AcceptsTheDeepestAllowedNesting)
{
    TempDir dir;
    const std::string path = dir.file("deep.xml");
    TempDir::write(path, nested(63));
    BSet set;
    EXPECT_TRUE(set.load(wide(path)));
    EXPECT_TRUE(set.save(wide(dir.file("copy.xml")), false));
}

TEST(XmlFile, MissingFileOrFolderOrWrongKindIsRefused)
{
    TempDir dir;
    BSet set = sampleSet();
    EXPECT_FALSE(set.load(wide(dir.file("missing.xml"))));
    EXPECT_FALSE(set.load(wide(dir.path().string())));
    EXPECT_FALSE(set.load(ACE_WString()));
    EXPECT_TRUE(set.equals(sampleSet()));

    // Only sets are files.
    const std::string path = dir.file("int.xml");
    BInt number(3);
    EXPECT_FALSE(number.save(wide(path), false));
    EXPECT_FALSE(std::filesystem::exists(path));
    ASSERT_TRUE(set.save(wide(path), false));
    EXPECT_FALSE(number.load(wide(path)));
    EXPECT_EQ(number.value(), 3);

    // Too deep to be read back: not written.
    BSet deep;
    for (int i = 0; i < 64; ++i)
    {
        BSet outer;
        outer.setSet(L"k", deep);
        deep = outer;
    }
    EXPECT_FALSE(deep.save(wide(path), false));
    BSet reread;
    EXPECT_TRUE(reread.load(wide(path)));
    EXPECT_TRUE(reread.equals(sampleSet()));
}

// Names in `folder` other than `keep`.
std::vector<std::string> strayFiles(const std::filesystem::path& folder, const std::string& keep)
{
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(folder))
        if (entry.path().filename() != keep)
            names.push_back(entry.path().filename().string());
    return names;
}

TEST(XmlFile, FailedSaveKeepsTheOldFileAndLeavesNoTemporary)
{
    TempDir dir;
    BSet set = sampleSet();
    LogCapture log;
    EXPECT_FALSE(set.save(wide(dir.file("no/such/folder/a.xml")), false));
    EXPECT_TRUE(log.containsSubstring("BData::save", TesselLog_Static::eWARNING));
    EXPECT_TRUE(strayFiles(dir.path(), "").empty());

    // A folder standing at the target path cannot be replaced.
    std::filesystem::create_directory(dir.file("target.xml"));
    EXPECT_FALSE(set.save(wide(dir.file("target.xml")), false));
    EXPECT_TRUE(std::filesystem::is_directory(dir.file("target.xml")));
    EXPECT_TRUE(strayFiles(dir.path(), "target.xml").empty());
}

TEST(XmlFile, WriteFailureMidwayKeepsTheOldFile)
{
    TempDir dir;
    const std::string path = dir.file("settings.xml");
    BSet small;
    small.setString(L"old", L"content");
    ASSERT_TRUE(small.save(wide(path), false));
    const std::string before = TempDir::read(path);

    BSet big;
    big.setString(L"value", WideString::fromStd(std::wstring(20000, L'x')));
    const pid_t child = fork();
    ASSERT_NE(child, -1);
    if (child == 0)
    {
        // Writes past 4 KiB fail with EFBIG instead of killing the child.
        std::signal(SIGXFSZ, SIG_IGN);
        rlimit limit{4096, 4096};
        setrlimit(RLIMIT_FSIZE, &limit);
        _exit(big.save(wide(path), false) ? 1 : 0);
    }
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    ASSERT_TRUE(WIFEXITED(status));
    EXPECT_EQ(WEXITSTATUS(status), 0) << "save reported success past the file-size limit";
    EXPECT_EQ(TempDir::read(path), before);
    EXPECT_TRUE(strayFiles(dir.path(), "settings.xml").empty());

    ASSERT_TRUE(big.save(wide(path), false)); // without the limit the same save works
    BSet loaded;
    ASSERT_TRUE(loaded.load(wide(path)));
    EXPECT_TRUE(loaded.equals(big));
}
}
