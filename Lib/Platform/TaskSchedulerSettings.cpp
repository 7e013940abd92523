#include "TaskSchedulerSettings.h"

#include "CronTable.h"
#include "Win32Service.h"

#include <pwd.h>
#include <unistd.h>

#include <algorithm>
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
    TaskSchedulerSettings::Backend backend = TaskSchedulerSettings::eFiles;
    std::string crontabCommand;
    std::string cronUser;
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
    if (!tasksFolderUsable())
        return SERVICE_STOPPED;
    return backend() != eCron || CronTable::daemonRunning() ? SERVICE_RUNNING : SERVICE_STOPPED;
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

void TaskSchedulerSettings::setBackend(Backend backend)
{
    Settings& s = settings();
    std::lock_guard<std::mutex> lock(s.mutex);
    s.backend = backend;
}

TaskSchedulerSettings::Backend TaskSchedulerSettings::backend()
{
    Settings& s = settings();
    std::lock_guard<std::mutex> lock(s.mutex);
    return s.backend;
}

void TaskSchedulerSettings::setCrontabCommand(const std::string& command)
{
    Settings& s = settings();
    std::lock_guard<std::mutex> lock(s.mutex);
    s.crontabCommand = command;
}

std::string TaskSchedulerSettings::crontabCommand()
{
    Settings& s = settings();
    std::lock_guard<std::mutex> lock(s.mutex);
    return s.crontabCommand.empty() ? std::string("crontab") : s.crontabCommand;
}

void TaskSchedulerSettings::setCronUser(const std::string& user)
{
    Settings& s = settings();
    std::lock_guard<std::mutex> lock(s.mutex);
    s.cronUser = user;
}

std::string TaskSchedulerSettings::cronUser()
{
    Settings& s = settings();
    std::lock_guard<std::mutex> lock(s.mutex);
    return s.cronUser;
}

bool TaskSchedulerSettings::crontabAvailable()
{
    const std::string command = crontabCommand();
    if (command.find('/') != std::string::npos)
        return access(command.c_str(), X_OK) == 0;
    const char* path = std::getenv("PATH");
    std::string folders = path != nullptr ? path : "/usr/bin:/bin";
    size_t start = 0;
    while (start <= folders.size())
    {
        const size_t end = std::min(folders.find(':', start), folders.size());
        const std::string folder = end > start ? folders.substr(start, end - start) : std::string(".");
        if (access((folder + "/" + command).c_str(), X_OK) == 0)
            return true;
        start = end + 1;
    }
    return false;
}
