#include "EffectiveUser.h"
#include "TaskFile.h"
#include "TaskScheduler.h"
#include "TempDir.h"
#include "Triggers.h"
#include "WideString.h"
#include "Win32Service.h"
#include "Win32System.h"
#include "_com_error.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstring>
#include <filesystem>

namespace
{
TASK_TRIGGER read(ITaskTrigger* trigger, HRESULT expected = S_OK)
{
    TASK_TRIGGER record = makeTrigger(0, 0, 2);
    EXPECT_EQ(expected, trigger->GetTrigger(&record));
    return record;
}

class TaskSchedulerLayer : public ::testing::Test
{
protected:
    void SetUp() override
    {
        TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks"));
        ASSERT_EQ(S_OK, CoInitialize(nullptr));
        void* object = nullptr;
        ASSERT_EQ(S_OK,
                  CoCreateInstance(CLSID_CTaskScheduler, nullptr, CLSCTX_INPROC_SERVER, IID_ITaskScheduler, &object));
        m_scheduler.reset(static_cast<ITaskScheduler*>(object));
    }
    void TearDown() override
    {
        m_scheduler.reset();
        CoUninitialize();
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerSettings::setTasksFolder(std::string());
    }
    // A new task (create) or a saved one; null when the scheduler refuses, with its answer in `hr`.
    ComPtr<ITask> task(const wchar_t* name, bool create = true, HRESULT* hr = nullptr)
    {
        IUnknown* unknown = nullptr;
        const HRESULT result = create ? m_scheduler->NewWorkItem(name, CLSID_CTask, IID_ITask, &unknown)
                                      : m_scheduler->Activate(name, IID_ITask, &unknown);
        if (hr != nullptr)
            *hr = result;
        return ComPtr<ITask>(static_cast<ITask*>(unknown));
    }
    static HRESULT save(ITask* task)
    {
        void* object = nullptr;
        EXPECT_EQ(S_OK, task->QueryInterface(IID_IPersistFile, &object));
        return ComPtr<IPersistFile>(static_cast<IPersistFile*>(object))->Save(nullptr, TRUE);
    }
    static ComPtr<ITaskTrigger> addTrigger(ITask* task, TASK_TRIGGER record)
    {
        WORD index = 999;
        ComPtr<ITaskTrigger> trigger;
        EXPECT_EQ(S_OK, task->CreateTrigger(&index, &trigger.ref()));
        EXPECT_EQ(S_OK, trigger->SetTrigger(&record));
        return trigger;
    }
    TempDir m_dir;
    ComPtr<ITaskScheduler> m_scheduler;
};
}

// The daily trigger is the application's; the other kinds have fields of their own. Only the task
// file is left: no temporary file.
TEST_F(TaskSchedulerLayer, SavedTriggersOfEveryKindReadBack)
{
    ComPtr<ITask> created = task(L"Round trip \u00e9");
    TASK_TRIGGER t[3] = {makeTrigger(0, 0, 2), makeTrigger(12, 30, 2), makeTrigger(1, 1, 2)};
    t[0].TriggerType = TASK_TIME_TRIGGER_WEEKLY, t[0].Type.Weekly.WeeksInterval = 3;
    t[0].Type.Weekly.rgfDaysOfTheWeek = 0x41, t[1].TriggerType = TASK_TIME_TRIGGER_MONTHLYDATE;
    t[1].Type.MonthlyDate.rgfDays = 0x80000001u, t[1].Type.MonthlyDate.rgfMonths = 0xFFF;
    t[2].TriggerType = TASK_TIME_TRIGGER_MONTHLYDOW, t[2].Type.MonthlyDOW.wWhichWeek = 5;
    t[2].Type.MonthlyDOW.rgfDaysOfTheWeek = 0x7F, t[2].Type.MonthlyDOW.rgfMonths = 0x800;
    t[2].rgFlags = TASK_TRIGGER_FLAG_HAS_END_DATE, t[2].wEndYear = 2026, t[2].wEndMonth = 12, t[2].wEndDay = 31;
    for (const TASK_TRIGGER& record : t)
        addTrigger(created.get(), record);
    EXPECT_EQ(S_OK, save(created.get()));
    EXPECT_EQ(1, std::distance(std::filesystem::directory_iterator(m_dir.file("Tasks")), {}));
    ComPtr<ITask> again = task(L"Round trip \u00e9", false);
    ASSERT_TRUE(again);
    for (WORD i = 0; i < 3; ++i)
    {
        ComPtr<ITaskTrigger> trigger;
        ASSERT_EQ(S_OK, again->GetTrigger(i, &trigger.ref()));
        const TASK_TRIGGER back = read(trigger.get());
        EXPECT_EQ(0, std::memcmp(&t[i], &back, sizeof back)) << "trigger " << i;
    }
}

