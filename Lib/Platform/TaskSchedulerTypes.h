#pragma once

// Records, codes and identifiers of our task scheduler layer, laid out as the originals.

#include "Win32Com.h"

// A fixed underlying type: a record from outside may hold any value here.
enum TASK_TRIGGER_TYPE : int
{
    TASK_TIME_TRIGGER_ONCE = 0,
    TASK_TIME_TRIGGER_DAILY = 1,
    TASK_TIME_TRIGGER_WEEKLY = 2,
    TASK_TIME_TRIGGER_MONTHLYDATE = 3,
    TASK_TIME_TRIGGER_MONTHLYDOW = 4,
    TASK_EVENT_TRIGGER_ON_IDLE = 5,
    TASK_EVENT_TRIGGER_AT_SYSTEMSTART = 6,
    TASK_EVENT_TRIGGER_AT_LOGON = 7
};

struct DAILY
{
    WORD DaysInterval;
};
struct WEEKLY
{
    WORD WeeksInterval;
    WORD rgfDaysOfTheWeek;
};
struct MONTHLYDATE
{
    DWORD rgfDays;
    WORD rgfMonths;
};
struct MONTHLYDOW
{
    WORD wWhichWeek;
    WORD rgfDaysOfTheWeek;
    WORD rgfMonths;
};
union TRIGGER_TYPE_UNION
{
    DAILY Daily;
    WEEKLY Weekly;
    MONTHLYDATE MonthlyDate;
    MONTHLYDOW MonthlyDOW;
};

struct TASK_TRIGGER
{
    WORD cbTriggerSize;
    WORD Reserved1;
    WORD wBeginYear;
    WORD wBeginMonth;
    WORD wBeginDay;
    WORD wEndYear;
    WORD wEndMonth;
    WORD wEndDay;
    WORD wStartHour;
    WORD wStartMinute;
    DWORD MinutesDuration;
    DWORD MinutesInterval;
    DWORD rgFlags;
    TASK_TRIGGER_TYPE TriggerType;
    TRIGGER_TYPE_UNION Type;
    WORD Reserved2;
    WORD wRandomMinutesInterval;
};
typedef TASK_TRIGGER* PTASK_TRIGGER;
static_assert(sizeof(TASK_TRIGGER) == 48, "TASK_TRIGGER keeps its original size");

// Trigger flags.
#define TASK_TRIGGER_FLAG_HAS_END_DATE 0x1
#define TASK_TRIGGER_FLAG_KILL_AT_DURATION_END 0x2
#define TASK_TRIGGER_FLAG_DISABLED 0x4

// Work item flags.
#define TASK_FLAG_INTERACTIVE 0x1
#define TASK_FLAG_DELETE_WHEN_DONE 0x2
#define TASK_FLAG_DISABLED 0x4
#define TASK_FLAG_START_ONLY_IF_IDLE 0x10
#define TASK_FLAG_KILL_ON_IDLE_END 0x20
#define TASK_FLAG_DONT_START_IF_ON_BATTERIES 0x40
#define TASK_FLAG_KILL_IF_GOING_ON_BATTERIES 0x80
#define TASK_FLAG_RUN_ONLY_IF_DOCKED 0x100
#define TASK_FLAG_HIDDEN 0x200
#define TASK_FLAG_RUN_IF_CONNECTED_TO_INTERNET 0x400
#define TASK_FLAG_RESTART_ON_IDLE_RESUME 0x800
#define TASK_FLAG_SYSTEM_REQUIRED 0x1000
#define TASK_FLAG_RUN_ONLY_IF_LOGGED_ON 0x2000

// Task states (GetStatus).
#define SCHED_S_TASK_READY ((HRESULT)0x00041300)
#define SCHED_S_TASK_RUNNING ((HRESULT)0x00041301)
#define SCHED_S_TASK_DISABLED ((HRESULT)0x00041302)
#define SCHED_S_TASK_HAS_NOT_RUN ((HRESULT)0x00041303)
#define SCHED_S_TASK_NO_MORE_RUNS ((HRESULT)0x00041304)
#define SCHED_S_TASK_NOT_SCHEDULED ((HRESULT)0x00041305)
#define SCHED_S_TASK_TERMINATED ((HRESULT)0x00041306)
#define SCHED_S_TASK_NO_VALID_TRIGGERS ((HRESULT)0x00041307)

// Scheduler failures.
#define SCHED_E_TRIGGER_NOT_FOUND ((HRESULT)0x80041309)
#define SCHED_E_TASK_NOT_READY ((HRESULT)0x8004130A)
#define SCHED_E_INVALID_TASK ((HRESULT)0x8004130E)
#define SCHED_E_UNKNOWN_OBJECT_VERSION ((HRESULT)0x80041313)
#define SCHED_E_SERVICE_NOT_RUNNING ((HRESULT)0x80041315)

inline constexpr CLSID CLSID_CTaskScheduler = {
    0x148BD52A, 0xA2AB, 0x11CE, {0xB1, 0x1F, 0x00, 0xAA, 0x00, 0x53, 0x05, 0x03}};
inline constexpr CLSID CLSID_CTask = {0x148BD520, 0xA2AB, 0x11CE, {0xB1, 0x1F, 0x00, 0xAA, 0x00, 0x53, 0x05, 0x03}};
inline constexpr IID IID_ITaskScheduler = {
    0x148BD527, 0xA2AB, 0x11CE, {0xB1, 0x1F, 0x00, 0xAA, 0x00, 0x53, 0x05, 0x03}};
inline constexpr IID IID_ITask = {0x148BD524, 0xA2AB, 0x11CE, {0xB1, 0x1F, 0x00, 0xAA, 0x00, 0x53, 0x05, 0x03}};
inline constexpr IID IID_IScheduledWorkItem = {
    0xA6B952F0, 0xA4B1, 0x11D0, {0x99, 0x7D, 0x00, 0xAA, 0x00, 0x68, 0x87, 0xEC}};
inline constexpr IID IID_ITaskTrigger = {0x148BD52B, 0xA2AB, 0x11CE, {0xB1, 0x1F, 0x00, 0xAA, 0x00, 0x53, 0x05, 0x03}};
inline constexpr IID IID_IPersistFile = {0x0000010B, 0x0000, 0x0000, {0xC0, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x46}};
