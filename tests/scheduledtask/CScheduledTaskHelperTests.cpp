#include "ScheduledTaskTestSupport.h"

#include <unistd.h>

#include <filesystem>

using namespace OnlineUpdateCommand_NS;

namespace
{
const wchar_t kApp[] = L"/opt/agent/UpdaterAgent";

ScheduledTaskParams standardParams()
{
    return ScheduledTaskParams(L"UpdTask", kApp, L"preparer", L"07", L"05");
}
}

// ---------------------------------------------------------------- parameters

TEST_F(ScheduledTaskFixture, ParamsCarryUserAndTaskName)
{
    const ScheduledTaskParams params = standardParams();
    EXPECT_TRUE(params.isValid());
    EXPECT_EQ(user(), std::wstring(params.userName().c_str()));
    EXPECT_EQ(storedName(L"UpdTask"), std::wstring(params.getTaskName().c_str()));
    const ScheduledTaskParams copy(params);
    EXPECT_EQ(params.getTaskName(), copy.getTaskName());
    EXPECT_EQ(params.startMinute(), copy.startMinute());
    EXPECT_FALSE(ScheduledTaskParams::s_defaultParams.isValid());
    EXPECT_FALSE(ScheduledTaskParams::s_defaultParams.userName().empty());
}

class InvalidParams : public ScheduledTaskFixture, public ::testing::WithParamInterface<int>
{
};

// Each of the six strings empty: every operation stops at its first step, before any COM call.
TEST_P(InvalidParams, EveryOperationRejectsThemFirst)
{
    const wchar_t* s[5] = {L"UpdTask", kApp, L"preparer", L"07", L"05"};
    if (GetParam() < 5)
        s[GetParam()] = L"";
    else
        TaskSchedulerFaults::inject(TaskSchedulerFaults::eGetUserName, {1332, TaskSchedulerFaults::eAUTO, 0, 1});
    ScheduledTaskParams params(s[0], s[1], s[2], s[3], s[4]);
    ASSERT_FALSE(params.isValid());
    if (GetParam() == 5)
    {
        EXPECT_EQ(std::vector<std::string>{"CScheduledTaskHelper::ScheduledTaskParams::ScheduledTaskParams: "
                                           "GetUserNameW failed with last error '1332'"},
                  m_log.messages(16));
    }
    m_log.clear();
    // Any COM call would fail loudly.
    TaskSchedulerFaults::inject(TaskSchedulerFaults::eCoInitialize, RPC_E_CHANGED_MODE);
    TaskSchedulerFaults::inject(TaskSchedulerFaults::eCoCreateInstance, E_FAIL);

    CScheduledTaskHelper helper(params);
    bool exists = false;
    bool denied = false;
    EXPECT_FALSE(helper.createScheduledTask(false));
    EXPECT_FALSE(helper.deleteScheduledTask(false));
    EXPECT_FALSE(helper.deleteScheduledTask(true));
    EXPECT_FALSE(helper.checkTaskAvailableForCurrentUser(exists, denied));
    EXPECT_EQ(eWRONG_SETTINGS, helper.checkScheduledTask());
    const std::vector<std::string> expected = {
        "CScheduledTaskHelper::createScheduledTask: m_rParams is not valid",
        "CScheduledTaskHelper::deleteScheduledTask: m_rParams is not valid",
        "CScheduledTaskHelper::deleteScheduledTask: m_rParams is not valid",
        "CScheduledTaskHelper::checkTaskAvailableForCurrentUser: m_rParams is not valid",
        "CScheduledTaskHelper::checkScheduledTask: m_rParams is not valid"};
    EXPECT_EQ(expected, m_log.messages(16));
    EXPECT_EQ(expected.size(), m_log.messages().size());
    EXPECT_FALSE(exists);
    EXPECT_EQ(0, CoGetInitializeCount());
}
INSTANTIATE_TEST_SUITE_P(EachString, InvalidParams, ::testing::Range(0, 6));

