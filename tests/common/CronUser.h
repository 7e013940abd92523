#pragma once

#include "ChildProcess.h"
#include "TaskSchedulerSettings.h"

#include <gtest/gtest.h>

#include <pwd.h>

#include <cstdlib>
#include <string>

// The system user whose crontab the cron tests work on: PTC_CRON_TEST_USER, which scripts/test
// makes. Without the variable the cron tests are skipped; with it, a missing user or crontab
// program is a failure.
struct CronUser
{
    // The user's name, or empty with `why` saying why the cron tests cannot run.
    static std::string name(std::string& why)
    {
        const char* user = std::getenv("PTC_CRON_TEST_USER");
        why = "PTC_CRON_TEST_USER names no user whose crontab the test may use (scripts/test makes one)";
        if (user == nullptr || user[0] == '\0')
            return std::string();
        if (getpwnam(user) != nullptr && TaskSchedulerSettings::crontabAvailable())
            return user;
        ADD_FAILURE() << "PTC_CRON_TEST_USER=" << user << " but that user or the crontab program is missing";
        return std::string();
    }
    // The user's table as crontab lists it; empty when there is none.
    static std::string table(const std::string& user)
    {
        return ChildProcess::run({"crontab", "-u", user, "-l"}, std::string(), 10000).output;
    }
    // Installs `table`; an empty one removes the user's crontab.
    static void setTable(const std::string& user, const std::string& table)
    {
        if (!user.empty())
            ChildProcess::run({"crontab", "-u", user, table.empty() ? "-r" : "-"}, table, 10000);
    }
};
