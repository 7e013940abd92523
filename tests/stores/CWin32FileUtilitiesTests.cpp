#include "CWin32FileUtilities.h"

#include "StoreTestSupport.h"

#include <filesystem>
#include <fstream>

namespace
{
TEST(ParentFolderName, IsDriveAndFolderWithoutTrailingSeparatorOrEmpty)
{
    const auto parentOf = [](const std::wstring& path) {
        return utf8(CWin32FileUtilities::getParentFolderName(path.c_str()));
    };
    const std::pair<const char*, const char*> cases[] = {{"../../Data/User/InformationsGarage.xml", "../../Data/User"},
                                                         {"C:/Data/", "C:/Data"},
                                                         {"C:/Data", "C:"},
                                                         {"C:\\Data\\", "C:\\Data"},
                                                         {"C:\\Data\\Sub\\file.xml", "C:\\Data\\Sub"},
                                                         {"C:", "C:"},
                                                         {"InformationsGarage.xml", ""},
                                                         {"/", ""},
                                                         {"/tmp", ""},
                                                         {"/tmp/x", "/tmp"},
                                                         {"", ""}};
    for (const auto& [path, parent] : cases)
        EXPECT_EQ(parentOf(wide(path).c_str()), parent) << path;
    // An unsplittable path is logged, a too long result is empty.
    LogCapture log;
    EXPECT_EQ(parentOf(L"dir/" + std::wstring(300, L'n') + L".xml"), "");
    EXPECT_EQ(utf8(CWin32FileUtilities::getParentFolderName(nullptr)), "");
    const std::string text = "CWin32FileUtilities::getParentFolderName: _wsplitpath_s failed with error '";
    EXPECT_EQ(log.messages(TesselLog_Static::eERROR),
              (std::vector<std::string>{text + std::to_string(ERANGE) + "' ", text + std::to_string(EINVAL) + "' "}));
    // The folder alone fits 260 characters, with the drive in front it does not: no log.
    log.clear();
    EXPECT_EQ(parentOf(L"C:/" + std::wstring(257, L'd') + L"/file"), "");
    EXPECT_TRUE(log.records().empty());
}

// Runs inside its temporary folder, so relative names such as "Q:" land there.
TEST(FolderTree, CreatesMissingAncestorsUnlessAFileIsInTheWay)
{
    TempDir dir;
    const auto previous = std::filesystem::current_path();
    std::filesystem::current_path(dir.path());
    EXPECT_TRUE(CWin32FileUtilities::createFolderTree(L"a/b\\c/d") &&
                CWin32FileUtilities::createFolderTree(L"a/b/c/e/"));
    EXPECT_TRUE(std::filesystem::is_directory("a/b/c/d") && std::filesystem::is_directory("a/b/c/e"));
    EXPECT_FALSE(CWin32FileUtilities::createFolderTree(L"") || CWin32FileUtilities::createFolderTree(nullptr));
    TempDir::write("a/file", "x");
    EXPECT_FALSE(CWin32FileUtilities::createFolderTree(L"a/file/b/c") ||
                 CWin32FileUtilities::createFolderTree(L"a/file"));
    // "Q:" is its own parent; a file named so plays the drive that cannot be made.
    std::ofstream("Q:") << "x";
    EXPECT_FALSE(CWin32FileUtilities::createFolderTree(L"Q:/Data/User") ||
                 CWin32FileUtilities::createFolderTree(L"Q:"));
    // "sub/.." names a folder only once "sub" exists; the walk makes it on the way.
    EXPECT_TRUE(CWin32FileUtilities::createParentFolder(L"sub/../Other/User/file.xml"));
    EXPECT_TRUE(std::filesystem::is_directory("Other/User") && !std::filesystem::exists("Other/User/file.xml"));
    EXPECT_FALSE(CWin32FileUtilities::createParentFolder(L"InformationsGarage.xml"));
    std::filesystem::current_path(previous);
}
}
