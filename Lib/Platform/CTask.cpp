#include "CTask.h"

#include "CTaskTrigger.h"
#include "TaskFile.h"
#include "TaskSchedulerFaults.h"
#include "TaskSchedulerSettings.h"
#include "Win32Service.h"
#include "Win32System.h"

#include <algorithm>
#include <cstring>
#include <cwchar>

namespace
{
// A copy of `text` in task memory, for the caller to free with CoTaskMemFree.
LPWSTR taskMemCopy(const std::wstring& text)
{
    auto* copy = static_cast<LPWSTR>(CoTaskMemAlloc((text.size() + 1) * sizeof(wchar_t)));
    if (copy != nullptr)
        std::wmemcpy(copy, text.c_str(), text.size() + 1);
    return copy;
}

HRESULT copyOut(const std::wstring& text, LPWSTR* out)
{
    if (out == nullptr)
        return E_INVALIDARG;
    *out = taskMemCopy(text);
    return *out != nullptr ? S_OK : E_OUTOFMEMORY;
}

LPWSTR blankString()
{
    return taskMemCopy(std::wstring());
}

// A new trigger starts today at the current time and runs once.
TASK_TRIGGER defaultTrigger()
{
    SYSTEMTIME now{};
    GetLocalTime(&now);
    TASK_TRIGGER trigger;
    std::memset(&trigger, 0, sizeof trigger);
    trigger.cbTriggerSize = sizeof(TASK_TRIGGER);
    trigger.wBeginYear = now.wYear;
    trigger.wBeginMonth = now.wMonth;
    trigger.wBeginDay = now.wDay;
    trigger.wStartHour = now.wHour;
    trigger.wStartMinute = now.wMinute;
    trigger.TriggerType = TASK_TIME_TRIGGER_ONCE;
    return trigger;
}
}

CTask* CTask::create(const std::wstring& name, const TaskRecord& record)
{
    return new CTask(name, record);
}

CTask::CTask(const std::wstring& name, const TaskRecord& record) : m_name(name), m_record(record)
{
    for (size_t i = 0; i < m_record.triggers.size(); ++i)
        m_triggerIds.push_back(m_nextTriggerId++);
}

HRESULT CTask::QueryInterface(REFIID riid, void** ppvObject)
{
    return TaskSchedulerFaults::applyOut(
        TaskSchedulerFaults::eQueryInterface, ppvObject,
        [&](void** out) -> HRESULT {
            if (out == nullptr)
                return E_POINTER;
            *out = nullptr;
            if (riid == IID_IUnknown || riid == IID_ITask || riid == IID_IScheduledWorkItem)
                *out = static_cast<ITask*>(this);
            else if (riid == IID_IPersistFile)
                *out = static_cast<IPersistFile*>(this);
            else
                return E_NOINTERFACE;
            AddRef();
            return S_OK;
        },
        [&]() -> void* {
            AddRef();
            return riid == IID_IPersistFile ? static_cast<void*>(static_cast<IPersistFile*>(this))
                                            : static_cast<void*>(static_cast<ITask*>(this));
        });
}

ULONG CTask::AddRef()
{
    return ++m_refCount;
}

ULONG CTask::Release()
{
    const ULONG count = --m_refCount;
    if (count == 0)
        delete this;
    return count;
}

HRESULT CTask::makeTrigger(WORD index, ITaskTrigger** ppTrigger)
{
    *ppTrigger = CTaskTrigger::create(this, m_triggerIds[index]);
    return S_OK;
}

HRESULT CTask::CreateTrigger(WORD* piNewTrigger, ITaskTrigger** ppTrigger)
{
    return TaskSchedulerFaults::applyOut(
        TaskSchedulerFaults::eCreateTrigger, ppTrigger,
        [&](ITaskTrigger** out) -> HRESULT {
            if (piNewTrigger == nullptr || out == nullptr)
                return E_INVALIDARG;
            std::lock_guard<std::mutex> lock(m_mutex);
            if (m_record.triggers.size() >= 0xFFFF)
                return E_OUTOFMEMORY;
            m_record.triggers.push_back(defaultTrigger());
            m_triggerIds.push_back(m_nextTriggerId++);
            *piNewTrigger = static_cast<WORD>(m_record.triggers.size() - 1);
            return makeTrigger(*piNewTrigger, out);
        },
        [&]() -> ITaskTrigger* { return CTaskTrigger::create(this, 0); });
}

HRESULT CTask::DeleteTrigger(WORD iTrigger)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eDeleteTrigger, [&]() -> HRESULT {
        std::lock_guard<std::mutex> lock(m_mutex);
        if (iTrigger >= m_record.triggers.size())
            return E_INVALIDARG;
        m_record.triggers.erase(m_record.triggers.begin() + iTrigger);
        m_triggerIds.erase(m_triggerIds.begin() + iTrigger);
        return S_OK;
    });
}

HRESULT CTask::GetTriggerCount(WORD* pwCount)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eGetTriggerCount, [&]() -> HRESULT {
        if (pwCount == nullptr)
            return E_INVALIDARG;
        std::lock_guard<std::mutex> lock(m_mutex);
        *pwCount = static_cast<WORD>(m_record.triggers.size());
        return S_OK;
    });
}

