#include "TaskSchedulerSettings.h"

#include "Win32Service.h"

#include <pwd.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <mutex>

namespace
{
struct Settings
{
    std::mutex mutex;
    std::string tasksFolder;
    DWORD serviceState = 0;
};

Settings& settings()
{
    static Settings instance;
    return instance;
}

std::string defaultTasksFolder()
{
    const char* dataHome = std::getenv("XDG_DATA_HOME");
    std::filesystem::path base;
    if (dataHome != nullptr && dataHome[0] == '/')
    {
        base = dataHome;
    }
    else
    {
        const char* home = std::getenv("HOME");
        if (home == nullptr || home[0] == '\0')
        {
            const passwd* entry = getpwuid(geteuid());
            home = entry != nullptr ? entry->pw_dir : "/tmp";
        }
        base = std::filesystem::path(home) / ".local" / "share";
    }
    return (base / "ProcToolConfiguration" / "Tasks").string();
}
}

void TaskSchedulerSettings::setTasksFolder(const std::string& path)
{
    Settings& s = settings();
    std::lock_guard<std::mutex> lock(s.mutex);
    s.tasksFolder = path;
}

std::string TaskSchedulerSettings::tasksFolder()
{
    Settings& s = settings();
    {
        std::lock_guard<std::mutex> lock(s.mutex);
        if (!s.tasksFolder.empty())
            return s.tasksFolder;
    }
    return defaultTasksFolder();
}

void TaskSchedulerSettings::setServiceState(DWORD state)
{
    Settings& s = settings();
    std::lock_guard<std::mutex> lock(s.mutex);
    s.serviceState = state;
}

DWORD TaskSchedulerSettings::serviceState()
{
    Settings& s = settings();
    {
        std::lock_guard<std::mutex> lock(s.mutex);
        if (s.serviceState != 0)
            return s.serviceState;
    }
    return tasksFolderUsable() ? SERVICE_RUNNING : SERVICE_STOPPED;
}

bool TaskSchedulerSettings::tasksFolderUsable()
{
    const std::filesystem::path folder = tasksFolder();
    std::error_code error;
    std::filesystem::create_directories(folder, error);
    if (!std::filesystem::is_directory(folder, error))
        return false;
    return access(folder.c_str(), W_OK | X_OK) == 0;
}
