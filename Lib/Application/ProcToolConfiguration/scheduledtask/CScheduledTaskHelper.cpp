#include "CScheduledTaskHelper.h"

#include "ComApartmentScope.h"
#include "ComPtr.h"
#include "IPersistFile.h"
#include "ITask.h"
#include "ITaskScheduler.h"
#include "Win32File.h"
#include "Win32Service.h"
#include "Win32System.h"
#include "_com_error.h"

#include <cstring>

using namespace OnlineUpdateCommand_NS;

TesselLogFunction s_logFunction = &TesselLog_Static::log_static;

namespace
{
const int kFailure = 16;
const int kTolerated = 1;
const HRESULT kFileNotFound = static_cast<HRESULT>(0x80070002);
const WORD kDaily = TASK_TIME_TRIGGER_DAILY;

template <typename... Args>
void logLine(int level, const wchar_t* format, Args... args)
{
    const TesselLogFunction log = s_logFunction;
    if (log != nullptr)
        log(level, 0, "ProcToolConfiguration", "ProcToolConfiguration.dll", "OnLineUpdateCommand", format, args...);
}

// An HRESULT as the formats' %lX takes it.
unsigned long hex(HRESULT hr)
{
    return static_cast<unsigned long>(static_cast<uint32_t>(hr));
}

HRESULT createScheduler(ComPtr<ITaskScheduler>& scheduler)
{
    void* object = nullptr;
    const HRESULT hr =
        CoCreateInstance(CLSID_CTaskScheduler, nullptr, CLSCTX_INPROC_SERVER, IID_ITaskScheduler, &object);
    scheduler.reset(static_cast<ITaskScheduler*>(object));
    return hr;
}

// A string handed out by a task, copied and freed.
ACE_WString takeTaskString(LPWSTR text)
{
    ACE_WString copy(text);
    CoTaskMemFree(text);
    return copy;
}
}

CScheduledTaskHelper::CScheduledTaskHelper(ScheduledTaskParams& params) : m_rParams(params)
{
}

CScheduledTaskHelper::~CScheduledTaskHelper() = default;

bool CScheduledTaskHelper::checkSchedulerServiceRunning()
{
    SC_HANDLE manager = OpenSCManagerA(nullptr, nullptr, SC_MANAGER_ENUMERATE_SERVICE);
    if (manager == nullptr)
    {
        logLine(
            kFailure,
            L"CScheduledTaskHelper::checkSchedulerServiceRunning: error getting service manager, last error is '%li'",
            static_cast<long>(GetLastError()));
        return false;
    }
    const wchar_t* serviceName = L"Schedule";
    SC_HANDLE service = OpenServiceW(manager, serviceName, SERVICE_INTERROGATE);
    if (service == nullptr)
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::checkSchedulerServiceRunning: fail getting service '%s', last error is '%li'",
                serviceName, static_cast<long>(GetLastError()));
        CloseServiceHandle(manager);
        return false;
    }
    SERVICE_STATUS status;
    std::memset(&status, 0, sizeof status);
    bool running = false;
    if (!ControlService(service, SERVICE_CONTROL_INTERROGATE, &status))
    {
        logLine(
            kFailure,
            L"CScheduledTaskHelper::checkSchedulerServiceRunning: fail getting status for service '%s', last error is "
            L"%li",
            serviceName, static_cast<long>(GetLastError()));
    }
    else if (status.dwCurrentState == SERVICE_RUNNING)
    {
        running = true;
    }
    else
    {
        logLine(kFailure, L"CScheduledTaskHelper::checkSchedulerServiceRunning: service '%s' is not running",
                serviceName);
    }
    CloseServiceHandle(service);
    CloseServiceHandle(manager);
    return running;
}

