#include "ChildProcess.h"
#include "CronTable.h"
#include "CronUser.h"
#include "TaskFile.h"
#include "TaskScheduler.h"
#include "TempDir.h"
#include "Win32Service.h"

#include <gtest/gtest.h>

#include <sys/stat.h>

#include <cstring>

namespace
{
TaskRecord dailyTask(const std::wstring& application, const std::wstring& parameters, WORD hour, WORD minute)
{
    TASK_TRIGGER t;
    std::memset(&t, 0, sizeof t);
    t.cbTriggerSize = sizeof t, t.TriggerType = TASK_TIME_TRIGGER_DAILY, t.Type.Daily.DaysInterval = 1;
    t.wBeginYear = 2025, t.wBeginMonth = 6, t.wBeginDay = 30, t.wStartHour = hour, t.wStartMinute = minute;
    TaskRecord record;
    record.applicationName = application;
    record.parameters = parameters;
    record.flags = TASK_FLAG_INTERACTIVE | TASK_FLAG_RUN_ONLY_IF_LOGGED_ON;
    record.triggers.push_back(t);
    return record;
}

// The command cron gives the shell: up to the first bare '%', with "\%" read as '%'.
std::string asCronRuns(const std::string& command)
{
    std::string out;
    bool escaped = false;
    for (const char c : command)
    {
        if (escaped)
        {
            out += c == '%' ? "%" : std::string("\\") + c;
            escaped = false;
        }
        else if (c == '\\')
            escaped = true;
        else if (c == '%')
            break;
        else
            out += c;
    }
    return escaped ? out + "\\" : out;
}
}

// Each hostile word reaches the program as it was: through cron's '%' handling and the shell.
TEST(CronLine, WordsReachTheProgramUnchanged)
{
    for (const char* word : {"it's", "50%", "a\\%b", "\\", "%%", "\\\\%", "$(id)", "`id`", ";", "\"", "'%'",
                             "#", "a'b'c", "*", "~"})
    {
        std::string line;
        const std::wstring parameters = L"[%s] " + std::wstring(word, word + std::strlen(word));
        ASSERT_EQ(S_OK, CronTable::lineFor(L"Task", dailyTask(L"/usr/bin/printf", parameters, 7, 30), line));
        ASSERT_EQ(0u, line.find("30 7 * * * ")) << line;
        const ChildProcess::Result run =
            ChildProcess::run({"/bin/sh", "-c", asCronRuns(line.substr(11))}, std::string(), 10000);
        EXPECT_EQ(0, run.exitStatus) << line;
        EXPECT_EQ("[" + std::string(word) + "]", run.output) << line;
    }
}

// The whole line; the fields that would break it are refused.
TEST(CronLine, ShapeAndRefusedFields)
{
    std::string line;
    TaskRecord record = dailyTask(L"/opt/agent dir/agent.sh", L" preparer  50% ", 7, 5);
    EXPECT_EQ(S_OK, CronTable::lineFor(L"Daily % 1", record, line));
    EXPECT_EQ("5 7 * * * '/opt/agent dir/agent.sh' 'preparer' '50\\%' # ProcToolConfiguration task: Daily \\% 1", line);
    record.triggers[0].Type.Daily.DaysInterval = 3;
    EXPECT_EQ(S_OK, CronTable::lineFor(L"Daily", record, line));
    EXPECT_EQ(0u, line.find("5 7 */3 * * '/opt/agent dir/agent.sh'")) << line;
    for (const auto& [name, application, parameters] :
         {std::make_tuple(L"Daily", L"/bin/x", L"a\nb"), std::make_tuple(L"Daily", L"/bin/x\r", L""),
          std::make_tuple(L"Daily #2", L"/bin/x", L"")})
    {
        line = "left over";
        EXPECT_EQ(E_INVALIDARG, CronTable::lineFor(name, dailyTask(application, parameters, 1, 2), line));
        EXPECT_EQ("", line);
    }
    record.flags |= TASK_FLAG_DISABLED;
    EXPECT_EQ(S_OK, CronTable::lineFor(L"Daily", record, line));
    EXPECT_EQ("", line);
    record = dailyTask(L"/bin/x", L"", 1, 2);
    record.triggers[0].TriggerType = TASK_TIME_TRIGGER_ONCE;
    EXPECT_EQ(S_OK, CronTable::lineFor(L"Daily", record, line));
    EXPECT_EQ("", line);
}

