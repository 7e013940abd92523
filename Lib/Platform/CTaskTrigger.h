#pragma once

#include "ComPtr.h"
#include "ITaskTrigger.h"

#include <atomic>

class CTask;

// A trigger of a task held in memory, found by an identifier that stays with the trigger when
// others are deleted.
class CTaskTrigger final : public ITaskTrigger
{
public:
    // A new object with one reference, owned by the caller.
    static CTaskTrigger* create(CTask* task, unsigned triggerId);

    HRESULT QueryInterface(REFIID riid, void** ppvObject) override;
    ULONG AddRef() override;
    ULONG Release() override;
    HRESULT SetTrigger(const PTASK_TRIGGER pTrigger) override;
    HRESULT GetTrigger(PTASK_TRIGGER pTrigger) override;

private:
    CTaskTrigger(CTask* task, unsigned triggerId);
    ~CTaskTrigger() = default;

    std::atomic<ULONG> m_refCount{1};
    ComPtr<CTask> m_task;
    unsigned m_triggerId;
};