bool getExistingTask(ITaskScheduler* rTaskSchedPtr, const ScheduledTaskParams& rParams, ITask*& rTaskPtr,
                     bool& accessDenied)
{
    if (rTaskPtr != nullptr)
    {
        rTaskPtr->Release();
        rTaskPtr = nullptr;
    }
    accessDenied = false;
    if (!rParams.isValid())
    {
        logLine(kFailure, L"getExistingTask: rParams is not valid");
        return false;
    }
    if (rTaskSchedPtr == nullptr)
    {
        logLine(kFailure, L"getExistingTask: rTaskSchedPtr is NULL");
        return false;
    }

    const ACE_WString taskName = rParams.getTaskName();
    IUnknown* unknown = nullptr;
    const HRESULT hr = rTaskSchedPtr->Activate(taskName.c_str(), IID_ITask, &unknown);
    rTaskPtr = static_cast<ITask*>(unknown);

    switch (hr)
    {
    case S_OK:
        if (rTaskPtr == nullptr)
        {
            logLine(kFailure, L"getExistingTask: rTaskSchedPtr->Activate('%s') returns S_OK but rTaskPtr is NULL",
                    taskName.c_str());
            return false;
        }
        return true;
    case kFileNotFound:
        if (rTaskPtr != nullptr)
        {
            logLine(
                kFailure,
                L"getExistingTask: rTaskSchedPtr->Activate('%s') return COR_E_FILENOTFOUND but rTaskPtr is not NULL",
                taskName.c_str());
            return false;
        }
        return true;
    case E_ACCESSDENIED:
        logLine(
            kTolerated,
            L"getExistingTask: rTaskSchedPtr->Activate('%s') failed with HRESULT '0x%lX' ('%S') - most likely tasks "
            L"exists but we don't have privileges to access it",
            taskName.c_str(), hex(hr), _com_error(hr).ErrorMessage());
        accessDenied = true;
        return true;
    case E_OUTOFMEMORY:
    case E_INVALIDARG:
    case SCHED_E_UNKNOWN_OBJECT_VERSION:
        logLine(kFailure,
                L"getExistingTask: rTaskSchedPtr->Activate('%s') failed with documented HRESULT '0x%lX' ('%S')",
                taskName.c_str(), hex(hr), _com_error(hr).ErrorMessage());
        return false;
    default:
        logLine(kFailure,
                L"getExistingTask: rTaskSchedPtr->Activate('%s') failed with undocumented HRESULT '0x%lX' ('%S')",
                taskName.c_str(), hex(hr), _com_error(hr).ErrorMessage());
        return false;
    }
}

ACE_WString getAbsolutePathLowercase(const wchar_t* path)
{
    wchar_t absolute[260] = {};
    if (_wfullpath(absolute, path, 260) == nullptr)
        return ACE_WString(L"");
    // As the C library's tolower in the default locale: only A to Z change.
    for (wchar_t* c = absolute; *c != L'\0'; ++c)
        if (*c >= L'A' && *c <= L'Z')
            *c = static_cast<wchar_t>(*c - L'A' + L'a');
    return ACE_WString(absolute);
}

