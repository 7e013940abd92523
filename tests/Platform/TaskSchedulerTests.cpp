#include "TempDir.h"

#include "EffectiveUser.h"
#include "TaskFile.h"
#include "TaskScheduler.h"
#include "TaskSchedulerFaults.h"
#include "WideString.h"
#include "Win32Service.h"
#include "Win32System.h"
#include "_com_error.h"

#include <gtest/gtest.h>

#include <pwd.h>
#include <unistd.h>

#include <cstddef>
#include <cstring>
#include <filesystem>
#include <thread>

namespace
{
class TaskSchedulerLayer : public ::testing::Test
{
protected:
    void SetUp() override
    {
        TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks"));
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerFaults::clear();
        ASSERT_EQ(S_OK, CoInitialize(nullptr));
        void* object = nullptr;
        ASSERT_EQ(S_OK, CoCreateInstance(CLSID_CTaskScheduler, nullptr, CLSCTX_INPROC_SERVER, IID_ITaskScheduler, &object));
        m_scheduler.reset(static_cast<ITaskScheduler*>(object));
    }
    void TearDown() override
    {
        m_scheduler.reset();
        CoUninitialize();
        TaskSchedulerFaults::clear();
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerSettings::setTasksFolder(std::string());
    }

    ComPtr<ITask> newTask(const wchar_t* name)
    {
        IUnknown* unknown = nullptr;
        EXPECT_EQ(S_OK, m_scheduler->NewWorkItem(name, CLSID_CTask, IID_ITask, &unknown));
        return ComPtr<ITask>(static_cast<ITask*>(unknown));
    }
    HRESULT activate(const wchar_t* name, ComPtr<ITask>& task)
    {
        IUnknown* unknown = nullptr;
        const HRESULT hr = m_scheduler->Activate(name, IID_ITask, &unknown);
        task.reset(static_cast<ITask*>(unknown));
        return hr;
    }
    static HRESULT save(ITask* task)
    {
        void* object = nullptr;
        const HRESULT hr = task->QueryInterface(IID_IPersistFile, &object);
        if (FAILED(hr))
            return hr;
        ComPtr<IPersistFile> file(static_cast<IPersistFile*>(object));
        return file->Save(nullptr, TRUE);
    }
    static TASK_TRIGGER daily(WORD hour, WORD minute)
    {
        TASK_TRIGGER t;
        std::memset(&t, 0, sizeof t);
        t.cbTriggerSize = sizeof t;
        t.wBeginYear = 2025;
        t.wBeginMonth = 6;
        t.wBeginDay = 30;
        t.wStartHour = hour;
        t.wStartMinute = minute;
        t.TriggerType = TASK_TIME_TRIGGER_DAILY;
        t.Type.Daily.DaysInterval = 2;
        return t;
    }
    static std::wstring text(HRESULT (ITask::*get)(LPWSTR*), ITask* task)
    {
        LPWSTR value = nullptr;
        EXPECT_EQ(S_OK, (task->*get)(&value));
        std::wstring copy = value != nullptr ? value : L"<null>";
        CoTaskMemFree(value);
        return copy;
    }

    TempDir m_dir;
    ComPtr<ITaskScheduler> m_scheduler;
};
}

TEST(TaskTriggerLayout, KeepsTheOriginalOffsets)
{
    EXPECT_EQ(48u, sizeof(TASK_TRIGGER));
    EXPECT_EQ(16u, offsetof(TASK_TRIGGER, wStartHour));
    EXPECT_EQ(20u, offsetof(TASK_TRIGGER, MinutesDuration));
    EXPECT_EQ(32u, offsetof(TASK_TRIGGER, TriggerType));
    EXPECT_EQ(36u, offsetof(TASK_TRIGGER, Type));
    EXPECT_EQ(44u, offsetof(TASK_TRIGGER, Reserved2));
    EXPECT_EQ(46u, offsetof(TASK_TRIGGER, wRandomMinutesInterval));
}

