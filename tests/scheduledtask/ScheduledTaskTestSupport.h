#pragma once

#include "CScheduledTaskHelper.h"
#include "ComPtr.h"
#include "EffectiveUser.h"
#include "LogCapture.h"
#include "TaskFile.h"
#include "TaskScheduler.h"
#include "TaskSchedulerFaults.h"
#include "TempDir.h"
#include "TestText.h"
#include "Triggers.h"
#include "Win32Service.h"

#include <gtest/gtest.h>

#include <vector>

using namespace OnlineUpdateCommand_NS;
using Faults = TaskSchedulerFaults;
using Lines = std::vector<std::string>;

const wchar_t kApp[] = L"/opt/agent/UpdaterAgent";
enum Op
{
    kCreate,
    kDelete,
    kAvailable,
    kCheck
};

// Each test gets its own tasks folder, a log capture and a helper for the task "UpdTask" running
// kApp with "preparer" daily at 07:05.
class ScheduledTaskTest : public ::testing::Test
{
public:
    void SetUp() override { TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks")); }
    void TearDown() override
    {
        Faults::clear();
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerSettings::setTasksFolder(std::string());
        EXPECT_EQ(CoGetInitializeCount(), 0); // every operation leaves the apartment it entered
    }

    static std::wstring user() { return EffectiveUser::loginName(); }
    static std::wstring storedName() { return L"UpdTask_" + user(); }
    static std::string stored() { return utf8(storedName().c_str()); }
    static std::string taskPath() { return TaskFile::pathOf(storedName()); }

    // One operation, without its fail flag; the availability check answers 0 when it fails,
    // else 1, plus 2 when the task exists and 4 when access was denied.
    static int run(CScheduledTaskHelper& helper, Op op)
    {
        bool exists = false, denied = false;
        if (op == kAvailable)
            return helper.checkTaskAvailableForCurrentUser(exists, denied) ? 1 + 2 * exists + 4 * denied : 0;
        if (op == kCreate)
            return helper.createScheduledTask(false);
        if (op == kDelete)
            return helper.deleteScheduledTask(false);
        return helper.checkScheduledTask();
    }

    // Starting on 2024-03-14, every day or week.
    static TASK_TRIGGER trigger(TASK_TRIGGER_TYPE type, WORD hour, WORD minute, WORD year = 2024, WORD month = 3,
                                WORD day = 14)
    {
        return makeTrigger(hour, minute, 1, type, year, month, day);
    }

    // A task record as the helper writes it for the standard parameters.
    static TaskRecord goodRecord()
    {
        TaskRecord record;
        record.applicationName = kApp, record.parameters = L"preparer", record.account = user();
        record.flags = TASK_FLAG_INTERACTIVE | TASK_FLAG_RUN_ONLY_IF_LOGGED_ON;
        record.triggers = {trigger(TASK_TIME_TRIGGER_DAILY, 7, 5)};
        return record;
    }

    // Writes the task file directly, as the scheduler would, owned by `owner` (default: the user).
    static void writeTask(const TaskRecord& record, const std::string& owner = "")
    {
        ASSERT_EQ(TaskFile::save(storedName(), record), S_OK);
        std::string content = TempDir::read(taskPath()), from = "owner=\"" + utf8(user().c_str()) + "\"";
        if (!owner.empty())
            TempDir::write(taskPath(), content.replace(content.find(from), from.size(), "owner=\"" + owner + "\""));
    }

    TempDir m_dir;
    LogCapture m_log;
    ScheduledTaskParams m_params{L"UpdTask", kApp, L"preparer", L"07", L"05"};
    CScheduledTaskHelper m_helper{m_params};
};
