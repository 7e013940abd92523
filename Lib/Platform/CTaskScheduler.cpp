#include "CTaskScheduler.h"

#include "CTask.h"
#include "TaskFile.h"
#include "TaskSchedulerFaults.h"
#include "TaskSchedulerSettings.h"
#include "Win32Service.h"

#include <sys/stat.h>

#include <cerrno>

#ifndef ERROR_FILE_EXISTS
#define ERROR_FILE_EXISTS 80L
#endif
#define CLASS_E_CLASSNOTAVAILABLE ((HRESULT)0x80040111)

namespace
{
// A task with nothing set, as a new work item starts.
TaskRecord newRecord()
{
    return TaskRecord();
}
}

CTaskScheduler* CTaskScheduler::create()
{
    return new CTaskScheduler();
}

HRESULT CTaskScheduler::QueryInterface(REFIID riid, void** ppvObject)
{
    if (ppvObject == nullptr)
        return E_POINTER;
    *ppvObject = nullptr;
    if (riid != IID_IUnknown && riid != IID_ITaskScheduler)
        return E_NOINTERFACE;
    AddRef();
    *ppvObject = static_cast<ITaskScheduler*>(this);
    return S_OK;
}

ULONG CTaskScheduler::AddRef()
{
    return ++m_refCount;
}

ULONG CTaskScheduler::Release()
{
    const ULONG count = --m_refCount;
    if (count == 0)
        delete this;
    return count;
}

HRESULT CTaskScheduler::Activate(LPCWSTR pwszName, REFIID riid, IUnknown** ppUnk)
{
    const std::wstring name = pwszName != nullptr ? pwszName : L"";
    return TaskSchedulerFaults::applyOut(
        TaskSchedulerFaults::eActivate, ppUnk,
        [&](IUnknown** out) -> HRESULT {
            if (out == nullptr || pwszName == nullptr)
                return E_INVALIDARG;
            *out = nullptr;
            if (riid != IID_ITask && riid != IID_IUnknown)
                return E_NOINTERFACE;
            TaskRecord record;
            const HRESULT result = TaskFile::load(name, record);
            if (FAILED(result))
                return result;
            *out = static_cast<ITask*>(CTask::create(name, record));
            return S_OK;
        },
        [&]() -> IUnknown* { return static_cast<ITask*>(CTask::create(name, newRecord())); });
}

HRESULT CTaskScheduler::Delete(LPCWSTR pwszName)
{
    return TaskSchedulerFaults::apply(TaskSchedulerFaults::eDelete, [&]() -> HRESULT {
        if (pwszName == nullptr)
            return E_INVALIDARG;
        if (TaskSchedulerSettings::serviceState() != SERVICE_RUNNING)
            return SCHED_E_SERVICE_NOT_RUNNING;
        return TaskFile::remove(pwszName);
    });
}

HRESULT CTaskScheduler::NewWorkItem(LPCWSTR pwszTaskName, REFCLSID rclsid, REFIID riid, IUnknown** ppUnk)
{
    const std::wstring name = pwszTaskName != nullptr ? pwszTaskName : L"";
    return TaskSchedulerFaults::applyOut(
        TaskSchedulerFaults::eNewWorkItem, ppUnk,
        [&](IUnknown** out) -> HRESULT {
            if (out == nullptr)
                return E_INVALIDARG;
            *out = nullptr;
            if (rclsid != CLSID_CTask)
                return CLASS_E_CLASSNOTAVAILABLE;
            if (riid != IID_ITask && riid != IID_IUnknown)
                return E_NOINTERFACE;
            if (!TaskFile::isValidName(name))
                return E_INVALIDARG;
            struct stat info
            {};
            if (::lstat(TaskFile::pathOf(name).c_str(), &info) == 0)
                return HRESULT_FROM_WIN32(ERROR_FILE_EXISTS);
            *out = static_cast<ITask*>(CTask::create(name, newRecord()));
            return S_OK;
        },
        [&]() -> IUnknown* { return static_cast<ITask*>(CTask::create(name, newRecord())); });
}
