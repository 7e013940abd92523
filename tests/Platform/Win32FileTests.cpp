#include "Win32File.h"

#include "TempDir.h"
#include "WideString.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <thread>

namespace
{
std::wstring wide(const std::string& utf8)
{
    return WideString::toStd(WideString::fromUtf8(utf8));
}

// ---- _wsplitpath_s ----

struct SplitCase
{
    const wchar_t* path;
    const wchar_t* drive;
    const wchar_t* dir;
    const wchar_t* fname;
    const wchar_t* ext;
};

void PrintTo(const SplitCase& c, std::ostream* os)
{
    *os << '"' << WideString::toUtf8(c.path) << '"';
}

class SplitPathTest : public ::testing::TestWithParam<SplitCase>
{
};

TEST_P(SplitPathTest, SplitsIntoDriveFolderNameAndExtension)
{
    const SplitCase& c = GetParam();
    wchar_t drive[260], dir[260], fname[260], ext[260];
    ASSERT_EQ(_wsplitpath_s(c.path, drive, 260, dir, 260, fname, 260, ext, 260), 0);
    EXPECT_EQ(std::wstring(drive), c.drive);
    EXPECT_EQ(std::wstring(dir), c.dir);
    EXPECT_EQ(std::wstring(fname), c.fname);
    EXPECT_EQ(std::wstring(ext), c.ext);
}

INSTANTIATE_TEST_SUITE_P(
    Paths, SplitPathTest,
    ::testing::Values(SplitCase{L"../../Data/User/InformationsGarage.xml", L"", L"../../Data/User/", L"InformationsGarage", L".xml"},
                      SplitCase{L"C:/Data/", L"C:", L"/Data/", L"", L""},
                      SplitCase{L"C:/Data", L"C:", L"/", L"Data", L""},
                      SplitCase{L"C:", L"C:", L"", L"", L""},
                      SplitCase{L"c:\\TLD_REPOSITORY\\pkg.tar.gz", L"c:", L"\\TLD_REPOSITORY\\", L"pkg.tar", L".gz"},
                      SplitCase{L"x\\y/z.txt", L"", L"x\\y/", L"z", L".txt"},
                      SplitCase{L"dir.d/name", L"", L"dir.d/", L"name", L""},
                      SplitCase{L"InformationsGarage.xml", L"", L"", L"InformationsGarage", L".xml"},
                      SplitCase{L"..", L"", L"", L".", L"."},
                      SplitCase{L"/", L"", L"/", L"", L""},
                      SplitCase{L"", L"", L"", L"", L""},
                      SplitCase{L"/données/Łukasz.xml", L"", L"/données/", L"Łukasz", L".xml"}));

TEST(SplitPathErrors, NullOutputsWithZeroSizeAreSkipped)
{
    wchar_t dir[260];
    EXPECT_EQ(_wsplitpath_s(L"C:/a/b.txt", nullptr, 0, dir, 260, nullptr, 0, nullptr, 0), 0);
    EXPECT_EQ(std::wstring(dir), L"/a/");
}

TEST(SplitPathErrors, BadArgumentsGiveEinvalAndEmptyBuffers)
{
    wchar_t drive[260] = L"x", dir[260] = L"x", fname[260] = L"x", ext[260] = L"x";
    EXPECT_EQ(_wsplitpath_s(nullptr, drive, 260, dir, 260, fname, 260, ext, 260), EINVAL);
    EXPECT_EQ(std::wstring(drive), L"");
    EXPECT_EQ(std::wstring(ext), L"");

    dir[0] = L'x';
    EXPECT_EQ(_wsplitpath_s(L"a/b", drive, 260, nullptr, 260, fname, 260, ext, 260), EINVAL);
    EXPECT_EQ(_wsplitpath_s(L"a/b", drive, 260, dir, 0, fname, 260, ext, 260), EINVAL);
    EXPECT_EQ(errno, EINVAL);
}

TEST(SplitPathErrors, PartLongerThanItsBufferGivesErange)
{
    wchar_t drive[260], dir[260], fname[260], ext[260];
    // 259 characters fit a buffer of 260 with the terminator, 260 do not.
    const std::wstring fits = L"/" + std::wstring(257, L'd') + L"/";
    ASSERT_EQ(fits.size(), 259u);
    EXPECT_EQ(_wsplitpath_s((fits + L"f.x").c_str(), drive, 260, dir, 260, fname, 260, ext, 260), 0);
    EXPECT_EQ(std::wstring(dir), fits);

    const std::wstring tooLong = L"/" + std::wstring(258, L'd') + L"/";
    fname[0] = L'x';
    EXPECT_EQ(_wsplitpath_s((tooLong + L"f.x").c_str(), drive, 260, dir, 260, fname, 260, ext, 260), ERANGE);
    EXPECT_EQ(std::wstring(dir), L"");
    EXPECT_EQ(std::wstring(fname), L"");

    EXPECT_EQ(_wsplitpath_s(L"C:/a", drive, 2, dir, 260, fname, 260, ext, 260), ERANGE);
    EXPECT_EQ(_wsplitpath_s(std::wstring(260, L'n').c_str(), drive, 260, dir, 260, fname, 260, ext, 260), ERANGE);
}

// ---- _wmakepath_s ----

struct MakeCase
{
    const wchar_t* drive;
    const wchar_t* dir;
    const wchar_t* fname;
    const wchar_t* ext;
    const wchar_t* expected;
};

void PrintTo(const MakeCase& c, std::ostream* os)
{
    *os << '"' << WideString::toUtf8(c.expected) << '"';
}

class MakePathTest : public ::testing::TestWithParam<MakeCase>
{
};

TEST_P(MakePathTest, JoinsParts)
{
    const MakeCase& c = GetParam();
    wchar_t path[260] = L"garbage";
    ASSERT_EQ(_wmakepath_s(path, 260, c.drive, c.dir, c.fname, c.ext), 0);
    EXPECT_EQ(std::wstring(path), c.expected);
}

INSTANTIATE_TEST_SUITE_P(Parts, MakePathTest,
                         ::testing::Values(MakeCase{L"C:", L"/Data/", nullptr, nullptr, L"C:/Data/"},
                                           MakeCase{L"C:", L"/", L"", L"", L"C:/"},
                                           MakeCase{L"C", L"Data", L"f", L"txt", L"C:Data\\f.txt"},
                                           MakeCase{L"", L"../../Data/User/", L"", L"", L"../../Data/User/"},
                                           MakeCase{nullptr, nullptr, L"f", L".xml", L"f.xml"},
                                           MakeCase{nullptr, nullptr, nullptr, nullptr, L""}));

TEST(MakePathErrors, BadBufferAndTooSmallBuffer)
{
    EXPECT_EQ(_wmakepath_s(nullptr, 260, L"C:", L"/a/", nullptr, nullptr), EINVAL);
    wchar_t path[8] = L"x";
    EXPECT_EQ(_wmakepath_s(path, 0, L"C:", L"/a/", nullptr, nullptr), EINVAL);
    // "C:/abcd/" is 8 characters: it needs 9.
    EXPECT_EQ(_wmakepath_s(path, 8, L"C:", L"/abcd/", nullptr, nullptr), ERANGE);
    EXPECT_EQ(std::wstring(path), L"");
    EXPECT_EQ(_wmakepath_s(path, 8, L"C:", L"/abc/", nullptr, nullptr), 0);
    EXPECT_EQ(std::wstring(path), L"C:/abc/");
}

// ---- attributes and folders ----

class FileCallsTest : public ::testing::Test
{
protected:
    std::wstring path(const std::string& name) const { return wide(m_dir.file(name)); }
    TempDir m_dir;
};

TEST_F(FileCallsTest, AttributesOfFolderFileAndMissingPaths)
{
    TempDir::write(m_dir.file("sub/Żółć.xml"), "<x/>");
    EXPECT_EQ(GetFileAttributesW(path("sub").c_str()), FILE_ATTRIBUTE_DIRECTORY);
    EXPECT_EQ(GetFileAttributesW((path("") + L"\\sub\\").c_str()), FILE_ATTRIBUTE_DIRECTORY);

    const DWORD file = GetFileAttributesW(path("sub/Żółć.xml").c_str());
    ASSERT_NE(file, INVALID_FILE_ATTRIBUTES);
    EXPECT_EQ(file & FILE_ATTRIBUTE_DIRECTORY, 0u);
    EXPECT_NE(file & FILE_ATTRIBUTE_NORMAL, 0u);

    SetLastError(ERROR_SUCCESS);
    EXPECT_EQ(GetFileAttributesW(path("missing").c_str()), INVALID_FILE_ATTRIBUTES);
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_FILE_NOT_FOUND));
    EXPECT_EQ(GetFileAttributesW(path("sub/Żółć.xml/inner").c_str()), INVALID_FILE_ATTRIBUTES);
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_PATH_NOT_FOUND));
    EXPECT_EQ(GetFileAttributesW(nullptr), INVALID_FILE_ATTRIBUTES);
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));
    EXPECT_EQ(GetFileAttributesW(L""), INVALID_FILE_ATTRIBUTES);
}