bool CScheduledTaskHelper::createScheduledTask(bool failIfAlreadyExists)
{
    if (!m_rParams.isValid())
    {
        logLine(kFailure, L"CScheduledTaskHelper::createScheduledTask: m_rParams is not valid");
        return false;
    }
    const ComApartmentScope apartment;
    ComPtr<ITaskScheduler> scheduler;
    HRESULT hr = createScheduler(scheduler);
    if (FAILED(hr))
    {
        logLine(
            kFailure,
            L"CScheduledTaskHelper::createScheduledTask: CoCreateInstance(CLSID_CTaskScheduler) failed with HRESULT "
            L"'0x%lX' ('%S')",
            hex(hr), _com_error(hr).ErrorMessage());
        return false;
    }
    if (!scheduler)
    {
        logLine(
            kFailure,
            L"CScheduledTaskHelper::createScheduledTask: CoCreateInstance(CLSID_CTaskScheduler) OK but smart pointer "
            L"is NULL");
        return false;
    }

    const ACE_WString taskName = m_rParams.getTaskName();
    ComPtr<ITask> task;
    bool accessDenied = false;
    if (!getExistingTask(scheduler.get(), m_rParams, task.ref(), accessDenied))
    {
        logLine(kFailure, L"CScheduledTaskHelper::createScheduledTask: getExistingTask('%s') failed", taskName.c_str());
        return false;
    }

    if (task)
    {
        if (failIfAlreadyExists)
        {
            logLine(
                kFailure,
                L"CScheduledTaskHelper::createScheduledTask: task '%s' already exists, and flag to fail in this case "
                L"is set",
                taskName.c_str());
            return false;
        }
        logLine(
            kTolerated,
            L"CScheduledTaskHelper::createScheduledTask: task '%s' already exists, and flag to fail in this case is "
            L"not set -> will reuse (possibly updating existing settings)",
            taskName.c_str());
        WORD count = 0;
        hr = task->GetTriggerCount(&count);
        if (FAILED(hr))
        {
            logLine(kFailure,
                    L"CScheduledTaskHelper::createScheduledTask: GetTriggerCount failed with HRESULT '0x%lX' ('%S')",
                    hex(hr), _com_error(hr).ErrorMessage());
            return false;
        }
        // From the last trigger down: each deletion moves the later triggers down by one.
        for (WORD i = count; i > 0; --i)
        {
            const WORD index = static_cast<WORD>(i - 1);
            hr = task->DeleteTrigger(index);
            if (FAILED(hr))
            {
                logLine(kFailure,
                        L"CScheduledTaskHelper::createScheduledTask: DeleteTrigger('%hu') failed with HRESULT '0x%lX' "
                        L"('%S')",
                        static_cast<unsigned int>(index), hex(hr), _com_error(hr).ErrorMessage());
                return false;
            }
        }
        if (!task)
        {
            logLine(kFailure, L"CScheduledTaskHelper::createScheduledTask: ITaskPtr is NULL after 'logic' to manage "
                              L"failIfAlreadyExists flag (it's time to remove this flag and fix client 'design')");
            return false;
        }
    }
    else
    {
        IUnknown* unknown = nullptr;
        hr = scheduler->NewWorkItem(taskName.c_str(), CLSID_CTask, IID_ITask, &unknown);
        task.reset(static_cast<ITask*>(unknown));
        if (FAILED(hr))
        {
            logLine(kFailure,
                    L"CScheduledTaskHelper::createScheduledTask: NewWorkItem('%s') failed with HRESULT '0x%lX' ('%S')",
                    taskName.c_str(), hex(hr), _com_error(hr).ErrorMessage());
            return false;
        }
        if (!task)
        {
            logLine(kFailure, L"CScheduledTaskHelper::createScheduledTask: NewWorkItem OK but smart pointer is NULL");
            return false;
        }
    }

    hr = task->SetApplicationName(m_rParams.applicationPath().c_str());
    if (FAILED(hr))
    {
        logLine(
            kFailure,
            L"CScheduledTaskHelper::createScheduledTask: SetApplicationName('%s') failed with HRESULT '0x%lX' ('%S')",
            m_rParams.applicationPath().c_str(), hex(hr), _com_error(hr).ErrorMessage());
        return false;
    }
    hr = task->SetParameters(m_rParams.parameters().c_str());
    if (FAILED(hr))
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::createScheduledTask: SetParameters('%s') failed with HRESULT '0x%lX' ('%S')",
                m_rParams.parameters().c_str(), hex(hr), _com_error(hr).ErrorMessage());
        return false;
    }
    wchar_t userName[UNLEN + 1] = {};
    DWORD userNameSize = UNLEN + 1;
    if (!GetUserNameW(userName, &userNameSize))
    {
        logLine(kFailure, L"CScheduledTaskHelper::createScheduledTask: GetUserNameW failed with last error '%lu'",
                static_cast<unsigned long>(GetLastError()));
        return false;
    }
    hr = task->SetAccountInformation(userName, nullptr);
    if (FAILED(hr))
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::createScheduledTask: SetAccountInformation('%s') failed with HRESULT '0x%lX'",
                userName, hex(hr));
        return false;
    }
    const DWORD flags = TASK_FLAG_INTERACTIVE | TASK_FLAG_RUN_ONLY_IF_LOGGED_ON;
    hr = task->SetFlags(flags);
    if (FAILED(hr))
    {
        logLine(kFailure, L"CScheduledTaskHelper::createScheduledTask: SetFlags('%lu') failed with HRESULT '0x%lX'",
                static_cast<unsigned long>(flags), hex(hr));
        return false;
    }

    {
        WORD newIndex = 0;
        ComPtr<ITaskTrigger> trigger;
        hr = task->CreateTrigger(&newIndex, &trigger.ref());
        if (FAILED(hr))
        {
            logLine(kFailure,
                    L"CScheduledTaskHelper::createScheduledTask: createTrigger failed with HRESULT '0x%lX' ('%S')",
                    hex(hr), _com_error(hr).ErrorMessage());
            return false;
        }
        if (!trigger)
        {
            logLine(kFailure, L"CScheduledTaskHelper::createScheduledTask: CreateTrigger OK but smart pointer is NULL");
            return false;
        }
        SYSTEMTIME today;
        GetLocalTime(&today);
        TASK_TRIGGER record;
        std::memset(&record, 0, sizeof record);
        record.cbTriggerSize = sizeof(TASK_TRIGGER);
        record.wBeginYear = today.wYear;
        record.wBeginMonth = today.wMonth;
        record.wBeginDay = today.wDay;
        record.wStartHour = static_cast<WORD>(_wtoi(m_rParams.startHour().c_str()));
        record.wStartMinute = static_cast<WORD>(_wtoi(m_rParams.startMinute().c_str()));
        record.TriggerType = TASK_TIME_TRIGGER_DAILY;
        record.Type.Daily.DaysInterval = 1;
        hr = trigger->SetTrigger(&record);
        if (FAILED(hr))
        {
            logLine(kFailure,
                    L"CScheduledTaskHelper::createScheduledTask: SetTrigger failed with HRESULT '0x%lX' ('%S')",
                    hex(hr), _com_error(hr).ErrorMessage());
            return false;
        }
    }

    void* persistObject = nullptr;
    hr = task->QueryInterface(IID_IPersistFile, &persistObject);
    ComPtr<IPersistFile> persistFile(static_cast<IPersistFile*>(persistObject));
    if (FAILED(hr))
    {
        logLine(
            kFailure,
            L"CScheduledTaskHelper::createScheduledTask: QueryInterface(IID_IPersistFile) failed with HRESULT '0x%lX' "
            L"('%S')",
            hex(hr), _com_error(hr).ErrorMessage());
        return false;
    }
    if (!persistFile)
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::createScheduledTask: QueryInterface(IID_IPersistFile) OK but smart pointer is "
                L"NULL");
        return false;
    }
    task.reset();
    hr = persistFile->Save(nullptr, TRUE);
    if (FAILED(hr))
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::createScheduledTask: persistFilePtr->Save failed with HRESULT '0x%lX' ('%S')",
                hex(hr), _com_error(hr).ErrorMessage());
        return false;
    }
    return true;
}

