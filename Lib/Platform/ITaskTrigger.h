#pragma once

#include "IUnknown.h"
#include "TaskSchedulerTypes.h"

// One trigger of a task. SetTrigger changes the task held in memory; the task's Save keeps it.
class ITaskTrigger : public IUnknown
{
public:
    virtual HRESULT SetTrigger(const PTASK_TRIGGER pTrigger) = 0;
    virtual HRESULT GetTrigger(PTASK_TRIGGER pTrigger) = 0;

protected:
    ~ITaskTrigger() = default;
};