TEST_F(FileCallsTest, CreateDirectoryMakesOneLevelOnly)
{
    EXPECT_TRUE(CreateDirectoryW((path("") + L"\\made").c_str(), nullptr));
    EXPECT_TRUE(std::filesystem::is_directory(m_dir.path() / "made"));

    EXPECT_FALSE(CreateDirectoryW(path("made").c_str(), nullptr));
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ALREADY_EXISTS));

    TempDir::write(m_dir.file("file"), "x");
    EXPECT_FALSE(CreateDirectoryW(path("file").c_str(), nullptr));
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ALREADY_EXISTS));

    EXPECT_FALSE(CreateDirectoryW(path("a/b").c_str(), nullptr));
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_PATH_NOT_FOUND));
    EXPECT_FALSE(std::filesystem::exists(m_dir.path() / "a"));

    EXPECT_FALSE(CreateDirectoryW(nullptr, nullptr));
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));
    EXPECT_FALSE(CreateDirectoryW(L"", nullptr));
}

TEST(LastError, IsKeptPerThread)
{
    SetLastError(ERROR_ALREADY_EXISTS);
    DWORD seenByOther = 1;
    std::thread other([&seenByOther] {
        seenByOther = GetLastError();
        SetLastError(ERROR_ACCESS_DENIED);
    });
    other.join();
    EXPECT_EQ(seenByOther, static_cast<DWORD>(ERROR_SUCCESS));
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ALREADY_EXISTS));
}

