#include "CTaskTrigger.h"

#include "CTask.h"
#include "TaskSchedulerFaults.h"

CTaskTrigger* CTaskTrigger::create(CTask* task, unsigned triggerId)
{
    return new CTaskTrigger(task, triggerId);
}

CTaskTrigger::CTaskTrigger(CTask* task, unsigned triggerId) : m_triggerId(triggerId)
{
    task->AddRef();
    m_task.reset(task);
}

HRESULT CTaskTrigger::QueryInterface(REFIID riid, void** ppvObject)
{
    if (ppvObject == nullptr)
        return E_POINTER;
    *ppvObject = nullptr;
    if (riid != IID_IUnknown && riid != IID_ITaskTrigger)
        return E_NOINTERFACE;
    AddRef();
    *ppvObject = static_cast<ITaskTrigger*>(this);
    return S_OK;
}

ULONG CTaskTrigger::AddRef()
{
    return ++m_refCount;
}

ULONG CTaskTrigger::Release()
{
    const ULONG count = --m_refCount;
    if (count == 0)
        delete this;
    return count;
}

HRESULT CTaskTrigger::SetTrigger(const PTASK_TRIGGER pTrigger)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eTriggerSetTrigger, [&]() -> HRESULT {
        if (pTrigger == nullptr)
            return E_INVALIDARG;
        return m_task->writeTrigger(m_triggerId, *pTrigger);
    });
}

HRESULT CTaskTrigger::GetTrigger(PTASK_TRIGGER pTrigger)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eTriggerGetTrigger, [&]() -> HRESULT {
        if (pTrigger == nullptr)
            return E_INVALIDARG;
        return m_task->readTrigger(m_triggerId, *pTrigger);
    });
}
