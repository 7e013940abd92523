#include "BSet.h"
#include "EffectiveUser.h"
#include "LogCapture.h"
#include "SettingsFile.h"
#include "SettingsFiles.h"
#include "StringUtilities.h"
#include "TaskFile.h"
#include "TaskRecord.h"
#include "TaskSchedulerSettings.h"
#include "TempDir.h"
#include "TestText.h"
#include "UsersUpdater.h"

#include <gtest/gtest.h>

#include <sys/stat.h>
#include <unistd.h>

#include <climits>
#include <filesystem>
#include <string>
#include <tuple>

namespace
{
const std::string kDeclaration = "<?xml version=\"1.0\" encoding=\"";

std::string document(const std::string& encoding, const std::string& name)
{
    const std::string head = encoding.empty() ? "<?xml version=\"1.0\"?>" : kDeclaration + encoding + "\"?>";
    return head + "<BSet><String key=\"name\">" + name + "</String></BSet>";
}

std::string nameIn(const std::string& path)
{
    BSet set(10);
    if (!set.load(wide(path)))
        return "<not loaded>";
    return SettingsFiles::stringAt(set, "name");
}
}

std::string utf16le(const std::string& ascii)
{
    std::string out = "\xFF\xFE";
    for (const char c : ascii)
    {
        out += c;
        out += '\0';
    }
    return out;
}

// A declared encoding is honoured; an undeclared file with bytes that are not UTF-8 is refused
// with the offset of the first bad byte, and never overwritten.
TEST(EncodingTest, DeclaredEncodingIsHonouredAndBadUtf8Refused)
{
    // The file's bytes, the name read (or "<not loaded>") and part of the warning when refused.
    const std::tuple<const char*, std::string, const char*, const char*> cases[] = {
        {"Utf8Declared", document("UTF-8", "Chlo\xC3\xA9"), "Chloé", ""},
        {"Utf8ByteOrderMark", "\xEF\xBB\xBF" + document("", "Chlo\xC3\xA9"), "Chloé", ""},
        {"Latin1Declared", document("ISO-8859-1", "Chlo\xE9"), "Chloé", ""},
        {"Windows1252Declared", document("windows-1252", "\x80 Chlo\xE9"), "€ Chloé", ""},
        {"Utf16WithByteOrderMark", utf16le(document("UTF-16", "Chloe")), "Chloe", ""},
        {"Latin1Undeclared", document("", "Chlo\xE9"), "<not loaded>", "invalid UTF-8 at byte offset 50"},
        {"BadUtf8Declared", document("UTF-8", "Chlo\xC3"), "<not loaded>", "invalid UTF-8 at byte offset"},
        {"UnknownEncoding", document("KOI8-R", "x"), "<not loaded>", "unsupported encoding 'koi8-r'"}};
    TempDir dir;
    const std::string path = dir.file("FicheDiagParams.xml");
    for (const auto& [name, bytes, expected, logged] : cases)
    {
        SCOPED_TRACE(name);
        TempDir::write(path, bytes);
        LogCapture log;
        EXPECT_EQ(nameIn(path), expected);
        if (std::string(expected) == "<not loaded>")
        {
            EXPECT_TRUE(log.containsSubstring(logged)) << "log has no '" << logged << "'";
            UsersUpdater store(wide(path));
            EXPECT_FALSE(store.load());
            EXPECT_FALSE(store.save());
            EXPECT_EQ(TempDir::read(path), bytes);
        }
    }
}

TEST(SettingsFileTest, BackslashPathsSaveAndLoadTheSameFile)
{
    TempDir dir;
    std::filesystem::create_directories(dir.path() / "sub" / "Data");
    const std::string windowsPath = dir.path().string() + "\\sub\\Data\\InformationsGarage.xml";
    BSet set(10);
    set.setString(L"nom"_w, L"Garage"_w);
    ASSERT_TRUE(set.save(wide(windowsPath), false));
    BSet back(10);
    ASSERT_TRUE(back.load(wide(windowsPath)));
    EXPECT_EQ(SettingsFiles::stringAt(back, "nom"), "Garage");
    EXPECT_TRUE(std::filesystem::exists(dir.path() / "sub" / "Data" / "InformationsGarage.xml"));
    // Not a file named with backslashes beside the folder.
    EXPECT_FALSE(std::filesystem::exists(windowsPath));
}