TEST(ComApartment, CountedPerThread)
{
    EXPECT_EQ(S_OK, CoInitialize(nullptr));
    EXPECT_EQ(S_FALSE, CoInitialize(nullptr));
    EXPECT_EQ(2, CoGetInitializeCount());
    HRESULT other = E_FAIL;
    int otherCount = -1;
    std::thread([&] {
        other = CoInitialize(nullptr);
        otherCount = CoGetInitializeCount();
        CoUninitialize();
    }).join();
    EXPECT_EQ(S_OK, other);
    EXPECT_EQ(1, otherCount);
    CoUninitialize();
    CoUninitialize();
    EXPECT_EQ(0, CoGetInitializeCount());
    void* object = reinterpret_cast<void*>(1);
    EXPECT_EQ(CO_E_NOTINITIALIZED,
              CoCreateInstance(CLSID_CTaskScheduler, nullptr, CLSCTX_INPROC_SERVER, IID_ITaskScheduler, &object));
    EXPECT_EQ(nullptr, object);
}

TEST(ComApartment, OnlyTheSchedulerClassIsKnown)
{
    ASSERT_EQ(S_OK, CoInitialize(nullptr));
    void* object = nullptr;
    EXPECT_EQ(REGDB_E_CLASSNOTREG, CoCreateInstance(CLSID_CTask, nullptr, CLSCTX_INPROC_SERVER, IID_ITask, &object));
    EXPECT_EQ(E_NOINTERFACE, CoCreateInstance(CLSID_CTaskScheduler, nullptr, CLSCTX_INPROC_SERVER, IID_ITask, &object));
    EXPECT_EQ(nullptr, object);
    CoUninitialize();
}

TEST_F(TaskSchedulerLayer, SavedTaskReadsBackInEveryField)
{
    ComPtr<ITask> task = newTask(L"Round trip \u00e9");
    ASSERT_TRUE(task);
    EXPECT_EQ(S_OK, task->SetApplicationName(L"/usr/bin/agent \u00fc"));
    EXPECT_EQ(S_OK, task->SetParameters(L"--check <&>"));
    EXPECT_EQ(S_OK, task->SetAccountInformation(EffectiveUser::loginName().c_str(), nullptr));
    EXPECT_EQ(S_OK, task->SetFlags(0x2001));
    WORD index = 9;
    ComPtr<ITaskTrigger> trigger;
    ASSERT_EQ(S_OK, task->CreateTrigger(&index, &trigger.ref()));
    EXPECT_EQ(0, index);
    TASK_TRIGGER record = daily(23, 59);
    EXPECT_EQ(S_OK, trigger->SetTrigger(&record));
    EXPECT_EQ(S_OK, save(task.get()));
    // Only the task file is left: no temporary file.
    EXPECT_EQ(1, std::distance(std::filesystem::directory_iterator(m_dir.file("Tasks")),
                               std::filesystem::directory_iterator()));

    ComPtr<ITask> again;
    ASSERT_EQ(S_OK, activate(L"Round trip \u00e9", again));
    EXPECT_EQ(L"/usr/bin/agent \u00fc", text(&ITask::GetApplicationName, again.get()));
    EXPECT_EQ(L"--check <&>", text(&ITask::GetParameters, again.get()));
    DWORD flags = 0;
    EXPECT_EQ(S_OK, again->GetFlags(&flags));
    EXPECT_EQ(0x2001u, flags);
    HRESULT status = 0;
    EXPECT_EQ(S_OK, again->GetStatus(&status));
    EXPECT_EQ(SCHED_S_TASK_HAS_NOT_RUN, status);
    ComPtr<ITaskTrigger> readTrigger;
    ASSERT_EQ(S_OK, again->GetTrigger(0, &readTrigger.ref()));
    TASK_TRIGGER read;
    std::memset(&read, 0xAB, sizeof read);
    EXPECT_EQ(S_OK, readTrigger->GetTrigger(&read));
    EXPECT_EQ(0, std::memcmp(&record, &read, sizeof read));
    TaskRecord stored;
    ASSERT_EQ(S_OK, TaskFile::load(L"Round trip \u00e9", stored));
    EXPECT_EQ(EffectiveUser::loginName(), stored.account);
}

