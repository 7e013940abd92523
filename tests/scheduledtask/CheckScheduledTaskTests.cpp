#include "ScheduledTaskTestSupport.h"

#include <filesystem>

using namespace OnlineUpdateCommand_NS;

namespace
{
struct CheckCase
{
    const char* name;
    void (*mutate)(TaskRecord&);
    const wchar_t* application;  // expected by the parameters
    const wchar_t* hour;
    const wchar_t* minute;
    _enum_CheckConfigurationScheduledTaskResult expected;
    int level;         // of the one expected line, 0 for none
    const char* line;
};

void none(TaskRecord&) {}

class CheckTask : public ScheduledTaskFixture, public ::testing::WithParamInterface<CheckCase>
{
};

// Each way out of the check, on a task saved in the scheduler.
TEST_P(CheckTask, ClassifiesTheStoredTask)
{
    const CheckCase& c = GetParam();
    TaskRecord record = goodRecord();
    c.mutate(record);
    writeTask(storedName(L"UpdTask"), record, user());

    ScheduledTaskParams params(L"UpdTask", c.application, L"preparer", c.hour, c.minute);
    CScheduledTaskHelper helper(params);
    EXPECT_EQ(c.expected, helper.checkScheduledTask());
    if (c.level == 0)
    {
        EXPECT_TRUE(m_log.messages().empty());
    }
    else
    {
        EXPECT_EQ(std::vector<std::string>{c.line}, m_log.messages(c.level));
        EXPECT_EQ(1u, m_log.messages().size());
    }
}

const wchar_t kApp[] = L"/opt/agent/UpdaterAgent";

INSTANTIATE_TEST_SUITE_P(
    Cases, CheckTask,
    ::testing::Values(
        CheckCase{"matching", none, kApp, L"07", L"05", eOK, 0, ""},
        CheckCase{"ready", [](TaskRecord& r) { r.status = SCHED_S_TASK_READY; }, kApp, L"07", L"05", eOK, 0, ""},
        CheckCase{"running", [](TaskRecord& r) { r.status = SCHED_S_TASK_RUNNING; }, kApp, L"07", L"05", eOK, 0, ""},
        CheckCase{"disabled", [](TaskRecord& r) { r.flags |= TASK_FLAG_DISABLED; }, kApp, L"07", L"05",
                  eWRONG_SETTINGS, 16,
                  "CScheduledTaskHelper::checkScheduledTask: task has invalid or unknown status '267010'"},
        CheckCase{"noTriggers", [](TaskRecord& r) { r.triggers.clear(); }, kApp, L"07", L"05", eWRONG_SETTINGS, 16,
                  "CScheduledTaskHelper::checkScheduledTask: task has invalid or unknown status '267015'"},
        CheckCase{"terminated", [](TaskRecord& r) { r.status = SCHED_S_TASK_TERMINATED; }, kApp, L"07", L"05",
                  eWRONG_SETTINGS, 16,
                  "CScheduledTaskHelper::checkScheduledTask: task has invalid or unknown status '267014'"},
        CheckCase{"flagsWithoutLoggedOn", [](TaskRecord& r) { r.flags = TASK_FLAG_INTERACTIVE; }, kApp, L"07", L"05",
                  eWRONG_SETTINGS, 16,
                  "CScheduledTaskHelper::checkScheduledTask: task flags '1' not set to run only if logged in, this "
                  "creates message problems"},
        CheckCase{"onlyLoggedOnFlag", [](TaskRecord& r) { r.flags = TASK_FLAG_RUN_ONLY_IF_LOGGED_ON; }, kApp, L"07",
                  L"05", eOK, 0, ""},
        CheckCase{"parametersCase", [](TaskRecord& r) { r.parameters = L"Preparer"; }, kApp, L"07", L"05",
                  eWRONG_SETTINGS, 1,
                  "CScheduledTaskHelper::checkScheduledTask: invalid startup parameters 'Preparer' - 'preparer' "
                  "expected"},
        CheckCase{"executableCase", [](TaskRecord& r) { r.applicationName = L"/OPT/Agent/UPDATERagent"; }, kApp,
                  L"07", L"05", eOK, 0, ""},
        CheckCase{"executableEquivalentPath",
                  [](TaskRecord& r) { r.applicationName = L"/opt/tools/../agent/./UpdaterAgent"; }, kApp, L"07",
                  L"05", eOK, 0, ""},
        CheckCase{"executableRelativeToCurrentFolder",
                  [](TaskRecord& r) {
                      r.applicationName = (std::filesystem::current_path() / "agent" / "UpdaterAgent").wstring();
                  },
                  L"agent/UpdaterAgent", L"07", L"05", eOK, 0, ""},
        CheckCase{"executableDiffers", [](TaskRecord& r) { r.applicationName = L"/opt/agent/Other"; }, kApp, L"07",
                  L"05", eWRONG_SETTINGS, 16,
                  "CScheduledTaskHelper::checkScheduledTask: unexpeted executable '/opt/agent/Other' (abs path "
                  "'/opt/agent/other') - should be '/opt/agent/UpdaterAgent' with abs path "
                  "'/opt/agent/updateragent')"},
        CheckCase{"weeklyTrigger",
                  [](TaskRecord& r) { r.triggers[0] = ScheduledTaskFixture::trigger(TASK_TIME_TRIGGER_WEEKLY, 7, 5); }, kApp, L"07",
                  L"05", eWRONG_SETTINGS, 16,
                  "CScheduledTaskHelper::checkScheduledTask: unexpected (not daily) trigger settings '2'"},
        CheckCase{"onlyFirstTriggerExamined",
                  [](TaskRecord& r) { r.triggers.push_back(ScheduledTaskFixture::trigger(TASK_TIME_TRIGGER_WEEKLY, 9, 0)); }, kApp, L"07",
                  L"05", eOK, 0, ""},
        CheckCase{"startMinuteDiffers", [](TaskRecord& r) { r.triggers[0].wStartMinute = 6; }, kApp, L"07", L"05",
                  eWRONG_SETTINGS, 16,
                  "CScheduledTaskHelper::checkScheduledTask: unexpected execution time '07h:06m', should be "
                  "'07h:05m' (string: '07h:05m')"},
        CheckCase{"startTextsWithoutZeros", none, kApp, L"7", L"5", eOK, 0, ""},
        CheckCase{"startTextOfCutTime", none, kApp, L"7:", L"05", eOK, 0, ""}),
    [](const auto& info) { return std::string(info.param.name); });

TEST_F(ScheduledTaskFixture, CheckOfAbsentOrForbiddenTask)
{
    ScheduledTaskParams params(L"UpdTask", kApp, L"preparer", L"07", L"05");
    CScheduledTaskHelper helper(params);
    const std::string name = toUtf8(storedName(L"UpdTask"));
    EXPECT_EQ(eTASK_NOT_REGISTERED, helper.checkScheduledTask());
    EXPECT_EQ(std::vector<std::string>{"CScheduledTaskHelper::checkScheduledTask: task('" + name +
                                       "') does not exist, and flag to fail if task not found is true"},
              m_log.messages(16));
    m_log.clear();

    writeTask(storedName(L"UpdTask"), goodRecord(), L"administrator");
    EXPECT_EQ(eCAN_NOT_ACCESS_SERVICE, helper.checkScheduledTask());
    EXPECT_EQ(std::vector<std::string>{"CScheduledTaskHelper::checkScheduledTask: task('" + name +
                                       "') probably exists but current user rights do not allow to access it (did "
                                       "you change this login from admin to normal user?), and flag to fail if task "
                                       "not found is true"},
              m_log.messages(16));
    EXPECT_EQ(1u, m_log.messages(1).size());
}
}
