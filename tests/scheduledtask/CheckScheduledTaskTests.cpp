#include "ScheduledTaskTestSupport.h"

#include <filesystem>
#include <tuple>

namespace
{
// Each way out of the check, on a task saved in the scheduler: a change of the good record, the
// result, the one line logged after "CScheduledTaskHelper::checkScheduledTask: ", the application.
TEST_F(ScheduledTaskTest, CheckClassifiesTheStoredTask)
{
    using Change = void (*)(TaskRecord&);
    const auto kWrong = eWRONG_SETTINGS;
    const std::tuple<Change, _enum_CheckConfigurationScheduledTaskResult, const char*, const wchar_t*> cases[] = {
        {[](TaskRecord&) {}, eOK, "", kApp},
        {[](TaskRecord& r) { r.status = SCHED_S_TASK_READY; }, eOK, "", kApp},
        {[](TaskRecord& r) { r.status = SCHED_S_TASK_RUNNING; }, eOK, "", kApp},
        {[](TaskRecord& r) { r.status = SCHED_S_TASK_TERMINATED; }, kWrong,
         "task has invalid or unknown status '267014'", kApp},
        {[](TaskRecord& r) { r.flags = TASK_FLAG_INTERACTIVE; }, kWrong,
         "task flags '1' not set to run only if logged in, this creates message problems", kApp},
        {[](TaskRecord& r) { r.parameters = L"Preparer"; }, kWrong,
         "invalid startup parameters 'Preparer' - 'preparer' expected", kApp},
        {[](TaskRecord& r) { r.applicationName = L"/OPT/Agent/UPDATERagent"; }, eOK, "", kApp},
        {[](TaskRecord& r) { r.applicationName = (std::filesystem::current_path() / "agent/UpdaterAgent").wstring(); },
         eOK, "", L"agent/UpdaterAgent"},
        {[](TaskRecord& r) { r.applicationName = L"/opt/agent/Other"; }, kWrong,
         "unexpeted executable '/opt/agent/Other' (abs path '/opt/agent/other') - should be "
         "'/opt/agent/UpdaterAgent' with abs path '/opt/agent/updateragent')",
         kApp},
        {[](TaskRecord& r) { r.triggers[0].TriggerType = TASK_TIME_TRIGGER_WEEKLY; }, kWrong,
         "unexpected (not daily) trigger settings '2'", kApp},
        {[](TaskRecord& r) { r.triggers[0].wStartMinute = 6; }, kWrong,
         "unexpected execution time '07h:06m', should be '07h:05m' (string: '07h:05m')", kApp}};
    for (const auto& [change, expected, line, application] : cases)
    {
        SCOPED_TRACE(line);
        TaskRecord record = goodRecord();
        change(record);
        writeTask(record);
        ScheduledTaskParams params(L"UpdTask", application, L"preparer", L"07", L"05");
        CScheduledTaskHelper helper(params);
        m_log.clear();
        EXPECT_EQ(helper.checkScheduledTask(), expected);
        EXPECT_EQ(m_log.messages(),
                  *line ? Lines{"CScheduledTaskHelper::checkScheduledTask: " + std::string(line)} : Lines());
    }
}

TEST_F(ScheduledTaskTest, CheckOfAbsentOrForbiddenTask)
{
    const std::string line = "CScheduledTaskHelper::checkScheduledTask: task('" + stored() + "') ";
    EXPECT_EQ(m_helper.checkScheduledTask(), eTASK_NOT_REGISTERED);
    writeTask(goodRecord(), "administrator");
    EXPECT_EQ(m_helper.checkScheduledTask(), eCAN_NOT_ACCESS_SERVICE);
    EXPECT_EQ(m_log.messages(16),
              (Lines{line + "does not exist, and flag to fail if task not found is true",
                     line + "probably exists but current user rights do not allow to access it (did you change this "
                            "login from admin to normal user?), and flag to fail if task not found is true"}));
}
}