TEST_F(TaskSchedulerLayer, DeleteTriggerMovesLaterTriggersDown)
{
    ComPtr<ITask> task = newTask(L"Triggers");
    ComPtr<ITaskTrigger> triggers[3];
    for (WORD i = 0; i < 3; ++i)
    {
        WORD index = 0;
        ASSERT_EQ(S_OK, task->CreateTrigger(&index, &triggers[i].ref()));
        EXPECT_EQ(i, index);
        TASK_TRIGGER record = daily(static_cast<WORD>(i + 1), 0);
        ASSERT_EQ(S_OK, triggers[i]->SetTrigger(&record));
    }
    EXPECT_EQ(S_OK, task->DeleteTrigger(0));
    WORD count = 0;
    EXPECT_EQ(S_OK, task->GetTriggerCount(&count));
    EXPECT_EQ(2, count);
    for (WORD i = 0; i < 2; ++i)
    {
        ComPtr<ITaskTrigger> t;
        ASSERT_EQ(S_OK, task->GetTrigger(i, &t.ref()));
        TASK_TRIGGER record;
        EXPECT_EQ(S_OK, t->GetTrigger(&record));
        EXPECT_EQ(i + 2, record.wStartHour);
    }
    EXPECT_EQ(E_INVALIDARG, task->DeleteTrigger(2));
    ComPtr<ITaskTrigger> none;
    EXPECT_EQ(SCHED_E_TRIGGER_NOT_FOUND, task->GetTrigger(2, &none.ref()));
    // A trigger object keeps to its own trigger; the deleted one is gone.
    TASK_TRIGGER record;
    EXPECT_EQ(SCHED_E_TRIGGER_NOT_FOUND, triggers[0]->GetTrigger(&record));
    EXPECT_EQ(S_OK, triggers[2]->GetTrigger(&record));
    EXPECT_EQ(3, record.wStartHour);
}

TEST_F(TaskSchedulerLayer, SetTriggerRefusesBadRecords)
{
    ComPtr<ITask> task = newTask(L"Bad");
    WORD index = 0;
    ComPtr<ITaskTrigger> trigger;
    ASSERT_EQ(S_OK, task->CreateTrigger(&index, &trigger.ref()));
    struct Case
    {
        void (*mutate)(TASK_TRIGGER&);
    } cases[] = {{[](TASK_TRIGGER& t) { t.cbTriggerSize = 40; }},
                 {[](TASK_TRIGGER& t) { t.wStartHour = 24; }},
                 {[](TASK_TRIGGER& t) { t.wStartMinute = 60; }},
                 {[](TASK_TRIGGER& t) { t.wBeginMonth = 13; }},
                 {[](TASK_TRIGGER& t) { t.TriggerType = static_cast<TASK_TRIGGER_TYPE>(8); }},
                 {[](TASK_TRIGGER& t) { t.Type.Daily.DaysInterval = 0; }}};
    for (const Case& c : cases)
    {
        TASK_TRIGGER record = daily(1, 2);
        c.mutate(record);
        EXPECT_EQ(E_INVALIDARG, trigger->SetTrigger(&record));
    }
    EXPECT_EQ(E_INVALIDARG, trigger->SetTrigger(nullptr));
}

TEST_F(TaskSchedulerLayer, StatusFollowsFlagsAndTriggers)
{
    ComPtr<ITask> task = newTask(L"Status");
    HRESULT status = 0;
    EXPECT_EQ(S_OK, task->GetStatus(&status));
    EXPECT_EQ(SCHED_S_TASK_NO_VALID_TRIGGERS, status);
    WORD index = 0;
    ComPtr<ITaskTrigger> trigger;
    ASSERT_EQ(S_OK, task->CreateTrigger(&index, &trigger.ref()));
    EXPECT_EQ(S_OK, task->GetStatus(&status));
    EXPECT_EQ(SCHED_S_TASK_HAS_NOT_RUN, status);
    EXPECT_EQ(S_OK, task->SetFlags(TASK_FLAG_DISABLED));
    EXPECT_EQ(S_OK, task->GetStatus(&status));
    EXPECT_EQ(SCHED_S_TASK_DISABLED, status);
}

TEST_F(TaskSchedulerLayer, NamesAndExistingTasks)
{
    ComPtr<ITask> task = newTask(L"Once");
    ASSERT_EQ(S_OK, save(task.get()));
    IUnknown* unknown = nullptr;
    EXPECT_EQ(HRESULT_FROM_WIN32(80), m_scheduler->NewWorkItem(L"Once", CLSID_CTask, IID_ITask, &unknown));
    EXPECT_EQ(nullptr, unknown);
    for (const wchar_t* bad : {L"", L"..", L"a/b", L"a\\b", L"c:d", L"what?"})
        EXPECT_EQ(E_INVALIDARG, m_scheduler->NewWorkItem(bad, CLSID_CTask, IID_ITask, &unknown)) << bad;
    ComPtr<ITask> absent;
    EXPECT_EQ(HRESULT_FROM_WIN32(2), activate(L"Never saved", absent));
    EXPECT_FALSE(absent);
    EXPECT_EQ(S_OK, m_scheduler->Delete(L"Once"));
    EXPECT_EQ(static_cast<HRESULT>(0x80070002), m_scheduler->Delete(L"Once"));
}