bool CScheduledTaskHelper::deleteScheduledTask(bool failIfNotExists)
{
    if (!m_rParams.isValid())
    {
        logLine(kFailure, L"CScheduledTaskHelper::deleteScheduledTask: m_rParams is not valid");
        return false;
    }
    const ComApartmentScope apartment;
    ComPtr<ITaskScheduler> scheduler;
    HRESULT hr = createScheduler(scheduler);
    if (FAILED(hr))
    {
        logLine(
            kFailure,
            L"CScheduledTaskHelper::deleteScheduledTask: CoCreateInstance(CLSID_CTaskScheduler) failed with HRESULT "
            L"'0x%lX' ('%S')",
            hex(hr), _com_error(hr).ErrorMessage());
        return false;
    }
    if (!scheduler)
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::deleteScheduledTask:CoCreateInstance(CLSID_CTaskScheduler) was OK but smart "
                L"pointer is NULL");
        return false;
    }

    const ACE_WString taskName = m_rParams.getTaskName();
    hr = scheduler->Delete(taskName.c_str());
    if (SUCCEEDED(hr))
        return true;
    if (!failIfNotExists)
    {
        logLine(
            kTolerated,
            L"CScheduledTaskHelper::deleteScheduledTask: ITSPtr->Delete('%s') failed with HRESULT '0x%lX' ('%S'), but "
            L"failIfNotExists is not set",
            taskName.c_str(), hex(hr), _com_error(hr).ErrorMessage());
        return true;
    }
    logLine(kFailure,
            L"CScheduledTaskHelper::deleteScheduledTask: ITSPtr->Delete('%s') failed with HRESULT '0x%lX' ('%S'), and "
            L"failIfNotExists is set",
            taskName.c_str(), hex(hr), _com_error(hr).ErrorMessage());
    return false;
}