// ---------------------------------------------------------------- create

TEST_F(ScheduledTaskFixture, CreateOverAbsentTaskWritesOneDailyTrigger)
{
    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    SYSTEMTIME today;
    GetLocalTime(&today);
    ASSERT_TRUE(helper.createScheduledTask(true));
    EXPECT_TRUE(m_log.messages().empty());

    TaskRecord stored;
    ASSERT_EQ(S_OK, TaskFile::load(storedName(L"UpdTask"), stored));
    EXPECT_EQ(kApp, stored.applicationName);
    EXPECT_EQ(L"preparer", stored.parameters);
    EXPECT_EQ(user(), stored.account);
    EXPECT_EQ(0x2001u, stored.flags);
    ASSERT_EQ(1u, stored.triggers.size());
    TASK_TRIGGER expected;
    std::memset(&expected, 0, sizeof expected);
    expected.cbTriggerSize = 48;
    expected.wBeginYear = today.wYear;
    expected.wBeginMonth = today.wMonth;
    expected.wBeginDay = today.wDay;
    expected.wStartHour = 7;
    expected.wStartMinute = 5;
    expected.TriggerType = TASK_TIME_TRIGGER_DAILY;
    expected.Type.Daily.DaysInterval = 1;
    EXPECT_EQ(0, std::memcmp(&expected, &stored.triggers[0], sizeof expected));
    EXPECT_EQ(eOK, helper.checkScheduledTask());
}

// Reuse deletes every old trigger, however many (they move down as each one goes).
TEST_F(ScheduledTaskFixture, CreateOverTaskWithThreeTriggersReplacesThem)
{
    TaskRecord old;
    old.applicationName = L"/old/app";
    old.parameters = L"old";
    old.flags = 0x4;
    old.triggers = {trigger(TASK_TIME_TRIGGER_WEEKLY, 1, 0), trigger(TASK_TIME_TRIGGER_DAILY, 2, 0),
                    trigger(TASK_TIME_TRIGGER_ONCE, 3, 0)};
    writeTask(storedName(L"UpdTask"), old, user());

    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    ASSERT_TRUE(helper.createScheduledTask(false));
    const std::string name = toUtf8(storedName(L"UpdTask"));
    EXPECT_EQ(std::vector<std::string>{"CScheduledTaskHelper::createScheduledTask: task '" + name +
                                       "' already exists, and flag to fail in this case is not set -> will reuse "
                                       "(possibly updating existing settings)"},
              m_log.messages(1));
    EXPECT_TRUE(m_log.messages(16).empty());

    TaskRecord stored;
    ASSERT_EQ(S_OK, TaskFile::load(storedName(L"UpdTask"), stored));
    EXPECT_EQ(kApp, stored.applicationName);
    EXPECT_EQ(L"preparer", stored.parameters);
    EXPECT_EQ(0x2001u, stored.flags);
    ASSERT_EQ(1u, stored.triggers.size());
    EXPECT_EQ(TASK_TIME_TRIGGER_DAILY, stored.triggers[0].TriggerType);
    EXPECT_EQ(7, stored.triggers[0].wStartHour);
    EXPECT_EQ(eOK, helper.checkScheduledTask());
}

TEST_F(ScheduledTaskFixture, CreateOverExistingTaskWithFailFlagLeavesItUntouched)
{
    TaskRecord old = goodRecord();
    old.parameters = L"old";
    writeTask(storedName(L"UpdTask"), old, user());
    const std::string before = TempDir::read(TaskFile::pathOf(storedName(L"UpdTask")));

    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    EXPECT_FALSE(helper.createScheduledTask(true));
    EXPECT_EQ(std::vector<std::string>{"CScheduledTaskHelper::createScheduledTask: task '" +
                                       toUtf8(storedName(L"UpdTask")) +
                                       "' already exists, and flag to fail in this case is set"},
              m_log.messages(16));
    EXPECT_EQ(before, TempDir::read(TaskFile::pathOf(storedName(L"UpdTask"))));
}