// One limit for both directions: what is saved always loads again.
TEST(SettingsFileTest, ReadsAndWritesShareOneSizeLimit)
{
    TempDir dir;
    const std::string path = dir.file("InformationsGarage.xml");
    SettingsFiles::writeWorkshop(path, {{"nom", "Garage"}});
    const std::string before = TempDir::read(path);

    BSet large(10);
    large.setString(L"nom"_w, wide(std::string(SettingsFile::kMaxSize, 'x')));
    LogCapture log;
    EXPECT_FALSE(large.save(wide(path), false));
    EXPECT_TRUE(log.containsSubstring("content larger than 4194304 bytes"));
    EXPECT_EQ(TempDir::read(path), before);

    BSet fits(10);
    fits.setString(L"nom"_w, wide(std::string(SettingsFile::kMaxSize - 200, 'y')));
    ASSERT_TRUE(fits.save(wide(path), false));
    BSet back(10);
    EXPECT_TRUE(back.load(wide(path)));

    TempDir::write(path, std::string(SettingsFile::kMaxSize + 1, ' '));
    EXPECT_FALSE(back.load(wide(path)));
}

// Temporaries left by an interrupted save of a file go with its next save; others stay, and a
// temporary is never read in place of the file.
TEST(SettingsFileTest, NextSaveRemovesStaleTemporariesOfThatFileOnly)
{
    TempDir dir;
    const std::string path = dir.file("Preparateur.xml");
    const std::string stale = path + ".tmp-a1B2c3";
    const std::string otherFile = dir.file("Other.xml.tmp-a1B2c3");
    const std::string notOurs = path + ".tmp-short";
    for (const std::string& name : {stale, otherFile, notOurs})
        TempDir::write(name, document("", "stale"));
    BSet set(10);
    EXPECT_FALSE(set.load(wide(path)));

    set.setString(L"name"_w, L"fresh"_w);
    ASSERT_TRUE(set.save(wide(path), false));
    EXPECT_FALSE(std::filesystem::exists(stale));
    EXPECT_TRUE(std::filesystem::exists(otherFile));
    EXPECT_TRUE(std::filesystem::exists(notOurs));
    EXPECT_EQ(nameIn(path), "fresh");
    EXPECT_FALSE(SettingsFile::isTemporaryOf("Preparateur.xml", "Preparateur.xml"));
}

class TaskFileLimitsTest : public ::testing::Test
{
protected:
    void SetUp() override { TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks")); }
    void TearDown() override { TaskSchedulerSettings::setTasksFolder(std::string()); }

    const std::wstring m_name = L"LimitsTask";
    TempDir m_dir;
};

// Task files get the settings files' limits: an oversized one, a FIFO or a device reads as a
// damaged task at once; an oversized regular file may still be deleted, a FIFO may not.
TEST_F(TaskFileLimitsTest, OversizedOrSpecialTaskFilesReadAsDamaged)
{
    const std::string path = TaskFile::pathOf(m_name);
    std::filesystem::create_directories(std::filesystem::path(path).parent_path());
    TaskRecord record;

    TempDir::write(path, std::string(SettingsFile::kMaxSize + 1, ' '));
    EXPECT_EQ(TaskFile::load(m_name, record), SCHED_E_UNKNOWN_OBJECT_VERSION);
    EXPECT_EQ(TaskFile::remove(m_name), S_OK);

    ASSERT_EQ(::symlink("/dev/zero", path.c_str()), 0);
    LogCapture log;
    EXPECT_EQ(TaskFile::load(m_name, record), SCHED_E_UNKNOWN_OBJECT_VERSION);
    EXPECT_TRUE(log.containsSubstring("not a regular file"));
    ASSERT_EQ(::unlink(path.c_str()), 0);

    // A FIFO without a writer is refused at once, by the task reader and the settings reader.
    ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0);
    EXPECT_EQ(TaskFile::load(m_name, record), SCHED_E_UNKNOWN_OBJECT_VERSION);
    EXPECT_NE(TaskFile::remove(m_name), S_OK);
    EXPECT_TRUE(std::filesystem::exists(path));
    BSet set(10);
    log.clear();
    EXPECT_FALSE(set.load(wide(path)));
    EXPECT_TRUE(log.containsSubstring("not a regular file"));
}

// Numbers in text take only the digits 0-9: other scripts' digits, or characters whose low byte
// looks like one, count for nothing.
TEST(NumberTest, OnlyAsciiDigitsCount)
{
    const struct
    {
        const wchar_t* text;
        int value;
    } cases[] = {{L"1", 1},
                 {L"\u0131", 0},
                 {L"\u0661", 0},
                 {L" 12x", 12},
                 {L"-5", -5},
                 {L"+7", 7},
                 {L"", 0},
                 {L"99999999999", INT_MAX},
                 {L"-99999999999", INT_MIN},
                 {L"\u0130"
                  L"1",
                  0}};
    for (const auto& c : cases)
    {
        SCOPED_TRACE(utf8(ACE_WString(c.text)));
        EXPECT_EQ(StringUtilities::toInt(c.text), c.value);
    }

    TempDir dir;
    const std::string path = dir.file("FicheDiagParams.xml");
    SettingsFiles::writeUsers(path, {}, {}, "\u0131");
    UsersUpdater store(wide(path));
    ASSERT_TRUE(store.load());
    EXPECT_FALSE(store.isActivated());
}
