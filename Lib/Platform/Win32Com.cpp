#include "Win32Com.h"

#include "CTaskScheduler.h"
#include "TaskSchedulerFaults.h"

#include <cstdlib>

namespace
{
// Unmatched CoInitialize calls of this thread.
thread_local int t_initializeCount = 0;
}

HRESULT CoInitialize(LPVOID /*reserved*/)
{
    if (const auto fault = TaskSchedulerFaults::take(TaskSchedulerFaults::eCoInitialize))
    {
        if (FAILED(fault->result))
            return fault->result;
        ++t_initializeCount;
        return fault->result;
    }
    return t_initializeCount++ == 0 ? S_OK : S_FALSE;
}

void CoUninitialize()
{
    if (t_initializeCount > 0)
        --t_initializeCount;
}

int CoGetInitializeCount()
{
    return t_initializeCount;
}

HRESULT CoCreateInstance(REFCLSID rclsid, IUnknown* outer, DWORD clsContext, REFIID riid, LPVOID* ppv)
{
    return TaskSchedulerFaults::applyOut(
        TaskSchedulerFaults::eCoCreateInstance, ppv,
        [&](LPVOID* out) -> HRESULT {
            if (out == nullptr)
                return E_POINTER;
            *out = nullptr;
            if (t_initializeCount == 0)
                return CO_E_NOTINITIALIZED;
            if (outer != nullptr)
                return CLASS_E_NOAGGREGATION;
            if (rclsid != CLSID_CTaskScheduler || (clsContext & CLSCTX_INPROC_SERVER) == 0)
                return REGDB_E_CLASSNOTREG;
            if (riid != IID_ITaskScheduler && riid != IID_IUnknown)
                return E_NOINTERFACE;
            *out = static_cast<ITaskScheduler*>(CTaskScheduler::create());
            return S_OK;
        },
        []() -> LPVOID { return static_cast<ITaskScheduler*>(CTaskScheduler::create()); });
}

LPVOID CoTaskMemAlloc(size_t size)
{
    return std::malloc(size == 0 ? 1 : size);
}

void CoTaskMemFree(LPVOID pv)
{
    std::free(pv);
}