// A trigger object keeps to its own trigger; the deleted one is gone. Bad records change nothing.
TEST_F(TaskSchedulerLayer, TriggersKeepTheirIdentityAndRefuseBadRecords)
{
    ComPtr<ITask> created = task(L"Triggers");
    ComPtr<ITaskTrigger> triggers[3];
    for (WORD i = 0; i < 3; ++i)
        triggers[i] = addTrigger(created.get(), makeTrigger(i + 1, 0, 2));
    EXPECT_EQ(S_OK, created->DeleteTrigger(0));
    EXPECT_EQ(E_INVALIDARG, created->DeleteTrigger(2));
    ComPtr<ITaskTrigger> none;
    EXPECT_EQ(SCHED_E_TRIGGER_NOT_FOUND, created->GetTrigger(2, &none.ref()));
    TASK_TRIGGER record = makeTrigger(1, 2, 2);
    read(triggers[0].get(), SCHED_E_TRIGGER_NOT_FOUND);
    EXPECT_EQ(SCHED_E_TRIGGER_NOT_FOUND, triggers[0]->SetTrigger(&record));
    EXPECT_EQ(2, read(triggers[1].get()).wStartHour);
    using T = TASK_TRIGGER&;
    void (*const mutations[])(T) = {
        [](T t) { t.cbTriggerSize = 40; },
        [](T t) { t.wStartHour = 24; },
        [](T t) { t.wStartMinute = 60; },
        [](T t) { t.wBeginMonth = 13; },
        [](T t) { t.wBeginDay = 0; },
        [](T t) { t.Type.Daily.DaysInterval = 0; },
        [](T t) { t.TriggerType = static_cast<TASK_TRIGGER_TYPE>(8); },
        [](T t) { t.TriggerType = TASK_TIME_TRIGGER_WEEKLY, t.Type.Weekly.WeeksInterval = 0; },
        [](T t) { t.rgFlags = TASK_TRIGGER_FLAG_HAS_END_DATE, t.wEndMonth = 1, t.wEndDay = 32; }};
    for (const auto mutate : mutations)
    {
        record = makeTrigger(1, 2, 2);
        mutate(record);
        EXPECT_EQ(E_INVALIDARG, triggers[2]->SetTrigger(&record)) << record.wStartHour;
    }
    EXPECT_EQ(E_INVALIDARG, triggers[2]->SetTrigger(nullptr));
    EXPECT_EQ(3, read(triggers[2].get()).wStartHour);
}

// A tasks folder that cannot be made: the service is not running; forced to run, the write fails.
TEST_F(TaskSchedulerLayer, NamesFoldersAndExistingTasks)
{
    ASSERT_EQ(S_OK, save(task(L"Once").get()));
    HRESULT hr = S_OK;
    for (const wchar_t* bad : {L"Once", L"", L"..", L"a/b", L"tab\there"})
    {
        EXPECT_FALSE(task(bad, true, &hr));
        EXPECT_EQ(bad[0] == L'O' ? HRESULT_FROM_WIN32(80) : E_INVALIDARG, hr) << WideString::toUtf8(bad);
    }
    EXPECT_EQ(S_OK, m_scheduler->Delete(L"Once"));
    EXPECT_EQ(HRESULT_FROM_WIN32(2), m_scheduler->Delete(L"Once"));
    TempDir::write(m_dir.file("blocker"), "a file");
    TaskSchedulerSettings::setTasksFolder(m_dir.file("blocker") + "/Tasks");
    ComPtr<ITask> blocked = task(L"Blocked");
    EXPECT_EQ(SCHED_E_SERVICE_NOT_RUNNING, save(blocked.get()));
    EXPECT_EQ(SCHED_E_SERVICE_NOT_RUNNING, m_scheduler->Delete(L"Blocked"));
    TaskSchedulerSettings::setServiceState(SERVICE_RUNNING);
    EXPECT_EQ(HRESULT_FROM_WIN32(3), save(blocked.get()));
    EXPECT_EQ("a file", TempDir::read(m_dir.file("blocker")));
}

