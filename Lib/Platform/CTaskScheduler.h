#pragma once

#include "ITaskScheduler.h"

#include <atomic>

// The scheduler over the tasks folder of TaskSchedulerSettings.
class CTaskScheduler final : public ITaskScheduler
{
public:
    // A new object with one reference, owned by the caller.
    static CTaskScheduler* create();

    HRESULT QueryInterface(REFIID riid, void** ppvObject) override;
    ULONG AddRef() override;
    ULONG Release() override;
    HRESULT Activate(LPCWSTR pwszName, REFIID riid, IUnknown** ppUnk) override;
    HRESULT Delete(LPCWSTR pwszName) override;
    HRESULT NewWorkItem(LPCWSTR pwszTaskName, REFCLSID rclsid, REFIID riid, IUnknown** ppUnk) override;

private:
    CTaskScheduler() = default;
    ~CTaskScheduler() = default;

    std::atomic<ULONG> m_refCount{1};
};
