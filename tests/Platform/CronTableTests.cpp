#include "CronTable.h"
#include "CronUser.h"
#include "TaskFile.h"
#include "TempDir.h"
#include "Triggers.h"
#include "Win32Service.h"

#include <gtest/gtest.h>

#include <sys/stat.h>

#include <cstring>

namespace
{
TaskRecord dailyTask(const std::wstring& application, const std::wstring& parameters, WORD hour, WORD minute)
{
    TaskRecord record;
    record.applicationName = application, record.parameters = parameters, record.triggers = {makeTrigger(hour, minute)};
    return record;
}

// The command cron gives the shell: up to the first bare '%', with "\%" read as '%'.
std::string asCronRuns(const std::string& command)
{
    std::string out;
    for (size_t i = 0; i < command.size() && command[i] != '%'; ++i)
    {
        if (command[i] == '\\' && i + 1 < command.size() && command[i + 1] != '%')
            out += command[i++];
        else if (command[i] == '\\' && i + 1 < command.size())
            ++i;
        out += command[i];
    }
    return out;
}
}

// Each hostile word reaches the program as it was: through cron's '%' handling and the shell. Then
// the whole line; a line break in any field, or a '#' in the name, is refused.
TEST(CronLine, WordsReachTheProgramUnchangedAndBadFieldsAreRefused)
{
    std::string line;
    for (const char* word : {"it's", "50%", "a\\%b", "\\", "%%", "\\\\%", "$(id)", "`id`", ";", "\"", "'%'", "#", "*"})
    {
        const std::wstring parameters = L"[%s] " + std::wstring(word, word + std::strlen(word));
        ASSERT_EQ(S_OK, CronTable::lineFor(L"Task", dailyTask(L"/usr/bin/printf", parameters, 7, 30), line));
        ASSERT_EQ(0u, line.find("30 7 * * * ")) << line;
        const auto run = ChildProcess::run({"/bin/sh", "-c", asCronRuns(line.substr(11))}, std::string(), 10000);
        EXPECT_EQ("[" + std::string(word) + "]", run.output) << line;
    }
    TaskRecord record = dailyTask(L"/opt/agent dir/agent.sh", L" preparer  50% ", 7, 5);
    record.triggers[0].Type.Daily.DaysInterval = 3;
    EXPECT_EQ(S_OK, CronTable::lineFor(L"Daily % 1", record, line));
    EXPECT_EQ("5 7 */3 * * '/opt/agent dir/agent.sh' 'preparer' '50\\%' # ProcToolConfiguration task: Daily \\% 1",
              line);
    for (const auto& [name, application, parameters] :
         {std::make_tuple(L"Daily", L"/bin/x", L"a\nb"), std::make_tuple(L"Daily", L"/bin/x\r", L""),
          std::make_tuple(L"Daily #2", L"/bin/x", L"")})
        EXPECT_EQ(E_INVALIDARG, CronTable::lineFor(name, dailyTask(application, parameters, 1, 2), line));
    record.flags = TASK_FLAG_DISABLED;
    EXPECT_EQ(S_OK, CronTable::lineFor(L"Daily", record, line));
    EXPECT_EQ("", line);
}

// Only the task's own line changes: not a task whose name starts or ends the same way.
TEST(CronLine, TableKeepsOtherLines)
{
    const std::string marker = CronTable::kMarker;
    const std::string foreign = "# mine\n\n0 5 * * * x" + marker + "Daily 2\n  \n1 1 * * * x" + marker + "Daily\\%\n";
    const std::string first = "0 7 * * * 'a'" + marker + "Daily", second = "0 8 * * * 'b'" + marker + "Daily";
    const std::string added = CronTable::withLine(foreign, L"Daily", first);
    EXPECT_EQ(foreign + first + "\n", added);
    EXPECT_EQ(foreign + second + "\n", CronTable::withLine(added, L"Daily", second));
    EXPECT_EQ(foreign, CronTable::withLine(added, L"Daily", ""));
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
        CronUser::setTable(m_user, kForeign);
    }
    void TearDown() override
    {
        CronUser::setTable(m_user, std::string());
        TaskSchedulerSettings::setBackend(TaskSchedulerSettings::eFiles);
        TaskSchedulerSettings::setCronUser(std::string());
        TaskSchedulerSettings::setCrontabCommand(std::string());
        TaskSchedulerSettings::setTasksFolder(std::string());
    }
    static HRESULT save(WORD hour, WORD minute)
    {
        return TaskFile::save(L"Daily", dailyTask(L"/usr/bin/true", L"preparer", hour, minute));
    }
    static bool disabled()
    {
        TaskRecord record;
        EXPECT_EQ(S_OK, TaskFile::load(L"Daily", record));
        return (record.flags & TASK_FLAG_DISABLED) != 0;
    }
    std::string withLine(const char* time) const
    {
        return kForeign + time + " * * * '/usr/bin/true' 'preparer'" + CronTable::kMarker + "Daily\n";
    }

    const std::string kForeign = "# the user's own\nMAILTO=\"\"\n0 5 * * * /bin/echo '50\\%'   # note\n";
    TempDir m_dir;
    std::string m_user;
};
}

// A task whose line is gone or was edited reads as disabled.
TEST_F(CronTaskLayer, SaveReplaceAndDeleteKeepTheUsersLinesAndAMissingOrChangedLineDisables)
{
    ASSERT_EQ(S_OK, save(7, 30));
    EXPECT_EQ(withLine("30 7"), CronUser::table(m_user));
    EXPECT_FALSE(disabled());
    CronUser::setTable(m_user, kForeign);
    EXPECT_TRUE(disabled());
    CronUser::setTable(m_user, withLine("31 7"));
    EXPECT_TRUE(disabled());
    ASSERT_EQ(S_OK, save(21, 5));
    EXPECT_EQ(withLine("5 21"), CronUser::table(m_user));
    EXPECT_EQ(S_OK, TaskFile::remove(L"Daily"));
    EXPECT_EQ(kForeign, CronUser::table(m_user));
}

// Either write failing leaves both the task file and the crontab as they were.
TEST_F(CronTaskLayer, SaveIsOneStep)
{
    ASSERT_EQ(S_OK, save(7, 30));
    const std::string file = TempDir::read(TaskFile::pathOf(L"Daily"));
    // A crontab that lists but refuses to install, then none at all.
    const std::string refusing = m_dir.file("crontab");
    TempDir::write(refusing, "#!/bin/sh\nfor a; do [ \"$a\" = -l ] && exec crontab \"$@\"; done\nexit 1\n");
    ASSERT_EQ(0, ::chmod(refusing.c_str(), 0755));
    for (const std::string& command : {refusing, m_dir.file("no-crontab")})
    {
        TaskSchedulerSettings::setCrontabCommand(command);
        EXPECT_TRUE(FAILED(save(8, 0))) << command;
        EXPECT_EQ(file, TempDir::read(TaskFile::pathOf(L"Daily"))) << command;
        EXPECT_TRUE(FAILED(TaskFile::remove(L"Daily"))) << command;
    }
    TaskSchedulerSettings::setCrontabCommand(std::string());
    EXPECT_EQ(withLine("30 7"), CronUser::table(m_user));
    // A tasks folder that cannot be made: the line put in first is taken out again.
    TempDir::write(m_dir.file("blocker"), "a file");
    TaskSchedulerSettings::setTasksFolder(m_dir.file("blocker") + "/Tasks");
    EXPECT_EQ(HRESULT_FROM_WIN32(3), save(9, 0));
    EXPECT_EQ(withLine("30 7"), CronUser::table(m_user));
}
