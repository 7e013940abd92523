#include "Win32Service.h"

#include "TaskSchedulerFaults.h"
#include "TaskSchedulerSettings.h"

#include <cstring>
#include <cwctype>
#include <map>
#include <memory>
#include <mutex>
#include <string>

// An open handle: the manager, or one service.
struct SC_HANDLE__
{
    bool isManager = false;
    std::wstring serviceName;
};

namespace
{
const wchar_t kScheduleService[] = L"Schedule";

// Every open handle, owned here until CloseServiceHandle.
struct HandleTable
{
    std::mutex mutex;
    std::map<SC_HANDLE, std::unique_ptr<SC_HANDLE__>> handles;
};

HandleTable& handleTable()
{
    static HandleTable instance;
    return instance;
}

SC_HANDLE addHandle(std::unique_ptr<SC_HANDLE__> handle)
{
    HandleTable& table = handleTable();
    std::lock_guard<std::mutex> lock(table.mutex);
    SC_HANDLE key = handle.get();
    table.handles.emplace(key, std::move(handle));
    return key;
}

// A copy of the handle's content, if it is open.
bool lookUp(SC_HANDLE handle, SC_HANDLE__& content)
{
    HandleTable& table = handleTable();
    std::lock_guard<std::mutex> lock(table.mutex);
    const auto it = table.handles.find(handle);
    if (it == table.handles.end())
        return false;
    content = *it->second;
    return true;
}

bool sameServiceName(const std::wstring& a, const wchar_t* b)
{
    const size_t length = std::wcslen(b);
    if (a.size() != length)
        return false;
    for (size_t i = 0; i < length; ++i)
        if (std::towlower(a[i]) != std::towlower(b[i]))
            return false;
    return true;
}

bool failWithFault(TaskSchedulerFaults::Call call)
{
    if (const auto fault = TaskSchedulerFaults::take(call))
    {
        SetLastError(static_cast<DWORD>(fault->result));
        return true;
    }
    return false;
}
}

SC_HANDLE OpenSCManagerA(LPCSTR lpMachineName, LPCSTR lpDatabaseName, DWORD /*dwDesiredAccess*/)
{
    if (failWithFault(TaskSchedulerFaults::eOpenSCManager))
        return nullptr;
    if (lpMachineName != nullptr && lpMachineName[0] != '\0')
    {
        SetLastError(RPC_S_SERVER_UNAVAILABLE);
        return nullptr;
    }
    if (lpDatabaseName != nullptr && lpDatabaseName[0] != '\0' && std::strcmp(lpDatabaseName, "ServicesActive") != 0)
    {
        SetLastError(ERROR_INVALID_PARAMETER);
        return nullptr;
    }
    auto handle = std::make_unique<SC_HANDLE__>();
    handle->isManager = true;
    return addHandle(std::move(handle));
}

SC_HANDLE OpenServiceW(SC_HANDLE hSCManager, LPCWSTR lpServiceName, DWORD /*dwDesiredAccess*/)
{
    if (failWithFault(TaskSchedulerFaults::eOpenService))
        return nullptr;
    SC_HANDLE__ manager;
    if (!lookUp(hSCManager, manager) || !manager.isManager)
    {
        SetLastError(ERROR_INVALID_HANDLE);
        return nullptr;
    }
    if (lpServiceName == nullptr)
    {
        SetLastError(ERROR_INVALID_PARAMETER);
        return nullptr;
    }
    if (!sameServiceName(kScheduleService, lpServiceName))
    {
        SetLastError(ERROR_SERVICE_DOES_NOT_EXIST);
        return nullptr;
    }
    auto handle = std::make_unique<SC_HANDLE__>();
    handle->serviceName = kScheduleService;
    return addHandle(std::move(handle));
}

BOOL ControlService(SC_HANDLE hService, DWORD dwControl, LPSERVICE_STATUS lpServiceStatus)
{
    if (failWithFault(TaskSchedulerFaults::eControlService))
        return FALSE;
    SC_HANDLE__ service;
    if (!lookUp(hService, service) || service.isManager)
    {
        SetLastError(ERROR_INVALID_HANDLE);
        return FALSE;
    }
    if (lpServiceStatus == nullptr)
    {
        SetLastError(ERROR_INVALID_PARAMETER);
        return FALSE;
    }
    if (dwControl != SERVICE_CONTROL_INTERROGATE)
    {
        SetLastError(ERROR_INVALID_SERVICE_CONTROL);
        return FALSE;
    }
    std::memset(lpServiceStatus, 0, sizeof(SERVICE_STATUS));
    lpServiceStatus->dwServiceType = SERVICE_WIN32_SHARE_PROCESS;
    lpServiceStatus->dwCurrentState = TaskSchedulerSettings::serviceState();
    if (lpServiceStatus->dwCurrentState == SERVICE_STOPPED)
    {
        SetLastError(ERROR_SERVICE_NOT_ACTIVE);
        return FALSE;
    }
    lpServiceStatus->dwControlsAccepted = SERVICE_CONTROL_STOP;
    return TRUE;
}

BOOL CloseServiceHandle(SC_HANDLE hSCObject)
{
    HandleTable& table = handleTable();
    std::lock_guard<std::mutex> lock(table.mutex);
    if (table.handles.erase(hSCObject) == 0)
    {
        SetLastError(ERROR_INVALID_HANDLE);
        return FALSE;
    }
    return TRUE;
}
