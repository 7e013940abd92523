#include "ScheduledTaskTestSupport.h"

#include <filesystem>
#include <utility>

namespace
{
// Any of the strings empty, or the user unknown, makes the parameters invalid; every operation
// then stops at its first step, before any COM call.
TEST_F(ScheduledTaskTest, InvalidParamsAreRejectedFirst)
{
    for (int empty = 0; empty < 5; ++empty)
    {
        const wchar_t* s[5] = {L"UpdTask", kApp, L"preparer", L"07", L"05"};
        s[empty] = L"";
        EXPECT_FALSE(ScheduledTaskParams(s[0], s[1], s[2], s[3], s[4]).isValid()) << empty;
    }
    Faults::inject(Faults::eGetUserName, {1332, Faults::eAUTO, 0, 1});
    ScheduledTaskParams noUser(L"UpdTask", kApp, L"preparer", L"07", L"05");
    Faults::inject(Faults::eCoInitialize, RPC_E_CHANGED_MODE); // any COM call would fail loudly
    CScheduledTaskHelper helper(noUser);
    EXPECT_EQ(run(helper, kCreate) + run(helper, kDelete) + run(helper, kAvailable), 0);
    EXPECT_EQ(helper.checkScheduledTask(), eWRONG_SETTINGS);
    EXPECT_EQ(m_log.messages().size(), 5u);
    EXPECT_TRUE(m_log.contains("CScheduledTaskHelper::checkTaskAvailableForCurrentUser: m_rParams is not valid"));
    EXPECT_EQ(utf8(getAbsolutePathLowercase(L"/Opt/AGENT/../Agent/./Up.EXE")), "/opt/agent/up.exe");
}

// Reuse deletes every old trigger, however many (they move down as each one goes), and writes
// one daily trigger; creating over an absent task is in AvailabilityForTheCurrentUser.
TEST_F(ScheduledTaskTest, CreateOverExistingTaskReplacesItUnlessItMustFail)
{
    TaskRecord old;
    old.applicationName = L"/old/app", old.parameters = L"old", old.account = user(), old.flags = 0x4;
    old.triggers = {trigger(TASK_TIME_TRIGGER_WEEKLY, 1, 0), trigger(TASK_TIME_TRIGGER_DAILY, 2, 0),
                    trigger(TASK_TIME_TRIGGER_ONCE, 3, 0)};
    writeTask(old);
    const std::string before = TempDir::read(taskPath());
    EXPECT_FALSE(m_helper.createScheduledTask(true));
    EXPECT_EQ(TempDir::read(taskPath()), before);
    ASSERT_TRUE(m_helper.createScheduledTask(false));
    EXPECT_TRUE(m_log.containsSubstring("' already exists, and flag to fail in this case is not set -> will reuse"));
    TaskRecord saved;
    ASSERT_EQ(TaskFile::load(storedName(), saved), S_OK);
    EXPECT_TRUE(saved.applicationName == kApp && saved.parameters == L"preparer" && saved.account == user());
    EXPECT_EQ(saved.flags, 0x2001u); // interactive, run only if logged on
    ASSERT_EQ(saved.triggers.size(), 1u);
    const TASK_TRIGGER& t = saved.triggers[0];
    const TASK_TRIGGER expected = trigger(TASK_TIME_TRIGGER_DAILY, 7, 5, t.wBeginYear, t.wBeginMonth, t.wBeginDay);
    EXPECT_EQ(std::memcmp(&expected, &t, sizeof expected), 0);
}

TEST_F(ScheduledTaskTest, DeleteIsToleratedUnlessItMustFail)
{
    const std::string failed = "deleteScheduledTask: ITSPtr->Delete('" + stored() +
                               "') failed with HRESULT '0x80070002' ('No such file or directory'), ";
    writeTask(goodRecord());
    EXPECT_TRUE(m_helper.deleteScheduledTask(true));
    EXPECT_FALSE(std::filesystem::exists(taskPath()));
    EXPECT_TRUE(m_helper.deleteScheduledTask(false));
    EXPECT_FALSE(m_helper.deleteScheduledTask(true));
    EXPECT_TRUE(m_log.containsSubstring(failed + "but failIfNotExists is not set") &&
                m_log.containsSubstring(failed + "and failIfNotExists is set"));
}

TEST_F(ScheduledTaskTest, AvailabilityForTheCurrentUser)
{
    EXPECT_EQ(run(m_helper, kAvailable), 1); // absent
    EXPECT_TRUE(m_helper.createScheduledTask(true));
    EXPECT_EQ(run(m_helper, kAvailable), 1 + 2); // found
    writeTask(goodRecord(), "someoneelse");
    m_log.clear();
    EXPECT_EQ(run(m_helper, kAvailable), 1 + 4); // denied
    EXPECT_TRUE(
        m_log.contains("getExistingTask: rTaskSchedPtr->Activate('" + stored() +
                       "') failed with HRESULT '0x80070005' "
                       "('Permission denied') - most likely tasks exists but we don't have privileges to access it"));
    TempDir::write(taskPath(), "<Task version=\"1\"");
    EXPECT_EQ(run(m_helper, kAvailable), 0); // damaged
}

TEST_F(ScheduledTaskTest, SchedulerServiceRunningOrWhyNot)
{
    // fault (eCALL_COUNT: none) and its last error, service state, the line logged ("": running)
    const std::tuple<Faults::Call, DWORD, DWORD, std::string> cases[] = {
        {Faults::eCALL_COUNT, 0, 0, ""},
        {Faults::eCALL_COUNT, 0, SERVICE_STOPPED, "fail getting status for service 'Schedule', last error is 1062"},
        {Faults::eCALL_COUNT, 0, SERVICE_PAUSED, "service 'Schedule' is not running"},
        {Faults::eOpenSCManager, 5, 0, "error getting service manager, last error is '5'"},
        {Faults::eOpenService, 1060, 0, "fail getting service 'Schedule', last error is '1060'"}};
    for (const auto& [call, lastError, state, line] : cases)
    {
        Faults::clear();
        Faults::inject(call, static_cast<HRESULT>(lastError));
        TaskSchedulerSettings::setServiceState(state);
        m_log.clear();
        EXPECT_EQ(CScheduledTaskHelper::checkSchedulerServiceRunning(), line.empty()) << line;
        EXPECT_EQ(m_log.messages(),
                  line.empty() ? Lines() : Lines{"CScheduledTaskHelper::checkSchedulerServiceRunning: " + line});
    }
}

// Each operation uninitialises only what it initialised: after its S_FALSE the caller's apartment
// stays (TearDown checks the S_OK case). Without a log function nothing is logged.
TEST_F(ScheduledTaskTest, OperationsLeaveTheCallersApartmentAndLogOnlyThroughTheLogFunction)
{
    ASSERT_EQ(CoInitialize(nullptr), S_OK);
    const TesselLogFunction saved = std::exchange(s_logFunction, nullptr);
    for (const Op op : {kCreate, kDelete, kAvailable, kCheck})
        run(m_helper, op);
    s_logFunction = saved;
    EXPECT_EQ(CoGetInitializeCount(), 1);
    CoUninitialize();
    EXPECT_TRUE(m_log.messages().empty());
}
}
