#pragma once

#include "TaskRecord.h"

#include <string>

// The file of one task in the tasks folder: "<name>.job", an XML document written atomically.
class TESSEL_EXPORT TaskFile
{
public:
    // A task name is non-empty, not "." or "..", and free of control characters and of
    // \ / : * ? " < > |.
    static bool isValidName(const std::wstring& name);
    static bool isValidTrigger(const TASK_TRIGGER& trigger);
    static std::string pathOf(const std::wstring& name);

    // S_OK with the record; 0x80070002 when there is no such task, E_ACCESSDENIED when the
    // file cannot be read or belongs to another user, SCHED_E_UNKNOWN_OBJECT_VERSION when it
    // is damaged. With the cron backend, a task whose crontab line is missing or differs reads
    // as disabled.
    static HRESULT load(const std::wstring& name, TaskRecord& record);
    // Writes the record with the effective user as owner: temporary file, fsync, rename.
    // On failure the old file stays as it was. With the cron backend the task's crontab line is
    // set in the same step: when either write fails, both stay as they were.
    static HRESULT save(const std::wstring& name, const TaskRecord& record);
    // 0x80070002 when absent, E_ACCESSDENIED for another user's task. With the cron backend the
    // task's crontab line goes in the same step.
    static HRESULT remove(const std::wstring& name);
};
