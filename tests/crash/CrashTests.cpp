#include "BSet.h"
#include "SettingsFile.h"
#include "SettingsFiles.h"
#include "TaskFile.h"
#include "TaskRecord.h"
#include "TaskSchedulerSettings.h"
#include "TempDir.h"
#include "TestText.h"

#include <gtest/gtest.h>

#include <dlfcn.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <random>
#include <set>
#include <string>
#include <vector>

namespace
{
const int kFiles = 4;
const char* const kNames[kFiles] = {"InformationsGarage.xml", "FicheDiagParams.xml", "OnlineUpdate.xml",
                                    "CrashTask.job"};
const std::wstring kTask = L"CrashTask";
// Progress bytes: a save begins, a step inside a save (fsync, rename), a save failed.
const char kSaveBegins = 's';
const char kStep = '.';
const char kFailed = 'E';

// Where the child reports progress; -1 in the parent.
int g_progress = -1;

void reportStep()
{
    if (g_progress >= 0)
        (void)!::write(g_progress, &kStep, 1);
}
}

// The file layer's fsync and rename report a step before they run, so that kills also land
// between writing, syncing and renaming a temporary file.
extern "C" __attribute__((visibility("default"))) int fsync(int fd)
{
    static const auto real = reinterpret_cast<int (*)(int)>(::dlsym(RTLD_NEXT, "fsync"));
    reportStep();
    return real(fd);
}

extern "C" __attribute__((visibility("default"))) int rename(const char* from, const char* to) noexcept
{
    static const auto real = reinterpret_cast<int (*)(const char*, const char*)>(::dlsym(RTLD_NEXT, "rename"));
    reportStep();
    return real(from, to);
}

namespace
{
// The value the child saves at `step`: from a few bytes to about 200 KB, so that kills land in
// writes of many lengths.
std::string childValue(int round, int step)
{
    const std::uint32_t mix =
        static_cast<std::uint32_t>(round) * 2654435761u ^ static_cast<std::uint32_t>(step) * 40503u;
    const std::size_t length = mix % 5 == 0 ? 100000 + mix % 100000 : mix % 3000;
    return "r" + std::to_string(round) + "s" + std::to_string(step) + ":" +
           std::string(length, static_cast<char>('a' + step % 26));
}

std::string parentValue(int round)
{
    return "r" + std::to_string(round) + "parent";
}

// Three settings files and a task file in one folder, each holding one text value.
class Files
{
public:
    explicit Files(const std::string& folder) : m_folder(folder) { TaskSchedulerSettings::setTasksFolder(folder); }
    ~Files() { TaskSchedulerSettings::setTasksFolder(std::string()); }

    std::string path(int file) const { return m_folder + "/" + kNames[file]; }

    bool save(int file, const std::string& value) const
    {
        if (file == kFiles - 1)
        {
            TaskRecord record;
            record.applicationName = WideString::toStd(wide(value));
            return TaskFile::save(kTask, record) == S_OK;
        }
        BSet set(10);
        set.setString(L"value"_w, wide(value));
        return set.save(wide(path(file)), false);
    }

    // The value the file holds, or "<not loaded>".
    std::string read(int file) const
    {
        if (file == kFiles - 1)
        {
            TaskRecord record;
            return TaskFile::load(kTask, record) == S_OK ? utf8(WideString::fromStd(record.applicationName))
                                                         : "<not loaded>";
        }
        BSet set(10);
        return set.load(wide(path(file))) ? SettingsFiles::stringAt(set, "value") : "<not loaded>";
    }

