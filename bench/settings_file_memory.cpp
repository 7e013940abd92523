// Peak memory of loading the costliest settings files of SettingsFile::kMaxSize bytes: one file
// per kind of content, each loaded by BData::load in a fresh process of its own, which reports
// how much its peak resident set (getrusage ru_maxrss) grew during the load.
//
//   SettingsFileMemory          writes the files into a temporary folder and measures each
//   SettingsFileMemory FILE     loads FILE and prints "<loaded> <values> <peak before> <peak after>" (KiB)

#include "BSet.h"
#include "SettingsFile.h"
#include "WideString.h"

#include <sys/resource.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <string>

namespace
{
long peakKiB()
{
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss;
}

// The n-th shortest key made of letters and digits: "a".."9", then "aa", ...
std::string key(std::size_t n)
{
    static const char kAlphabet[] = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789";
    const std::size_t base = sizeof kAlphabet - 1;
    std::string result;
    for (++n; n > 0; n = (n - 1) / base)
        result.insert(result.begin(), kAlphabet[(n - 1) % base]);
    return result;
}

// A document of at most kMaxSize bytes holding as many elements as fit; `count` tells how many.
std::string fill(const std::function<std::string(std::size_t)>& element, std::size_t& count)
{
    const std::string head = "<BSet>";
    const std::string tail = "</BSet>\n";
    std::string body;
    for (count = 0;; ++count)
    {
        const std::string next = element(count);
        if (head.size() + body.size() + next.size() + tail.size() > SettingsFile::kMaxSize)
            break;
        body += next;
    }
    return head + body + tail;
}

int loadAndReport(const char* path)
{
    const long before = peakKiB();
    BSet set;
    const bool loaded = set.load(WideString::fromUtf8(path));
    const long after = peakKiB();
    std::printf("%d %d %ld %ld\n", loaded ? 1 : 0, set.size(), before, after);
    return loaded ? 0 : 1;
}
}

int main(int argc, char** argv)
{
    if (argc == 2)
        return loadAndReport(argv[1]);

    const struct
    {
        const char* name;
        std::function<std::string(std::size_t)> element;
    } cases[] = {
        {"empty sets", [](std::size_t i) { return "<Set key=\"" + key(i) + "\"/>"; }},
        // Blank text between elements is kept by the parser as nodes of its own.
        {"spaced sets", [](std::size_t i) { return "<Set key=\"" + key(i) + "\"/> "; }},
        {"empty strings", [](std::size_t i) { return "<String key=\"" + key(i) + "\"/>"; }},
        {"ints", [](std::size_t i) { return "<Int key=\"" + key(i) + "\">0</Int>"; }},
        {"one big string",
         [](std::size_t i) {
             // The first fills the file to the byte; no second one fits.
             const std::size_t length = i == 0 ? SettingsFile::kMaxSize - 39 : SettingsFile::kMaxSize;
             return "<String key=\"s\">" + std::string(length, 'x') + "</String>";
         }},
    };
    std::string folder = (std::filesystem::temp_directory_path() / "settings-memory-XXXXXX").string();
    if (::mkdtemp(folder.data()) == nullptr)
        return 2;
    const std::string self = std::filesystem::read_symlink("/proc/self/exe").string();
    int status = 0;
    std::printf("%-15s %8s %8s %13s %13s %13s\n", "file", "bytes", "values", "peak before", "peak after",
                "peak growth");
    for (const auto& c : cases)
    {
        std::size_t count = 0;
        const std::string document = fill(c.element, count);
        const std::string path = folder + "/" + std::to_string(&c - cases) + ".xml";
        std::ofstream(path, std::ios::binary) << document;

        FILE* child = ::popen(("'" + self + "' '" + path + "'").c_str(), "r");
        int loaded = 0;
        int values = 0;
        long before = 0;
        long after = 0;
        const bool read =
            child != nullptr && std::fscanf(child, "%d %d %ld %ld", &loaded, &values, &before, &after) == 4;
        if (child != nullptr)
            ::pclose(child);
        if (!read || !loaded)
        {
            std::printf("%-15s %8zu  did not load\n", c.name, document.size());
            status = 1;
            continue;
        }
        std::printf("%-15s %8zu %8d %9ld KiB %9ld KiB %9ld KiB = %.1f MiB\n", c.name, document.size(), values, before,
                    after, after - before, (after - before) / 1024.0);
    }
    std::filesystem::remove_all(folder);
    return status;
}
