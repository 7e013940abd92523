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
class CronUser
{
public:
    // The user's name, or empty with `why` saying why the cron tests cannot run.
    static std::string name(std::string& why)
    {
        const char* user = std::getenv("PTC_CRON_TEST_USER");
        if (user == nullptr || user[0] == '\0')
        {
            why = "PTC_CRON_TEST_USER names no user whose crontab the test may use (scripts/test makes one)";
            return std::string();
        }
        if (getpwnam(user) == nullptr || !TaskSchedulerSettings::crontabAvailable())
        {
            ADD_FAILURE() << "PTC_CRON_TEST_USER=" << user << " but that user or the crontab program is missing";
            why = "no such user or no crontab";
            return std::string();
        }
        return user;
    }

    // The user's table as crontab lists it; empty when there is none.
    static std::string table(const std::string& user)
    {
        const ChildProcess::Result listed = ChildProcess::run({"crontab", "-u", user, "-l"}, std::string(), 10000);
        return listed.exitStatus == 0 ? listed.output : std::string();
    }

    // Installs `table`; an empty one removes the user's crontab.
    static void setTable(const std::string& user, const std::string& table)
    {
        const ChildProcess::Result done =
            table.empty() ? ChildProcess::run({"crontab", "-u", user, "-r"}, std::string(), 10000)
                          : ChildProcess::run({"crontab", "-u", user, "-"}, table, 10000);
        EXPECT_TRUE(done.exitStatus == 0 || table.empty()) << done.errors;
    }
};
