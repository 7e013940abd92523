#include "Win32File.h"

#include "WideString.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <string>

using std::wstring;

namespace
{
// The four parts of a split path as "drive|dir|name|ext"; the error code when it fails.
wstring split(const wchar_t* path)
{
    wchar_t drive[260] = L"x", dir[300] = L"x", fname[260] = L"x", ext[260] = L"x";
    const errno_t error = _wsplitpath_s(path, drive, 260, dir, 260, fname, 260, ext, 260);
    const wstring parts = wstring(drive) + L"|" + dir + L"|" + fname + L"|" + ext;
    return error == 0 ? parts : L"error " + std::to_wstring(error) + L" " + parts;
}
}

TEST(SplitPath, SplitsIntoDriveFolderNameAndExtension)
{
    EXPECT_EQ(split(L"c:\\REPOSITORY\\pkg.tar.gz"), L"c:|\\REPOSITORY\\|pkg.tar|.gz");
    EXPECT_EQ(split(L"dir.d/name"), L"|dir.d/|name|");
    EXPECT_EQ(split(nullptr), L"error 22 |||"); // bad arguments leave every part empty
    // 259 characters fit a buffer of 260 with the terminator, 260 do not.
    const wstring fits = L"/" + wstring(257, L'd') + L"/";
    EXPECT_EQ(split((fits + L"f.x").c_str()), L"|" + fits + L"|f|.x");
    EXPECT_EQ(split((L"/" + fits + L"f.x").c_str()), L"error 34 |||");
    EXPECT_EQ(split(wstring(260, L'n').c_str()), L"error 34 |||");
    EXPECT_EQ(errno, ERANGE);
    // A null buffer of size zero is skipped.
    wchar_t dir[260];
    EXPECT_EQ(_wsplitpath_s(L"C:/a/b.txt", nullptr, 0, dir, 260, nullptr, 0, nullptr, 0), 0);
    EXPECT_EQ(wstring(dir), L"/a/");
}

// Missing separators are added; "C:/a/bc" needs all 8, one more character leaves nothing.
TEST(MakePath, JoinsPartsWithinTheBuffer)
{
    wchar_t path[13] = L"x";
    EXPECT_EQ(_wmakepath_s(path, 13, L"C", L"Data", L"f", L"txt"), 0);
    EXPECT_EQ(wstring(path), L"C:Data\\f.txt");
    EXPECT_EQ(_wmakepath_s(nullptr, 260, L"C:", L"/a/", nullptr, nullptr), EINVAL);
    EXPECT_EQ(_wmakepath_s(path, 8, L"C:", L"/a/", L"bc", nullptr), 0);
    EXPECT_EQ(wstring(path), L"C:/a/bc");
    EXPECT_EQ(_wmakepath_s(path, 8, L"C:", L"/a/", L"b", L"cd"), ERANGE);
    EXPECT_EQ(wstring(path), L"");
}

// Without a buffer the result is allocated. "/abcd" fits 6 exactly; a longer path fails and leaves
// the buffer empty.
TEST(FullPath, ResolvesWithoutTouchingTheDisk)
{
    const std::string here = std::filesystem::current_path().string();
    wchar_t buffer[1024];
    EXPECT_EQ(_wfullpath(buffer, L"a\\b/../c/", 1024), buffer);
    EXPECT_EQ(wstring(buffer), WideString::toStd(WideString::fromUtf8(here + "/a/c/")));
    EXPECT_EQ(wstring(_wfullpath(buffer, L"/..", 1024)), L"/");
    wchar_t* allocated = _wfullpath(nullptr, nullptr, 0);
    EXPECT_EQ(wstring(allocated), WideString::toStd(WideString::fromUtf8(here)));
    std::free(allocated);
    wchar_t small[6] = L"abc";
    EXPECT_EQ(_wfullpath(small, L"/abcde", 6), nullptr);
    EXPECT_EQ(errno, ERANGE);
    EXPECT_EQ(wstring(small), L"");
    EXPECT_EQ(_wfullpath(small, L"/abcd", 6), small);
    EXPECT_EQ(_wfullpath(small, L"/abcd", 0), nullptr);
    EXPECT_EQ(errno, EINVAL);
}
