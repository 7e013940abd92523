#pragma once

#include "CheckConfigurationScheduledTaskResult.h"
#include "Export.h"
#include "ScheduledTaskParams.h"
#include "TesselLog_Static.h"

#include <ace/SString.h>

class ITask;
class ITaskScheduler;

// The log function of the scheduled task helper, set to TesselLog_Static::log_static when
// the library is loaded; null logs nothing.
extern TESSEL_EXPORT TesselLogFunction s_logFunction;

// Creates, deletes and checks the current user's scheduled task described by the parameters.
// Each operation opens and closes its own COM objects.
class TESSEL_EXPORT CScheduledTaskHelper
{
public:
    // `params` is owned by the caller and must outlive the helper.
    explicit CScheduledTaskHelper(ScheduledTaskParams& params);
    virtual ~CScheduledTaskHelper();

    // True when the "Schedule" service is running.
    static bool checkSchedulerServiceRunning();

    // True when the task was saved (newly made, or an existing one rewritten unless
    // `failIfAlreadyExists`).
    virtual bool createScheduledTask(bool failIfAlreadyExists);
    // True when the task is gone, or its deletion failed and `failIfNotExists` is false.
    virtual bool deleteScheduledTask(bool failIfNotExists);
    // True when the question could be answered; `taskExists` is then written. `accessDenied`
    // tells that the task seems to exist but cannot be opened.
    virtual bool checkTaskAvailableForCurrentUser(bool& taskExists, bool& accessDenied);
    virtual OnlineUpdateCommand_NS::_enum_CheckConfigurationScheduledTaskResult checkScheduledTask();

private:
    ScheduledTaskParams& m_rParams;
};

// Opens the task named by the parameters. True when the answer is clear: a task in
// `rTaskPtr` (found), none (absent), or none with `accessDenied` set. Whatever `rTaskPtr`
// held is released first; a task handed back is owned by the caller.
TESSEL_EXPORT bool getExistingTask(ITaskScheduler* rTaskSchedPtr, const ScheduledTaskParams& rParams, ITask*& rTaskPtr,
                                   bool& accessDenied);

// The absolute form of `path` with the ASCII letters lowered; empty when it has none.
TESSEL_EXPORT ACE_WString getAbsolutePathLowercase(const wchar_t* path);