// ---------------------------------------------------------------- delete

struct DeleteCase
{
    bool present;
    bool failIfNotExists;
    bool expected;
    int level;  // of the one expected line, 0 for none
    const char* line;
};

class DeleteTask : public ScheduledTaskFixture, public ::testing::WithParamInterface<DeleteCase>
{
};

TEST_P(DeleteTask, ResultAndLog)
{
    const DeleteCase& c = GetParam();
    if (c.present)
        writeTask(storedName(L"UpdTask"), goodRecord(), user());
    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    EXPECT_EQ(c.expected, helper.deleteScheduledTask(c.failIfNotExists));
    EXPECT_FALSE(std::filesystem::exists(TaskFile::pathOf(storedName(L"UpdTask"))));
    if (c.level == 0)
    {
        EXPECT_TRUE(m_log.messages().empty());
        return;
    }
    std::string line = c.line;
    line.replace(line.find("%s"), 2, toUtf8(storedName(L"UpdTask")));
    EXPECT_EQ(std::vector<std::string>{line}, m_log.messages(c.level));
    EXPECT_EQ(1u, m_log.messages().size());
}

INSTANTIATE_TEST_SUITE_P(
    Cases, DeleteTask,
    ::testing::Values(DeleteCase{true, false, true, 0, ""}, DeleteCase{true, true, true, 0, ""},
                      DeleteCase{false, false, true, 1,
                                 "CScheduledTaskHelper::deleteScheduledTask: ITSPtr->Delete('%s') failed with HRESULT "
                                 "'0x80070002' ('No such file or directory'), but failIfNotExists is not set"},
                      DeleteCase{false, true, false, 16,
                                 "CScheduledTaskHelper::deleteScheduledTask: ITSPtr->Delete('%s') failed with HRESULT "
                                 "'0x80070002' ('No such file or directory'), and failIfNotExists is set"}));

TEST_F(ScheduledTaskFixture, DeleteOfAnotherAccountsTaskIsRefusedAndTolerated)
{
    writeTask(storedName(L"UpdTask"), goodRecord(), L"someoneelse");
    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    EXPECT_TRUE(helper.deleteScheduledTask(false));
    EXPECT_FALSE(helper.deleteScheduledTask(true));
    EXPECT_TRUE(m_log.containsSubstring("failed with HRESULT '0x80070005' ('Permission denied'), and failIfNotExists is set", 16));
    EXPECT_TRUE(std::filesystem::exists(TaskFile::pathOf(storedName(L"UpdTask"))));
}

// ---------------------------------------------------------------- availability

struct AvailabilityCase
{
    const char* name;
    const wchar_t* owner;  // null: no task; L"": a damaged file
    bool result;
    bool exists;
    bool denied;
};

class Availability : public ScheduledTaskFixture, public ::testing::WithParamInterface<AvailabilityCase>
{
};

TEST_P(Availability, AnswersForTheCurrentUser)
{
    const AvailabilityCase& c = GetParam();
    const std::wstring name = storedName(L"UpdTask");
    if (c.owner != nullptr && c.owner[0] != L'\0')
        writeTask(name, goodRecord(), std::wstring(c.owner) == L"me" ? user() : c.owner);
    else if (c.owner != nullptr)
        TempDir::write(TaskFile::pathOf(name), "<Task version=\"1\"");
    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    bool exists = false;
    bool denied = false;
    EXPECT_EQ(c.result, helper.checkTaskAvailableForCurrentUser(exists, denied));
    EXPECT_EQ(c.exists, exists);
    EXPECT_EQ(c.denied, denied);
    if (c.denied)
    {
        EXPECT_EQ(std::vector<std::string>{"getExistingTask: rTaskSchedPtr->Activate('" + toUtf8(name) +
                                           "') failed with HRESULT '0x80070005' ('Permission denied') - most likely "
                                           "tasks exists but we don't have privileges to access it"},
                  m_log.messages(1));
    }
}