// The task's line is added, replaced and removed; every other byte stays.
TEST(CronLine, TableKeepsOtherLines)
{
    const std::string marker = CronTable::kMarker;
    const std::string foreign = "# mine\nMAILTO=\"\"\n\n0 5 * * * /bin/true" + marker + "Daily 2\n   \n1 1 * * * x" +
                                marker + "Daily\\%\n";
    const std::string first = "0 7 * * * 'a'" + marker + "Daily";
    const std::string second = "0 8 * * * 'b'" + marker + "Daily";
    const std::string added = CronTable::withLine(foreign, L"Daily", first);
    EXPECT_EQ(foreign + first + "\n", added);
    EXPECT_EQ(first, CronTable::findLine(added, L"Daily"));
    EXPECT_EQ("1 1 * * * x" + marker + "Daily\\%", CronTable::findLine(added, L"Daily%"));
    EXPECT_EQ(foreign + second + "\n", CronTable::withLine(added, L"Daily", second));
    EXPECT_EQ(foreign, CronTable::withLine(added, L"Daily", ""));
    EXPECT_EQ("", CronTable::findLine(foreign, L"Daily"));
    EXPECT_EQ("x\n" + first + "\n", CronTable::withLine("x", L"Daily", first));
}

namespace
{
// The task layer with the cron backend on the test user's crontab, which holds lines of its own.
class CronTaskLayer : public ::testing::Test
{
protected:
    void SetUp() override
    {
        std::string why;
        m_user = CronUser::name(why);
        if (m_user.empty())
            GTEST_SKIP() << why;
        TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks"));
        TaskSchedulerSettings::setBackend(TaskSchedulerSettings::eCron);
        TaskSchedulerSettings::setCronUser(m_user);
        TaskSchedulerSettings::setServiceState(SERVICE_RUNNING);
        CronUser::setTable(m_user, kForeign);
        ASSERT_EQ(S_OK, CoInitialize(nullptr));
        void* object = nullptr;
        ASSERT_EQ(S_OK,
                  CoCreateInstance(CLSID_CTaskScheduler, nullptr, CLSCTX_INPROC_SERVER, IID_ITaskScheduler, &object));
        m_scheduler.reset(static_cast<ITaskScheduler*>(object));
    }
    void TearDown() override
    {
        if (m_user.empty())
            return;
        m_scheduler.reset();
        CoUninitialize();
        CronUser::setTable(m_user, std::string());
        TaskSchedulerSettings::setBackend(TaskSchedulerSettings::eFiles);
        TaskSchedulerSettings::setCronUser(std::string());
        TaskSchedulerSettings::setCrontabCommand(std::string());
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerSettings::setTasksFolder(std::string());
    }
    // Saves the task as new or over the saved one, with a daily trigger at hour:minute.
    HRESULT saveDaily(WORD hour, WORD minute)
    {
        IUnknown* unknown = nullptr;
        if (FAILED(m_scheduler->Activate(L"Daily", IID_ITask, &unknown)))
        {
            EXPECT_EQ(S_OK, m_scheduler->NewWorkItem(L"Daily", CLSID_CTask, IID_ITask, &unknown));
        }
        ComPtr<ITask> task(static_cast<ITask*>(unknown));
        TaskRecord record = dailyTask(L"/usr/bin/true", L"preparer", hour, minute);
        EXPECT_EQ(S_OK, task->SetApplicationName(record.applicationName.c_str()));
        EXPECT_EQ(S_OK, task->SetParameters(record.parameters.c_str()));
        EXPECT_EQ(S_OK, task->SetFlags(record.flags));
        ComPtr<ITaskTrigger> trigger;
        WORD count = 0, index = 0;
        EXPECT_EQ(S_OK, task->GetTriggerCount(&count));
        EXPECT_EQ(S_OK, count > 0 ? task->GetTrigger(0, &trigger.ref()) : task->CreateTrigger(&index, &trigger.ref()));
        EXPECT_EQ(S_OK, trigger->SetTrigger(&record.triggers[0]));
        void* persist = nullptr;
        EXPECT_EQ(S_OK, task->QueryInterface(IID_IPersistFile, &persist));
        return ComPtr<IPersistFile>(static_cast<IPersistFile*>(persist))->Save(nullptr, TRUE);
    }
    HRESULT status()
    {
        IUnknown* unknown = nullptr;
        EXPECT_EQ(S_OK, m_scheduler->Activate(L"Daily", IID_ITask, &unknown));
        ComPtr<ITask> task(static_cast<ITask*>(unknown));
        HRESULT result = S_OK;
        EXPECT_EQ(S_OK, task ? task->GetStatus(&result) : E_POINTER);
        return result;
    }
    static std::string line(const char* time)
    {
        return std::string(time) + " * * * '/usr/bin/true' 'preparer'" + CronTable::kMarker + "Daily\n";
    }

