#include "CWin32FileUtilities.h"

#include "StoreTestSupport.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <string>

#include <unistd.h>

using namespace StoreTest;

namespace
{
struct ParentCase
{
    const wchar_t* path;
    const wchar_t* parent;
};

void PrintTo(const ParentCase& c, std::ostream* os)
{
    *os << '"' << u(ACE_WString(c.path)) << '"';
}

class ParentFolderName : public ::testing::TestWithParam<ParentCase>
{
};

TEST_P(ParentFolderName, IsDriveAndFolderWithoutTrailingSeparator)
{
    const ParentCase& c = GetParam();
    EXPECT_EQ(CWin32FileUtilities::getParentFolderName(c.path), ACE_WString(c.parent));
}

INSTANTIATE_TEST_SUITE_P(Paths, ParentFolderName,
                         ::testing::Values(ParentCase{L"../../Data/User/InformationsGarage.xml", L"../../Data/User"},
                                           ParentCase{L"C:/Data/", L"C:/Data"}, ParentCase{L"C:/Data", L"C:"},
                                           ParentCase{L"C:\\Data\\", L"C:\\Data"},
                                           ParentCase{L"C:\\Data\\Sub\\file.xml", L"C:\\Data\\Sub"},
                                           ParentCase{L"C:", L"C:"}, ParentCase{L"InformationsGarage.xml", L""},
                                           ParentCase{L"/", L""}, ParentCase{L"/tmp", L""},
                                           ParentCase{L"/tmp/x", L"/tmp"}, ParentCase{L"", L""}));

TEST(ParentFolderNameErrors, UnsplittablePathIsLoggedAndGivesEmpty)
{
    LogCapture log;
    const std::wstring longName = L"dir/" + std::wstring(300, L'n') + L".xml";
    EXPECT_EQ(CWin32FileUtilities::getParentFolderName(longName.c_str()), ACE_WString(L""));
    const auto records = log.records();
    ASSERT_EQ(records.size(), 1u);
    EXPECT_EQ(records[0].level, TesselLog_Static::eERROR);
    EXPECT_EQ(records[0].code, -1);
    EXPECT_EQ(records[0].component, "win32Utilities");
    EXPECT_EQ(records[0].className, "");
    EXPECT_EQ(u(records[0].message), "CWin32FileUtilities::getParentFolderName: _wsplitpath_s failed with error '" +
                                         std::to_string(ERANGE) + "' ");

    log.clear();
    EXPECT_EQ(CWin32FileUtilities::getParentFolderName(nullptr), ACE_WString(L""));
    EXPECT_TRUE(log.containsSubstring("failed with error '" + std::to_string(EINVAL) + "' "));
}

TEST(ParentFolderNameErrors, JoinedResultTooLongGivesEmpty)
{
    // The folder part alone fits 260 characters, with the drive in front it does not.
    const std::wstring path = L"C:/" + std::wstring(257, L'd') + L"/file";
    LogCapture log;
    EXPECT_EQ(CWin32FileUtilities::getParentFolderName(path.c_str()), ACE_WString(L""));
    EXPECT_TRUE(log.records().empty());
}

// Runs a test inside its temporary folder, so relative names such as "Q:" land there.
class FolderTreeTest : public ::testing::Test
{
protected:
    void SetUp() override
    {
        m_previous = std::filesystem::current_path();
        std::filesystem::current_path(m_dir.path());
    }
    void TearDown() override { std::filesystem::current_path(m_previous); }

    TempDir m_dir;
    std::filesystem::path m_previous;
};

TEST_F(FolderTreeTest, CreatesMissingAncestorsAndAcceptsExistingFolders)
{
    EXPECT_TRUE(CWin32FileUtilities::createFolderTree(L"a/b\\c/d"));
    EXPECT_TRUE(std::filesystem::is_directory("a/b/c/d"));
    EXPECT_TRUE(CWin32FileUtilities::createFolderTree(L"a/b/c/d"));
    EXPECT_TRUE(CWin32FileUtilities::createFolderTree(L"a/b/c/e/"));
    EXPECT_TRUE(std::filesystem::is_directory("a/b/c/e"));
    const std::wstring absolute = w((m_dir.path() / "abs/x/y").string()).c_str();
    EXPECT_TRUE(CWin32FileUtilities::createFolderTree(absolute.c_str()));
    EXPECT_TRUE(std::filesystem::is_directory(m_dir.path() / "abs/x/y"));
}

TEST_F(FolderTreeTest, FileInTheWayStopsTheTree)
{
    TempDir::write("a/file", "x");
    EXPECT_FALSE(CWin32FileUtilities::createFolderTree(L"a/file/b/c"));
    EXPECT_FALSE(CWin32FileUtilities::createFolderTree(L"a/file"));
    EXPECT_TRUE(std::filesystem::is_regular_file("a/file"));
}

TEST_F(FolderTreeTest, DriveThatIsItsOwnParentEndsTheWalk)
{
    // "Q:" is its own parent; a file named so plays the drive that cannot be made.
    std::ofstream("Q:") << "x";
    EXPECT_FALSE(CWin32FileUtilities::createFolderTree(L"Q:/Data/User"));
    EXPECT_FALSE(CWin32FileUtilities::createFolderTree(L"Q:"));
    EXPECT_TRUE(std::filesystem::is_regular_file("Q:"));
    // Without anything in the way the relative name "R:" is simply made, as a folder.
    EXPECT_TRUE(CWin32FileUtilities::createFolderTree(L"R:\\Data"));
    EXPECT_TRUE(std::filesystem::is_directory("R:/Data"));
}

TEST_F(FolderTreeTest, CreateParentFolderMakesOnlyTheFolders)
{
    // "sub/.." names a folder only once "sub" exists; the walk makes it on the way.
    EXPECT_TRUE(CWin32FileUtilities::createParentFolder(L"sub/../Other/User/file.xml"));
    EXPECT_TRUE(std::filesystem::is_directory("Other/User"));
    EXPECT_TRUE(CWin32FileUtilities::createParentFolder(L"Data/User/InformationsGarage.xml"));
    EXPECT_TRUE(std::filesystem::is_directory("Data/User"));
    EXPECT_FALSE(std::filesystem::exists("Data/User/InformationsGarage.xml"));
    EXPECT_FALSE(CWin32FileUtilities::createParentFolder(L"InformationsGarage.xml"));
    EXPECT_FALSE(CWin32FileUtilities::createFolderTree(L""));
    EXPECT_FALSE(CWin32FileUtilities::createFolderTree(nullptr));
}
}
