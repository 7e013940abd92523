#pragma once

#include "TaskRecord.h"

#include <functional>
#include <string>

// The tasks' lines in a user's crontab, for the cron backend of the task scheduler. A task with an
// enabled daily trigger has one line: the trigger's minute and hour, every day (every N days of
// the month for an interval of N), the application and each word of its parameters quoted for the
// shell, and a marker comment naming the task:
//   30 7 * * * '/srv/agent/update-agent.sh' 'preparer' # ProcToolConfiguration task: Daily
// The table is read and installed through the crontab program, never in cron's spool directly;
// the other lines of the table are kept byte for byte.
class TESSEL_EXPORT CronTable
{
public:
    static const char kMarker[];

    // The task's line, without its line end; empty when the task is disabled, has no enabled
    // daily trigger or no application. E_INVALIDARG when a field holds a line break or the name a '#'.
    static HRESULT lineFor(const std::wstring& name, const TaskRecord& record, std::string& line);
    // `word` as one shell word in single quotes, its '%' escaped for cron.
    static std::string quoteWord(const std::string& word);
    // The task's line in `table`, or empty.
    static std::string findLine(const std::string& table, const std::wstring& name);
    // `table` without the task's lines, and with `line` at the end unless it is empty.
    static std::string withLine(const std::string& table, const std::wstring& name, const std::string& line);

    // The user whose crontab holds the task's line: the settings' cron user, else the task's
    // account, else the effective user.
    static std::string userOf(const TaskRecord& record);
    // The user's table (empty when the user has none), or the crontab program's failure.
    static HRESULT read(const std::string& user, std::string& table);
    static HRESULT install(const std::string& user, const std::string& table);

    // Sets `line` (empty: none) as the task's line around `commit`, the write of the task file, so
    // that both change or neither: a crontab that cannot be updated fails before `commit`; a
    // failed `commit` has the previous table installed again. The result is the first failure.
    static HRESULT apply(const std::string& user, const std::wstring& name, const std::string& line,
                         const std::function<HRESULT()>& commit);
    // True when the table holds exactly the line the task should have.
    static bool isScheduled(const std::wstring& name, const TaskRecord& record);

    // True when the cron daemon runs: systemd's answer where systemd runs, otherwise the daemon's
    // pid file naming a live cron process.
    static bool daemonRunning();
};