bool CScheduledTaskHelper::checkTaskAvailableForCurrentUser(bool& taskExists, bool& accessDenied)
{
    if (!m_rParams.isValid())
    {
        logLine(kFailure, L"CScheduledTaskHelper::checkTaskAvailableForCurrentUser: m_rParams is not valid");
        return false;
    }
    const ComApartmentScope apartment;
    ComPtr<ITaskScheduler> scheduler;
    const HRESULT hr = createScheduler(scheduler);
    if (FAILED(hr))
    {
        logLine(
            kFailure,
            L"CScheduledTaskHelper::checkTaskAvailableForCurrentUser: CoCreateInstance(CLSID_CTaskScheduler) failed "
            L"with HRESULT '0x%lX' ('%S')",
            hex(hr), _com_error(hr).ErrorMessage());
        return false;
    }
    if (!scheduler)
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::checkTaskAvailableForCurrentUser:CoCreateInstance(CLSID_CTaskScheduler) was OK "
                L"but smart pointer is NULL");
        return false;
    }
    ComPtr<ITask> task;
    if (!getExistingTask(scheduler.get(), m_rParams, task.ref(), accessDenied))
        return false;
    taskExists = static_cast<bool>(task);
    return true;
}

_enum_CheckConfigurationScheduledTaskResult CScheduledTaskHelper::checkScheduledTask()
{
    if (!m_rParams.isValid())
    {
        logLine(kFailure, L"CScheduledTaskHelper::checkScheduledTask: m_rParams is not valid");
        return eWRONG_SETTINGS;
    }
    const ComApartmentScope apartment;
    ComPtr<ITaskScheduler> scheduler;
    HRESULT hr = createScheduler(scheduler);
    if (FAILED(hr))
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::checkScheduledTask: CoCreateInstance(CLSID_CTaskScheduler) failed with HRESULT "
                L"'0x%lX' ('%S')",
                hex(hr), _com_error(hr).ErrorMessage());
        return eCAN_NOT_ACCESS_SERVICE;
    }
    if (!scheduler)
    {
        logLine(
            kFailure,
            L"CScheduledTaskHelper::checkScheduledTask: CoCreateInstance(CLSID_CTaskScheduler) OK but smart pointer "
            L"is NULL");
        return eCAN_NOT_ACCESS_SERVICE;
    }

    const ACE_WString taskName = m_rParams.getTaskName();
    ComPtr<ITask> task;
    bool accessDenied = false;
    if (!getExistingTask(scheduler.get(), m_rParams, task.ref(), accessDenied))
    {
        logLine(kFailure, L"CScheduledTaskHelper::checkScheduledTask: getExistingTask('%s') failed", taskName.c_str());
        return eCAN_NOT_ACCESS_SERVICE;
    }
    if (!task)
    {
        if (accessDenied)
        {
            logLine(kFailure,
                    L"CScheduledTaskHelper::checkScheduledTask: task('%s') probably exists but current user rights do "
                    L"not allow to access it (did you change this login from admin to normal user?), and flag to fail "
                    L"if task not found is true",
                    taskName.c_str());
            return eCAN_NOT_ACCESS_SERVICE;
        }
        logLine(
            kFailure,
            L"CScheduledTaskHelper::checkScheduledTask: task('%s') does not exist, and flag to fail if task not found "
            L"is true",
            taskName.c_str());
        return eTASK_NOT_REGISTERED;
    }

    HRESULT status = 0;
    hr = task->GetStatus(&status);
    if (hr != S_OK)
    {
        logLine(kFailure, L"CScheduledTaskHelper::checkScheduledTask: GetStatus failed with HRESULT '0x%lX'", hex(hr));
        return eUNKNOWN_ERROR;
    }
    if (status != SCHED_S_TASK_READY && status != SCHED_S_TASK_RUNNING && status != SCHED_S_TASK_HAS_NOT_RUN)
    {
        logLine(kFailure, L"CScheduledTaskHelper::checkScheduledTask: task has invalid or unknown status '%li'",
                static_cast<long>(status));
        return eWRONG_SETTINGS;
    }

    DWORD flags = 0;
    hr = task->GetFlags(&flags);
    if (FAILED(hr))
    {
        logLine(kFailure, L"CScheduledTaskHelper::checkScheduledTask: GetFlags failed with HRESULT '0x%lX' ('%S')",
                hex(hr), _com_error(hr).ErrorMessage());
        return eUNKNOWN_ERROR;
    }
    if ((flags & TASK_FLAG_RUN_ONLY_IF_LOGGED_ON) == 0)
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::checkScheduledTask: task flags '%lu' not set to run only if logged in, this "
                L"creates message problems",
                static_cast<unsigned long>(flags));
        return eWRONG_SETTINGS;
    }

    LPWSTR text = nullptr;
    hr = task->GetParameters(&text);
    if (FAILED(hr))
    {
        logLine(kFailure, L"CScheduledTaskHelper::checkScheduledTask: GetParameters failed with HRESULT '0x%lX' ('%S')",
                hex(hr), _com_error(hr).ErrorMessage());
        return eUNKNOWN_ERROR;
    }
    if (text == nullptr)
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::checkScheduledTask: GetParameters succeeded but returned NULL string");
        return eUNKNOWN_ERROR;
    }
    const ACE_WString parameters = takeTaskString(text);
    if (parameters != m_rParams.parameters())
    {
        logLine(kTolerated,
                L"CScheduledTaskHelper::checkScheduledTask: invalid startup parameters '%s' - '%s' expected",
                parameters.c_str(), m_rParams.parameters().c_str());
        return eWRONG_SETTINGS;
    }

    text = nullptr;
    hr = task->GetApplicationName(&text);
    if (FAILED(hr))
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::checkScheduledTask: GetApplicationName failed with HRESULT '0x%lX' ('%S')",
                hex(hr), _com_error(hr).ErrorMessage());
        return eUNKNOWN_ERROR;
    }
    if (text == nullptr)
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::checkScheduledTask: GetApplicationName succeeded but returned NULL string");
        return eUNKNOWN_ERROR;
    }
    const ACE_WString application = takeTaskString(text);
    const ACE_WString foundPath = getAbsolutePathLowercase(application.c_str());
    const ACE_WString expectedPath = getAbsolutePathLowercase(m_rParams.applicationPath().c_str());
    // A path that cannot be made absolute ("") matches nothing, not even another such path.
    if (foundPath.is_empty() || expectedPath.is_empty() || foundPath != expectedPath)
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::checkScheduledTask: unexpeted executable '%s' (abs path '%s') - should be '%s' "
                L"with abs path '%s')",
                application.c_str(), foundPath.c_str(), m_rParams.applicationPath().c_str(), expectedPath.c_str());
        return eWRONG_SETTINGS;
    }

    ComPtr<ITaskTrigger> trigger;
    hr = task->GetTrigger(0, &trigger.ref());
    if (FAILED(hr))
    {
        logLine(kFailure,
                L"CScheduledTaskHelper::checkScheduledTask: task->GetTrigger failed with HRESULT '0x%lX' ('%S')",
                hex(hr), _com_error(hr).ErrorMessage());
        return eUNKNOWN_ERROR;
    }
    if (!trigger)
    {
        logLine(kFailure, L"CScheduledTaskHelper::checkScheduledTask: GetTrigger OK but smart pointer is NULL");
        return eUNKNOWN_ERROR;
    }
    TASK_TRIGGER record;
    std::memset(&record, 0, sizeof record);
    record.cbTriggerSize = sizeof(TASK_TRIGGER);
    trigger->GetTrigger(&record);
    if (record.TriggerType != kDaily)
    {
        logLine(kFailure, L"CScheduledTaskHelper::checkScheduledTask: unexpected (not daily) trigger settings '%i'",
                static_cast<int>(record.TriggerType));
        return eWRONG_SETTINGS;
    }

    const WORD expectedHour = static_cast<WORD>(_wtoi(m_rParams.startHour().c_str()));
    const WORD expectedMinute = static_cast<WORD>(_wtoi(m_rParams.startMinute().c_str()));
    if (record.wStartHour == expectedHour && record.wStartMinute == expectedMinute)
        return eOK;
    logLine(kFailure,
            L"CScheduledTaskHelper::checkScheduledTask: unexpected execution time '%02ih:%02im', should be "
            L"'%02ih:%02im' (string: '%sh:%sm')",
            static_cast<int>(record.wStartHour), static_cast<int>(record.wStartMinute), static_cast<int>(expectedHour),
            static_cast<int>(expectedMinute), m_rParams.startHour().c_str(), m_rParams.startMinute().c_str());
    return eWRONG_SETTINGS;
}