TEST_F(TaskSchedulerLayer, DamagedFilesAreUnknownVersions)
{
    const char* contents[] = {
        "",
        "not xml at all",
        "<Task version=\"2\" owner=\"%u\"><Flags value=\"0\"/><Status value=\"0\"/></Task>",
        "<Task version=\"1\"><Flags value=\"0\"/><Status value=\"0\"/></Task>",
        "<Task version=\"1\" owner=\"%u\"><Status value=\"0\"/></Task>",
        "<Task version=\"1\" owner=\"%u\"><Flags value=\"-1\"/><Status value=\"0\"/></Task>",
        "<Task version=\"1\" owner=\"%u\"><Flags value=\"0\"/><Status value=\"0\"/><Triggers><Trigger "
        "type=\"9\"/></Triggers></Task>",
        "<Task version=\"1\" owner=\"%u\"><Flags value=\"0\"/><Status value=\"0\"/><Triggers><Trigger type=\"1\" "
        "beginYear=\"2024\" beginMonth=\"1\" beginDay=\"1\" endYear=\"0\" endMonth=\"0\" endDay=\"0\" "
        "startHour=\"25\" startMinute=\"0\" minutesDuration=\"0\" minutesInterval=\"0\" flags=\"0\" "
        "randomMinutesInterval=\"0\" daysInterval=\"1\"/></Triggers></Task>"};
    const std::string user = WideString::toUtf8(EffectiveUser::loginName().c_str());
    for (std::string content : contents)
    {
        const size_t at = content.find("%u");
        if (at != std::string::npos)
            content.replace(at, 2, user);
        TempDir::write(TaskFile::pathOf(L"Damaged"), content);
        ComPtr<ITask> task;
        EXPECT_EQ(SCHED_E_UNKNOWN_OBJECT_VERSION, activate(L"Damaged", task)) << content;
        EXPECT_FALSE(task);
    }
    // A damaged file can still be removed.
    EXPECT_EQ(S_OK, m_scheduler->Delete(L"Damaged"));
}

TEST_F(TaskSchedulerLayer, AnotherAccountsTaskIsDenied)
{
    TempDir::write(TaskFile::pathOf(L"Theirs"),
                   "<Task version=\"1\" owner=\"someoneelse\"><Flags value=\"0\"/><Status value=\"0\"/></Task>");
    ComPtr<ITask> task;
    EXPECT_EQ(E_ACCESSDENIED, activate(L"Theirs", task));
    EXPECT_EQ(E_ACCESSDENIED, m_scheduler->Delete(L"Theirs"));
    EXPECT_TRUE(std::filesystem::exists(TaskFile::pathOf(L"Theirs")));
}

TEST_F(TaskSchedulerLayer, SaveIntoUnusableFolderFailsAndKeepsNothing)
{
    ComPtr<ITask> task = newTask(L"Blocked");
    TempDir::write(m_dir.file("blocker"), "a file");
    TaskSchedulerSettings::setTasksFolder(m_dir.file("blocker") + "/Tasks");
    EXPECT_EQ(SCHED_E_SERVICE_NOT_RUNNING, save(task.get()));
    TaskSchedulerSettings::setServiceState(SERVICE_RUNNING);  // forced: the write itself fails
    EXPECT_EQ(HRESULT_FROM_WIN32(3), save(task.get()));
    EXPECT_EQ("a file", TempDir::read(m_dir.file("blocker")));
}

TEST_F(TaskSchedulerLayer, FaultsSkipAndExpire)
{
    ComPtr<ITask> task = newTask(L"Faults");
    TaskSchedulerFaults::Fault fault;
    fault.result = E_OUTOFMEMORY;
    fault.skip = 1;
    fault.times = 1;
    TaskSchedulerFaults::inject(TaskSchedulerFaults::eSetFlags, fault);
    EXPECT_EQ(S_OK, task->SetFlags(1));
    EXPECT_EQ(E_OUTOFMEMORY, task->SetFlags(2));
    EXPECT_EQ(S_OK, task->SetFlags(3));
    DWORD flags = 0;
    EXPECT_EQ(S_OK, task->GetFlags(&flags));
    EXPECT_EQ(3u, flags);
    TaskSchedulerFaults::inject(TaskSchedulerFaults::eGetParameters, S_OK, TaskSchedulerFaults::eNULL);
    LPWSTR value = reinterpret_cast<LPWSTR>(1);
    EXPECT_EQ(S_OK, task->GetParameters(&value));
    EXPECT_EQ(nullptr, value);
}