INSTANTIATE_TEST_SUITE_P(Cases, Availability,
                         ::testing::Values(AvailabilityCase{"found", L"me", true, true, false},
                                           AvailabilityCase{"absent", nullptr, true, false, false},
                                           AvailabilityCase{"denied", L"someoneelse", true, false, true},
                                           AvailabilityCase{"damaged", L"", false, false, false}),
                         [](const auto& info) { return std::string(info.param.name); });

// Tasks are stored per user: another user's task of the same base name is not seen.
TEST_F(ScheduledTaskFixture, AnotherUsersTaskIsInvisible)
{
    writeTask(L"UpdTask_someoneelse", goodRecord(), L"someoneelse");
    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    bool exists = true;
    bool denied = false;
    EXPECT_TRUE(helper.checkTaskAvailableForCurrentUser(exists, denied));
    EXPECT_FALSE(exists);
    EXPECT_FALSE(denied);
    EXPECT_EQ(eTASK_NOT_REGISTERED, helper.checkScheduledTask());
    EXPECT_TRUE(helper.createScheduledTask(true));
    EXPECT_TRUE(helper.deleteScheduledTask(true));
    EXPECT_TRUE(std::filesystem::exists(TaskFile::pathOf(L"UpdTask_someoneelse")));
}

// ---------------------------------------------------------------- COM scope

class ComScope : public ScheduledTaskFixture, public ::testing::WithParamInterface<int>
{
protected:
    static void runOperation(int which)
    {
        ScheduledTaskParams params = standardParams();
        CScheduledTaskHelper helper(params);
        bool exists = false;
        bool denied = false;
        switch (which)
        {
        case 0: helper.createScheduledTask(false); break;
        case 1: helper.deleteScheduledTask(false); break;
        case 2: helper.checkTaskAvailableForCurrentUser(exists, denied); break;
        default: helper.checkScheduledTask(); break;
        }
    }
};

// Uninitialised exactly when initialised: S_OK and S_FALSE are matched, a failure is not.
TEST_P(ComScope, UninitialisedExactlyWhenInitialised)
{
    runOperation(GetParam());
    EXPECT_EQ(0, CoGetInitializeCount());

    ASSERT_EQ(S_OK, CoInitialize(nullptr));
    runOperation(GetParam());  // its CoInitialize answers S_FALSE
    EXPECT_EQ(1, CoGetInitializeCount());

    TaskSchedulerFaults::inject(TaskSchedulerFaults::eCoInitialize, {RPC_E_CHANGED_MODE, TaskSchedulerFaults::eAUTO, 0, 1});
    runOperation(GetParam());
    EXPECT_EQ(1, CoGetInitializeCount());
    CoUninitialize();
    EXPECT_EQ(0, CoGetInitializeCount());
}
INSTANTIATE_TEST_SUITE_P(EachOperation, ComScope, ::testing::Range(0, 4));

TEST_F(ScheduledTaskFixture, FailedCoInitializeLeavesThreadOutsideApartment)
{
    TaskSchedulerFaults::inject(TaskSchedulerFaults::eCoInitialize, RPC_E_CHANGED_MODE);
    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    EXPECT_EQ(eCAN_NOT_ACCESS_SERVICE, helper.checkScheduledTask());
    EXPECT_EQ(std::vector<std::string>{"CScheduledTaskHelper::checkScheduledTask: CoCreateInstance(CLSID_CTaskScheduler) "
                                       "failed with HRESULT '0x800401F0' ('CoInitialize has not been called.')"},
              m_log.messages(16));
    EXPECT_EQ(0, CoGetInitializeCount());
}

// ---------------------------------------------------------------- service

struct ServiceCase
{
    const char* name;
    TaskSchedulerFaults::Call call;  // eCALL_COUNT: none
    DWORD lastError;
    DWORD state;
    bool blockFolder;
    bool expected;
    const char* line;
};

