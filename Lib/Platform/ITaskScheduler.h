#pragma once

#include "IUnknown.h"
#include "TaskSchedulerTypes.h"

// The scheduler: opens, makes and removes tasks by name.
class ITaskScheduler : public IUnknown
{
public:
    // Opens a saved task. 0x80070002 when there is none, E_ACCESSDENIED when it belongs to
    // another account, SCHED_E_UNKNOWN_OBJECT_VERSION when its file is damaged.
    virtual HRESULT Activate(LPCWSTR pwszName, REFIID riid, IUnknown** ppUnk) = 0;
    virtual HRESULT Delete(LPCWSTR pwszName) = 0;
    // Makes a new task in memory; its Save writes it. 0x80070050 when the name is taken.
    virtual HRESULT NewWorkItem(LPCWSTR pwszTaskName, REFCLSID rclsid, REFIID riid, IUnknown** ppUnk) = 0;

protected:
    ~ITaskScheduler() = default;
};
