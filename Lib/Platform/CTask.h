#pragma once

#include "IPersistFile.h"
#include "ITask.h"
#include "TaskRecord.h"

#include <atomic>
#include <mutex>
#include <string>
#include <vector>

// A task held in memory, opened from its file or newly made; Save writes it back.
class CTask final : public ITask, public IPersistFile
{
public:
    // A new object with one reference, owned by the caller.
    static CTask* create(const std::wstring& name, const TaskRecord& record);

    // IUnknown
    HRESULT QueryInterface(REFIID riid, void** ppvObject) override;
    ULONG AddRef() override;
    ULONG Release() override;

    // IScheduledWorkItem
    HRESULT CreateTrigger(WORD* piNewTrigger, ITaskTrigger** ppTrigger) override;
    HRESULT DeleteTrigger(WORD iTrigger) override;
    HRESULT GetTriggerCount(WORD* pwCount) override;
    HRESULT GetTrigger(WORD iTrigger, ITaskTrigger** ppTrigger) override;
    HRESULT GetStatus(HRESULT* phrStatus) override;
    HRESULT SetAccountInformation(LPCWSTR pwszAccountName, LPCWSTR pwszPassword) override;
    HRESULT SetFlags(DWORD dwFlags) override;
    HRESULT GetFlags(DWORD* pdwFlags) override;

    // ITask
    HRESULT SetApplicationName(LPCWSTR pwszApplicationName) override;
    HRESULT GetApplicationName(LPWSTR* ppwszApplicationName) override;
    HRESULT SetParameters(LPCWSTR pwszParameters) override;
    HRESULT GetParameters(LPWSTR* ppwszParameters) override;

    // IPersistFile
    HRESULT Save(LPCWSTR pszFileName, BOOL fRemember) override;

    // For the task's triggers: SCHED_E_TRIGGER_NOT_FOUND once the trigger was deleted.
    HRESULT readTrigger(unsigned triggerId, TASK_TRIGGER& trigger);
    HRESULT writeTrigger(unsigned triggerId, const TASK_TRIGGER& trigger);

private:
    CTask(const std::wstring& name, const TaskRecord& record);
    ~CTask() = default;

    HRESULT makeTrigger(WORD index, ITaskTrigger** ppTrigger);

    std::atomic<ULONG> m_refCount{1};
    std::mutex m_mutex;
    const std::wstring m_name;
    TaskRecord m_record;
    // Identifier of each trigger of m_record, in the same order.
    std::vector<unsigned> m_triggerIds;
    unsigned m_nextTriggerId = 1;
};