class ServiceCheck : public ScheduledTaskFixture, public ::testing::WithParamInterface<ServiceCase>
{
};

TEST_P(ServiceCheck, RunningOrWhy)
{
    const ServiceCase& c = GetParam();
    if (c.call != TaskSchedulerFaults::eCALL_COUNT)
        TaskSchedulerFaults::inject(c.call, static_cast<HRESULT>(c.lastError));
    TaskSchedulerSettings::setServiceState(c.state);
    if (c.blockFolder)
    {
        TempDir::write(m_dir.file("blocker"), "a file");
        TaskSchedulerSettings::setTasksFolder(m_dir.file("blocker") + "/Tasks");
    }
    EXPECT_EQ(c.expected, CScheduledTaskHelper::checkSchedulerServiceRunning());
    if (c.line[0] == '\0')
        EXPECT_TRUE(m_log.messages().empty());
    else
        EXPECT_EQ(std::vector<std::string>{c.line}, m_log.messages(16));
}

INSTANTIATE_TEST_SUITE_P(
    Cases, ServiceCheck,
    ::testing::Values(
        ServiceCase{"running", TaskSchedulerFaults::eCALL_COUNT, 0, 0, false, true, ""},
        ServiceCase{"markedStopped", TaskSchedulerFaults::eCALL_COUNT, 0, SERVICE_STOPPED, false, false,
                    "CScheduledTaskHelper::checkSchedulerServiceRunning: fail getting status for service 'Schedule', "
                    "last error is 1062"},
        ServiceCase{"folderUnusable", TaskSchedulerFaults::eCALL_COUNT, 0, 0, true, false,
                    "CScheduledTaskHelper::checkSchedulerServiceRunning: fail getting status for service 'Schedule', "
                    "last error is 1062"},
        ServiceCase{"paused", TaskSchedulerFaults::eCALL_COUNT, 0, SERVICE_PAUSED, false, false,
                    "CScheduledTaskHelper::checkSchedulerServiceRunning: service 'Schedule' is not running"},
        ServiceCase{"noManager", TaskSchedulerFaults::eOpenSCManager, 5, 0, false, false,
                    "CScheduledTaskHelper::checkSchedulerServiceRunning: error getting service manager, last error is "
                    "'5'"},
        ServiceCase{"noService", TaskSchedulerFaults::eOpenService, 1060, 0, false, false,
                    "CScheduledTaskHelper::checkSchedulerServiceRunning: fail getting service 'Schedule', last error "
                    "is '1060'"}),
    [](const auto& info) { return std::string(info.param.name); });

TEST_F(ScheduledTaskFixture, NullLogFunctionLogsNothing)
{
    const TesselLogFunction saved = s_logFunction;
    ASSERT_EQ(&TesselLog_Static::log_static, saved);
    s_logFunction = nullptr;
    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    EXPECT_EQ(eTASK_NOT_REGISTERED, helper.checkScheduledTask());
    s_logFunction = saved;
    EXPECT_TRUE(m_log.messages().empty());
}

TEST(AbsolutePathLowercase, LowersAsciiAndResolvesRelativeParts)
{
    char cwd[4096];
    ASSERT_NE(nullptr, getcwd(cwd, sizeof cwd));
    const std::string base = cwd;
    EXPECT_EQ(toUtf8(getAbsolutePathLowercase(L"/Opt/AGENT/../Agent/Up.EXE").c_str()), "/opt/agent/up.exe");
    const std::string relative = toUtf8(getAbsolutePathLowercase(L"Sub/X").c_str());
    std::string expected = base + "/sub/x";
    for (char& c : expected)
        if (c >= 'A' && c <= 'Z')
            c = static_cast<char>(c - 'A' + 'a');
    EXPECT_EQ(expected, relative);
    EXPECT_EQ(std::string("/caf\xc3\x89"), toUtf8(getAbsolutePathLowercase(L"/CAF\u00C9").c_str()));
}
