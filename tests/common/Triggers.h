#pragma once

#include "TaskSchedulerTypes.h"

#include <cstring>

// A trigger every `interval` days (weeks for a weekly one: the fields share their place), zeroed
// first so that records compare byte for byte, padding included.
inline TASK_TRIGGER makeTrigger(WORD hour, WORD minute, WORD interval = 1,
                                TASK_TRIGGER_TYPE type = TASK_TIME_TRIGGER_DAILY, WORD year = 2025, WORD month = 6,
                                WORD day = 30)
{
    TASK_TRIGGER t;
    std::memset(&t, 0, sizeof t);
    t.cbTriggerSize = sizeof t, t.TriggerType = type, t.Type.Daily.DaysInterval = interval;
    t.wBeginYear = year, t.wBeginMonth = month, t.wBeginDay = day, t.wStartHour = hour, t.wStartMinute = minute;
    return t;
}