HRESULT CTask::GetTrigger(WORD iTrigger, ITaskTrigger** ppTrigger)
{
    return TaskSchedulerFaults::applyOut(
        TaskSchedulerFaults::eGetTrigger, ppTrigger,
        [&](ITaskTrigger** out) -> HRESULT {
            if (out == nullptr)
                return E_INVALIDARG;
            *out = nullptr;
            std::lock_guard<std::mutex> lock(m_mutex);
            if (iTrigger >= m_record.triggers.size())
                return SCHED_E_TRIGGER_NOT_FOUND;
            return makeTrigger(iTrigger, out);
        },
        [&]() -> ITaskTrigger* { return CTaskTrigger::create(this, 0); });
}

HRESULT CTask::GetStatus(HRESULT* phrStatus)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eGetStatus, [&]() -> HRESULT {
        if (phrStatus == nullptr)
            return E_INVALIDARG;
        std::lock_guard<std::mutex> lock(m_mutex);
        const bool anyEnabled =
            std::any_of(m_record.triggers.begin(), m_record.triggers.end(),
                        [](const TASK_TRIGGER& t) { return (t.rgFlags & TASK_TRIGGER_FLAG_DISABLED) == 0; });
        if ((m_record.flags & TASK_FLAG_DISABLED) != 0)
            *phrStatus = SCHED_S_TASK_DISABLED;
        else if (!anyEnabled)
            *phrStatus = SCHED_S_TASK_NO_VALID_TRIGGERS;
        else
            *phrStatus = m_record.status;
        return S_OK;
    });
}

HRESULT CTask::SetAccountInformation(LPCWSTR pwszAccountName, LPCWSTR /*pwszPassword*/)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eSetAccountInformation, [&]() -> HRESULT {
        if (pwszAccountName == nullptr)
            return E_INVALIDARG;
        std::lock_guard<std::mutex> lock(m_mutex);
        m_record.account = pwszAccountName;
        return S_OK;
    });
}

HRESULT CTask::SetFlags(DWORD dwFlags)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eSetFlags, [&]() -> HRESULT {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_record.flags = dwFlags;
        return S_OK;
    });
}

HRESULT CTask::GetFlags(DWORD* pdwFlags)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eGetFlags, [&]() -> HRESULT {
        if (pdwFlags == nullptr)
            return E_INVALIDARG;
        std::lock_guard<std::mutex> lock(m_mutex);
        *pdwFlags = m_record.flags;
        return S_OK;
    });
}

HRESULT CTask::SetApplicationName(LPCWSTR pwszApplicationName)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eSetApplicationName, [&]() -> HRESULT {
        if (pwszApplicationName == nullptr)
            return E_INVALIDARG;
        std::lock_guard<std::mutex> lock(m_mutex);
        m_record.applicationName = pwszApplicationName;
        return S_OK;
    });
}

HRESULT CTask::GetApplicationName(LPWSTR* ppwszApplicationName)
{
    return TaskSchedulerFaults::applyOut(
        TaskSchedulerFaults::eGetApplicationName, ppwszApplicationName,
        [&](LPWSTR* out) -> HRESULT {
            std::lock_guard<std::mutex> lock(m_mutex);
            return copyOut(m_record.applicationName, out);
        },
        blankString);
}

HRESULT CTask::SetParameters(LPCWSTR pwszParameters)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eSetParameters, [&]() -> HRESULT {
        if (pwszParameters == nullptr)
            return E_INVALIDARG;
        std::lock_guard<std::mutex> lock(m_mutex);
        m_record.parameters = pwszParameters;
        return S_OK;
    });
}

HRESULT CTask::GetParameters(LPWSTR* ppwszParameters)
{
    return TaskSchedulerFaults::applyOut(
        TaskSchedulerFaults::eGetParameters, ppwszParameters,
        [&](LPWSTR* out) -> HRESULT {
            std::lock_guard<std::mutex> lock(m_mutex);
            return copyOut(m_record.parameters, out);
        },
        blankString);
}

HRESULT CTask::Save(LPCWSTR pszFileName, BOOL /*fRemember*/)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eSave, [&]() -> HRESULT {
        // Only the task's own file is written.
        if (pszFileName != nullptr)
            return E_INVALIDARG;
        if (TaskSchedulerSettings::serviceState() != SERVICE_RUNNING)
            return SCHED_E_SERVICE_NOT_RUNNING;
        std::lock_guard<std::mutex> lock(m_mutex);
        return TaskFile::save(m_name, m_record);
    });
}

HRESULT CTask::readTrigger(unsigned triggerId, TASK_TRIGGER& trigger)
{
    std::lock_guard<std::mutex> lock(m_mutex);
    const auto it = std::find(m_triggerIds.begin(), m_triggerIds.end(), triggerId);
    if (it == m_triggerIds.end())
        return SCHED_E_TRIGGER_NOT_FOUND;
    trigger = m_record.triggers[static_cast<size_t>(it - m_triggerIds.begin())];
    return S_OK;
}

HRESULT CTask::writeTrigger(unsigned triggerId, const TASK_TRIGGER& trigger)
{
    if (!TaskFile::isValidTrigger(trigger))
        return E_INVALIDARG;
    std::lock_guard<std::mutex> lock(m_mutex);
    const auto it = std::find(m_triggerIds.begin(), m_triggerIds.end(), triggerId);
    if (it == m_triggerIds.end())
        return SCHED_E_TRIGGER_NOT_FOUND;
    m_record.triggers[static_cast<size_t>(it - m_triggerIds.begin())] = trigger;
    return S_OK;
}
