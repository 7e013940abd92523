#pragma once

#include "LogCapture.h"
#include "TempDir.h"

#include "CScheduledTaskHelper.h"
#include "EffectiveUser.h"
#include "TaskFile.h"
#include "TaskScheduler.h"
#include "TaskSchedulerFaults.h"
#include "Win32Service.h"
#include "Win32System.h"

#include "WideString.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

inline std::string toUtf8(const std::wstring& text)
{
    return WideString::toUtf8(text.c_str());
}
inline std::string toUtf8(const wchar_t* text)
{
    return WideString::toUtf8(text);
}

// Each test gets its own tasks folder, a running service, no faults and a log capture.
class ScheduledTaskFixture : public ::testing::Test
{
public:
    void SetUp() override
    {
        TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks"));
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerFaults::clear();
    }
    void TearDown() override
    {
        TaskSchedulerFaults::clear();
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerSettings::setTasksFolder(std::string());
    }

    static std::wstring user() { return EffectiveUser::loginName(); }
    static std::string userUtf8() { return toUtf8(user()); }
    static std::wstring storedName(const std::wstring& base) { return base + L"_" + user(); }

    static TASK_TRIGGER trigger(TASK_TRIGGER_TYPE type, WORD hour, WORD minute)
    {
        TASK_TRIGGER t;
        std::memset(&t, 0, sizeof t);
        t.cbTriggerSize = sizeof(TASK_TRIGGER);
        t.wBeginYear = 2024;
        t.wBeginMonth = 3;
        t.wBeginDay = 14;
        t.wStartHour = hour;
        t.wStartMinute = minute;
        t.TriggerType = type;
        if (type == TASK_TIME_TRIGGER_DAILY)
            t.Type.Daily.DaysInterval = 1;
        if (type == TASK_TIME_TRIGGER_WEEKLY)
        {
            t.Type.Weekly.WeeksInterval = 1;
            t.Type.Weekly.rgfDaysOfTheWeek = 0x2;
        }
        return t;
    }

    // A task record as the helper writes it for the standard parameters.
    static TaskRecord goodRecord()
    {
        TaskRecord record;
        record.applicationName = L"/opt/agent/UpdaterAgent";
        record.parameters = L"preparer";
        record.account = user();
        record.flags = 0x2001;
        record.triggers.push_back(trigger(TASK_TIME_TRIGGER_DAILY, 7, 5));
        return record;
    }

    // Writes a task file directly, as the scheduler would, owned by `owner`.
    void writeTask(const std::wstring& name, const TaskRecord& record, const std::wstring& owner)
    {
        ASSERT_EQ(S_OK, TaskFile::save(name, record));
        if (owner == user())
            return;
        const std::string path = TaskFile::pathOf(name);
        std::string content = TempDir::read(path);
        const std::string from = "owner=\"" + userUtf8() + "\"";
        const size_t at = content.find(from);
        ASSERT_NE(std::string::npos, at);
        content.replace(at, from.size(), "owner=\"" + toUtf8(owner) + "\"");
        TempDir::write(path, content);
    }

    TempDir m_dir;
    LogCapture m_log;
};
