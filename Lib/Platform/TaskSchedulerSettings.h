#pragma once

#include "Win32Types.h"

#include <string>

// Where the task scheduler keeps its tasks, and the state of its service. Shared by every
// thread of the process.
class TESSEL_EXPORT TaskSchedulerSettings
{
public:
    // The folder holding one file per task (UTF-8 path). An empty path goes back to the
    // per-user default: $XDG_DATA_HOME/ProcToolConfiguration/Tasks, or
    // ~/.local/share/ProcToolConfiguration/Tasks.
    static void setTasksFolder(const std::string& path);
    static std::string tasksFolder();

    // The state the "Schedule" service reports. 0 (the default) lets the service run whenever
    // the tasks folder can be used (and, with the cron backend, the cron daemon runs); any
    // SERVICE_* state fixes it (tests mark it stopped).
    static void setServiceState(DWORD state);
    // The state in effect now: SERVICE_RUNNING or SERVICE_STOPPED when automatic.
    static DWORD serviceState();
    // True when the tasks folder exists or can be made, and can be written.
    static bool tasksFolderUsable();

    // Who runs the saved tasks. Files (the default): nobody, the task files are all there is.
    // Cron: each task with a daily trigger also has its line in a crontab, and the service is
    // the cron daemon.
    enum Backend
    {
        eFiles,
        eCron
    };
    static void setBackend(Backend backend);
    static Backend backend();
    // The crontab program (default "crontab", looked up in PATH); tests put a failing one here.
    static void setCrontabCommand(const std::string& command);
    static std::string crontabCommand();
    // Whose crontab holds the tasks' lines. Empty (the default): each task's account, or the
    // effective user when the task names none.
    static void setCronUser(const std::string& user);
    static std::string cronUser();
    // True when the crontab program can be found.
    static bool crontabAvailable();
};