// One file per refusal; a damaged file can still be deleted.
TEST_F(TaskSchedulerLayer, OnlyWellFormedFilesOfTheUserAreRead)
{
    std::string mine = "<Task version=\"1\" owner=\"" + WideString::toUtf8(EffectiveUser::loginName().c_str()) + "\">";
    const std::string status = "\"/><Status value=\"0\"/></Task>";
    const std::string triggers = "<Flags value=\"0\"/><Status value=\"0\"/><Triggers>";
    for (const std::string& content :
         {std::string(), std::string("not xml at all"), "<Task version=\"2\"" + mine.substr(17) + status.substr(3),
          mine + status.substr(3), mine + "<Flags value=\"-1" + status, mine + "<Flags value=\"3x" + status,
          mine + "<Flags value=\"4294967296" + status, mine + triggers + "<Trigger type=\"9\"/></Triggers></Task>",
          mine + triggers + "<Other/></Triggers></Task>"})
    {
        TempDir::write(TaskFile::pathOf(L"Read"), content);
        HRESULT hr = S_OK;
        EXPECT_FALSE(task(L"Read", false, &hr));
        EXPECT_EQ(SCHED_E_UNKNOWN_OBJECT_VERSION, hr) << content;
        EXPECT_EQ(S_OK, m_scheduler->Delete(L"Read"));
    }
}

TEST(ServiceManager, RefusesUnknownServicesAndStaleHandles)
{
    SC_HANDLE manager = OpenSCManagerA(nullptr, nullptr, SC_MANAGER_ENUMERATE_SERVICE);
    EXPECT_EQ(nullptr, OpenServiceW(manager, L"Spooler", SERVICE_INTERROGATE));
    EXPECT_EQ(DWORD(ERROR_SERVICE_DOES_NOT_EXIST), GetLastError());
    SERVICE_STATUS status;
    EXPECT_FALSE(ControlService(manager, SERVICE_CONTROL_INTERROGATE, &status));
    EXPECT_EQ(DWORD(ERROR_INVALID_HANDLE), GetLastError());
    EXPECT_TRUE(CloseServiceHandle(manager));
    EXPECT_FALSE(CloseServiceHandle(manager));
}

// Error texts by family, the user's login, numbers read within the int range.
TEST(Win32Helpers, ErrorTextsLoginAndNumbers)
{
    EXPECT_STREQ("No such file or directory", _com_error(HRESULT(0x80070002u)).ErrorMessage());
    EXPECT_STREQ("The service has not been started.", _com_error(HRESULT(0x80070426u)).ErrorMessage());
    EXPECT_STREQ("IDispatch error #80", _com_error(HRESULT(0x80040250u)).ErrorMessage());
    EXPECT_STREQ("Unknown error 0x8007FFFF", _com_error(HRESULT(0x8007FFFFu)).ErrorMessage());
    EXPECT_STREQ("Unknown error 0x12345678", _com_error(HRESULT(0x12345678u)).ErrorMessage());
    wchar_t buffer[257] = {};
    DWORD size = static_cast<DWORD>(EffectiveUser::loginName().length()); // one short
    EXPECT_FALSE(GetUserNameW(buffer, &size));
    EXPECT_EQ(DWORD(ERROR_INSUFFICIENT_BUFFER), GetLastError());
    EXPECT_TRUE(GetUserNameW(buffer, &size)); // it told what it needs
    EXPECT_FALSE(GetUserNameW(buffer, nullptr));
    EXPECT_EQ(DWORD(ERROR_INVALID_PARAMETER), GetLastError());
    EXPECT_EQ(INT_MAX, _wtoi(L"99999999999"));
    EXPECT_EQ(INT_MIN, _wtoi(L"-99999999999 "));
    EXPECT_EQ(0, _wtoi(nullptr));
}