    const std::string kForeign = "# the user's own\nMAILTO=\"\"\n0 5 * * * /bin/echo '50\\%'   # note\n";
    TempDir m_dir;
    std::string m_user;
    ComPtr<ITaskScheduler> m_scheduler;
};
}

TEST_F(CronTaskLayer, SaveReplaceAndDeleteKeepTheUsersLines)
{
    ASSERT_EQ(S_OK, saveDaily(7, 30));
    EXPECT_EQ(kForeign + line("30 7"), CronUser::table(m_user));
    EXPECT_EQ(SCHED_S_TASK_HAS_NOT_RUN, status());
    ASSERT_EQ(S_OK, saveDaily(21, 5));
    EXPECT_EQ(kForeign + line("5 21"), CronUser::table(m_user));
    EXPECT_EQ(S_OK, m_scheduler->Delete(L"Daily"));
    EXPECT_EQ(kForeign, CronUser::table(m_user));
    EXPECT_FALSE(std::filesystem::exists(TaskFile::pathOf(L"Daily")));
}

// A task whose line is gone or was edited reads as disabled; saving it again restores it.
TEST_F(CronTaskLayer, MissingOrChangedLineReadsAsDisabled)
{
    ASSERT_EQ(S_OK, saveDaily(7, 30));
    CronUser::setTable(m_user, kForeign);
    EXPECT_EQ(SCHED_S_TASK_DISABLED, status());
    CronUser::setTable(m_user, kForeign + line("31 7"));
    EXPECT_EQ(SCHED_S_TASK_DISABLED, status());
    ASSERT_EQ(S_OK, saveDaily(7, 30));
    EXPECT_EQ(SCHED_S_TASK_HAS_NOT_RUN, status());
    EXPECT_EQ(kForeign + line("30 7"), CronUser::table(m_user));
}

// Either write failing leaves both the task file and the crontab as they were.
TEST_F(CronTaskLayer, SaveIsOneStep)
{
    ASSERT_EQ(S_OK, saveDaily(7, 30));
    const std::string file = TempDir::read(TaskFile::pathOf(L"Daily"));
    const std::string table = CronUser::table(m_user);
    // A crontab that lists but refuses to install, then none at all.
    const std::string refusing = m_dir.file("crontab");
    TempDir::write(refusing, "#!/bin/sh\nfor a; do [ \"$a\" = -l ] && exec crontab \"$@\"; done\nexit 1\n");
    ASSERT_EQ(0, ::chmod(refusing.c_str(), 0755));
    for (const std::string& command : {refusing, m_dir.file("no-crontab")})
    {
        TaskSchedulerSettings::setCrontabCommand(command);
        EXPECT_TRUE(FAILED(saveDaily(8, 0))) << command;
        EXPECT_EQ(file, TempDir::read(TaskFile::pathOf(L"Daily"))) << command;
        EXPECT_TRUE(FAILED(m_scheduler->Delete(L"Daily"))) << command;
        EXPECT_TRUE(std::filesystem::exists(TaskFile::pathOf(L"Daily"))) << command;
    }
    TaskSchedulerSettings::setCrontabCommand(std::string());
    EXPECT_EQ(table, CronUser::table(m_user));
    // A tasks folder that cannot be made: the line put in first is taken out again.
    TempDir::write(m_dir.file("blocker"), "a file");
    TaskSchedulerSettings::setTasksFolder(m_dir.file("blocker") + "/Tasks");
    EXPECT_EQ(HRESULT_FROM_WIN32(3), saveDaily(9, 0));
    EXPECT_EQ(table, CronUser::table(m_user));
}
