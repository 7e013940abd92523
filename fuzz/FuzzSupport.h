#pragma once

#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

// Stops the run (a finding for libFuzzer) when a property of the code under test does not hold.
#define FUZZ_CHECK(condition)                                                                                          \
    do                                                                                                                 \
    {                                                                                                                  \
        if (!(condition))                                                                                              \
        {                                                                                                              \
            std::fprintf(stderr, "%s:%d: check failed: %s\n", __FILE__, __LINE__, #condition);                         \
            __builtin_trap();                                                                                          \
        }                                                                                                              \
    } while (0)

// A folder of the run's own under $TMPDIR, removed at exit.
struct FuzzFolder
{
    FuzzFolder()
    {
        std::string pattern = (std::filesystem::temp_directory_path() / "ptc-fuzz-XXXXXX").string();
        FUZZ_CHECK(::mkdtemp(pattern.data()) != nullptr);
        path = pattern;
    }
    ~FuzzFolder()
    {
        std::error_code ignored;
        std::filesystem::remove_all(path, ignored);
    }
    std::string file(const std::string& name) const { return path + "/" + name; }

    std::string path;
};

// Writes the input as a new file: removing the old one first spares ext4 the flush it does when
// a file is truncated and written again, which would slow every run down to disk speed.
inline void writeInput(const std::string& path, const std::uint8_t* data, std::size_t size)
{
    ::unlink(path.c_str());
    std::ofstream out(path, std::ios::binary);
    out.write(reinterpret_cast<const char*>(data), static_cast<std::streamsize>(size));
    out.close();
    FUZZ_CHECK(!out.fail());
}