TEST(ServiceManager, KnowsTheScheduleService)
{
    TempDir dir;
    TaskSchedulerSettings::setTasksFolder(dir.file("Tasks"));
    SC_HANDLE manager = OpenSCManagerA(nullptr, nullptr, SC_MANAGER_ENUMERATE_SERVICE);
    ASSERT_NE(nullptr, manager);
    EXPECT_EQ(nullptr, OpenServiceW(manager, L"Spooler", SERVICE_INTERROGATE));
    EXPECT_EQ(static_cast<DWORD>(ERROR_SERVICE_DOES_NOT_EXIST), GetLastError());
    SC_HANDLE service = OpenServiceW(manager, L"schedule", SERVICE_INTERROGATE);
    ASSERT_NE(nullptr, service);
    SERVICE_STATUS status;
    EXPECT_TRUE(ControlService(service, SERVICE_CONTROL_INTERROGATE, &status));
    EXPECT_EQ(static_cast<DWORD>(SERVICE_RUNNING), status.dwCurrentState);
    TaskSchedulerSettings::setServiceState(SERVICE_STOPPED);
    EXPECT_FALSE(ControlService(service, SERVICE_CONTROL_INTERROGATE, &status));
    EXPECT_EQ(static_cast<DWORD>(ERROR_SERVICE_NOT_ACTIVE), GetLastError());
    EXPECT_EQ(static_cast<DWORD>(SERVICE_STOPPED), status.dwCurrentState);
    TaskSchedulerSettings::setServiceState(0);
    EXPECT_FALSE(ControlService(manager, SERVICE_CONTROL_INTERROGATE, &status));
    EXPECT_TRUE(CloseServiceHandle(service));
    EXPECT_FALSE(CloseServiceHandle(service));
    EXPECT_EQ(static_cast<DWORD>(ERROR_INVALID_HANDLE), GetLastError());
    EXPECT_TRUE(CloseServiceHandle(manager));
    TaskSchedulerSettings::setTasksFolder(std::string());
}

TEST(ComErrorText, SystemTextWithoutLineBreak)
{
    struct Case
    {
        uint32_t hr;
        const char* text;
    } cases[] = {{0x80070002u, "No such file or directory"},
                 {0x80070005u, "Permission denied"},
                 {0x80070057u, "Invalid argument"},
                 {0x80041313u, "The task object version is either unsupported or invalid."},
                 {0x80040250u, "IDispatch error #80"},
                 {0x80070426u, "The service has not been started."},
                 {0x8007FFFFu, "Unknown error 0x8007FFFF"},
                 {0x12345678u, "Unknown error 0x12345678"}};
    for (const Case& c : cases)
        EXPECT_STREQ(c.text, _com_error(static_cast<HRESULT>(c.hr)).ErrorMessage()) << std::hex << c.hr;
}

TEST(UserName, LoginOfTheEffectiveUser)
{
    const passwd* entry = getpwuid(geteuid());
    ASSERT_NE(nullptr, entry);
    const std::wstring expected = WideString::toStd(WideString::fromUtf8(entry->pw_name));
    wchar_t buffer[257] = {};
    DWORD size = 257;
    ASSERT_TRUE(GetUserNameW(buffer, &size));
    EXPECT_EQ(expected, buffer);
    EXPECT_EQ(expected.size() + 1, size);
    DWORD small = 1;
    EXPECT_FALSE(GetUserNameW(buffer, &small));
    EXPECT_EQ(static_cast<DWORD>(ERROR_INSUFFICIENT_BUFFER), GetLastError());
    EXPECT_EQ(expected.size() + 1, small);
}

TEST(WideToInt, ReadsLeadingNumber)
{
    struct Case
    {
        const wchar_t* text;
        int value;
    } cases[] = {{L"07", 7}, {L"7:", 7}, {L"", 0}, {L"x5", 0}, {L" 12", 12}, {L"-3", -3}, {L"99999999999", 2147483647}};
    for (const Case& c : cases)
        EXPECT_EQ(c.value, _wtoi(c.text)) << c.text;
}