    // Names in the folder besides the four files.
    std::vector<std::string> others() const
    {
        std::vector<std::string> result;
        for (const auto& entry : std::filesystem::directory_iterator(m_folder))
        {
            const std::string name = entry.path().filename().string();
            if (std::find(std::begin(kNames), std::end(kNames), name) == std::end(kNames))
                result.push_back(name);
        }
        return result;
    }

private:
    std::string m_folder;
};

// The child: saves file step % kFiles with the step's value, reporting progress, until killed.
[[noreturn]] void saveUntilKilled(const Files& files, int round, int out)
{
    g_progress = out;
    for (int step = 0;; ++step)
    {
        if (::write(out, &kSaveBegins, 1) != 1)
            ::_exit(3);
        if (!files.save(step % kFiles, childValue(round, step)))
        {
            (void)!::write(out, &kFailed, 1);
            ::_exit(2);
        }
    }
}

// What `file` may hold: the value of its last save begun, or of the one before it.
std::set<std::string> allowedValues(int file, int round, int started)
{
    const int last = started > file ? file + (started - 1 - file) / kFiles * kFiles : -1; // -1: none begun
    if (last < 0)
        return {parentValue(round)};
    return {childValue(round, last), last >= kFiles ? childValue(round, last - kFiles) : parentValue(round)};
}

// Reads `wanted` progress bytes (0: up to the end), counting the saves begun in `started`;
// false on a failure byte.
bool readProgress(int in, int wanted, int& started)
{
    char byte = 0;
    for (int read = 0; (wanted == 0 || read < wanted) && ::read(in, &byte, 1) == 1; ++read)
    {
        if (byte == kFailed)
            return false;
        started += byte == kSaveBegins;
    }
    return true;
}
}

// A child saves the four files in turn and is killed after a number of progress bytes drawn
// from a fixed-seed generator. Every file must load with a value the child or the parent wrote,
// and the parent's next save must leave nothing but the four files in the folder.
TEST(CrashTest, SavesKilledAtVariedPointsLeaveWholeFiles)
{
    TempDir dir;
    const Files files(dir.path().string());
    std::mt19937 random(20240611);
    std::uniform_int_distribution<int> stepsBeforeKill(1, 24);
    const char* killsWanted = std::getenv("PTC_CRASH_KILLS");
    const int kills = killsWanted != nullptr && std::atoi(killsWanted) > 0 ? std::atoi(killsWanted) : 40;
    int leftTemporary = 0;
    for (int round = 0; round < kills; ++round)
    {
        for (int file = 0; file < kFiles; ++file)
            ASSERT_TRUE(files.save(file, parentValue(round))) << kNames[file];
        ASSERT_EQ(files.others(), std::vector<std::string>()) << "after the parent's saves, round " << round;

        int ends[2];
        ASSERT_EQ(::pipe(ends), 0);
        const pid_t child = ::fork();
        ASSERT_GE(child, 0);
        if (child == 0)
        {
            ::close(ends[0]);
            saveUntilKilled(files, round, ends[1]);
        }
        ::close(ends[1]);
        int started = 0;
        bool childSaved = readProgress(ends[0], stepsBeforeKill(random), started);
        ::kill(child, SIGKILL);
        int status = 0;
        ::waitpid(child, &status, 0);
        // Steps the child began between the last byte read and its death count too.
        childSaved = readProgress(ends[0], 0, started) && childSaved;
        ::close(ends[0]);
        ASSERT_TRUE(childSaved) << "a save failed in the child, round " << round;
        ASSERT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL) << "round " << round;

        for (int file = 0; file < kFiles; ++file)
        {
            const std::string value = files.read(file);
            const auto allowed = allowedValues(file, round, started);
            EXPECT_EQ(allowed.count(value), 1u) << kNames[file] << ", round " << round << ", " << started
                                                << " steps: holds '" << value.substr(0, 40) << "'";
        }
        const auto others = files.others();
        leftTemporary += !others.empty();
        for (const std::string& name : others)
            EXPECT_TRUE(std::any_of(std::begin(kNames), std::end(kNames), [&name](const char* target) {
                return SettingsFile::isTemporaryOf(name, target);
            })) << name;
    }
    std::cout << kills << " kills checked; " << leftTemporary << " of them left a temporary file (landed mid-save)\n";
}