// ---- _wfullpath ----

struct FullPathCase
{
    const wchar_t* relative;
    const char* expectedBelowCurrent; // null: the expected text is absolute
    const char* expectedAbsolute;
};

void PrintTo(const FullPathCase& c, std::ostream* os)
{
    *os << '"' << (c.relative != nullptr ? WideString::toUtf8(c.relative) : std::string("(null)")) << '"';
}

class FullPathTest : public ::testing::TestWithParam<FullPathCase>
{
};

TEST_P(FullPathTest, ResolvesWithoutTouchingTheDisk)
{
    const FullPathCase& c = GetParam();
    const std::string current = std::filesystem::current_path().string();
    std::string expected = c.expectedAbsolute != nullptr ? c.expectedAbsolute : current;
    if (c.expectedBelowCurrent != nullptr && c.expectedBelowCurrent[0] != '\0')
        expected += std::string("/") + c.expectedBelowCurrent;

    wchar_t buffer[1024];
    ASSERT_NE(_wfullpath(buffer, c.relative, 1024), nullptr);
    EXPECT_EQ(std::wstring(buffer), wide(expected));
}

INSTANTIATE_TEST_SUITE_P(Paths, FullPathTest,
                         ::testing::Values(FullPathCase{L"no/such/../file.xml", "no/file.xml", nullptr},
                                           FullPathCase{L"a\\b\\.\\c", "a/b/c", nullptr},
                                           FullPathCase{L"dir/", "dir/", nullptr},
                                           FullPathCase{L"", "", nullptr},
                                           FullPathCase{nullptr, "", nullptr},
                                           FullPathCase{L"C:/Data", "C:/Data", nullptr},
                                           FullPathCase{L"/x/./y/../z", nullptr, "/x/z"},
                                           FullPathCase{L"/..", nullptr, "/"}));

TEST(FullPathErrors, TooSmallBufferAndAllocation)
{
    wchar_t small[4] = L"abc";
    errno = 0;
    EXPECT_EQ(_wfullpath(small, L"/abcd", 4), nullptr);
    EXPECT_EQ(errno, ERANGE);
    wchar_t exact[6];
    EXPECT_NE(_wfullpath(exact, L"/abcd", 6), nullptr);
    EXPECT_EQ(std::wstring(exact), L"/abcd");
    EXPECT_EQ(_wfullpath(exact, L"/abcd", 0), nullptr);
    EXPECT_EQ(errno, EINVAL);

    wchar_t* allocated = _wfullpath(nullptr, L"/données/ß", 0);
    ASSERT_NE(allocated, nullptr);
    EXPECT_EQ(std::wstring(allocated), L"/données/ß");
    std::free(allocated);
}
}
