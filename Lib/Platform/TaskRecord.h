#pragma once

#include "TaskSchedulerTypes.h"

#include <string>
#include <vector>

// What the scheduler keeps of one task.
struct TaskRecord
{
    std::wstring applicationName;
    std::wstring parameters;
    std::wstring account;
    // Login name of the user who saved the task; only that user may open or delete it.
    std::wstring owner;
    DWORD flags = 0;
    // The run state the scheduler last recorded (SCHED_S_TASK_*).
    HRESULT status = SCHED_S_TASK_HAS_NOT_RUN;
    std::vector<TASK_TRIGGER> triggers;
};
