#include "CronTable.h"

#include "ChildProcess.h"
#include "EffectiveUser.h"
#include "SettingsFile.h"
#include "TaskSchedulerSettings.h"
#include "TesselLog_Static.h"
#include "WideString.h"
#include "Win32ErrnoMap.h"

#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <vector>

const char CronTable::kMarker[] = " # ProcToolConfiguration task: ";

namespace
{
const int kTimeoutMilliseconds = 10000;
const char kPidFile[] = "/run/crond.pid";
#ifndef ERROR_TIMEOUT
const DWORD ERROR_TIMEOUT = 1460;
#endif

void logError(const wchar_t* format, const char* first, const char* second)
{
    TesselLog_Static::log_static(TesselLog_Static::eERROR, 0, "Win32Platform", "libWin32Platform.so", "CronTable",
                                 format, first, second);
}

bool hasLineBreak(const std::wstring& text)
{
    return text.find_first_of(L"\r\n") != std::wstring::npos;
}

// '%' ends a cron command unless escaped; the name sits in a comment, so nothing else matters there.
std::string escapePercent(const std::string& text)
{
    std::string escaped;
    for (const char c : text)
    {
        if (c == '%')
            escaped += '\\';
        escaped += c;
    }
    return escaped;
}

std::vector<std::string> words(const std::string& text)
{
    std::vector<std::string> result;
    std::istringstream in(text);
    std::string word;
    while (in >> word)
        result.push_back(word);
    return result;
}

std::string absolutePath(const std::wstring& application)
{
    std::error_code error;
    const std::filesystem::path native = SettingsFile::nativePath(WideString::toUtf8(application.c_str()));
    const std::filesystem::path absolute = std::filesystem::absolute(native, error);
    return (error ? native : absolute.lexically_normal()).string();
}

bool isLineOf(const std::string& line, const std::string& marker)
{
    const size_t at = line.rfind(CronTable::kMarker);
    return at != std::string::npos && line.compare(at, std::string::npos, marker) == 0;
}

std::vector<std::string> crontabCommand(const std::string& user, const char* action)
{
    std::vector<std::string> argv{TaskSchedulerSettings::crontabCommand()};
    if (user != WideString::toUtf8(EffectiveUser::loginName().c_str()))
        argv.insert(argv.end(), {"-u", user});
    argv.push_back(action);
    return argv;
}

// S_OK for a run that exited 0; the failure otherwise, logged with what crontab said.
HRESULT outcome(const ChildProcess::Result& result, const std::string& user)
{
    if (result.startError != 0)
    {
        logError(L"CronTable: crontab for '%S' cannot be run: %S", user.c_str(), std::strerror(result.startError));
        return HRESULT_FROM_WIN32(Win32ErrnoMap::win32ErrorFromErrno(result.startError));
    }
    if (result.timedOut)
    {
        logError(L"CronTable: crontab for '%S' did not finish: %S", user.c_str(), "timed out");
        return HRESULT_FROM_WIN32(ERROR_TIMEOUT);
    }
    if (result.exitStatus != 0)
    {
        logError(L"CronTable: crontab for '%S' failed: %S", user.c_str(), result.errors.c_str());
        return E_FAIL;
    }
    return S_OK;
}

// The process of `pid` is a cron daemon, not a zombie.
bool isLiveCron(long pid)
{
    std::ifstream in("/proc/" + std::to_string(pid) + "/stat");
    std::string stat;
    std::getline(in, stat);
    const size_t open = stat.find('(');
    const size_t close = stat.rfind(')');
    if (open == std::string::npos || close == std::string::npos || close + 2 >= stat.size())
        return false;
    return stat.substr(open + 1, close - open - 1) == "cron" && stat[close + 2] != 'Z';
}
}

HRESULT CronTable::lineFor(const std::wstring& name, const TaskRecord& record, std::string& line)
{
    line.clear();
    if (hasLineBreak(name) || hasLineBreak(record.applicationName) || hasLineBreak(record.parameters) ||
        name.find(L'#') != std::wstring::npos)
        return E_INVALIDARG;
    if ((record.flags & TASK_FLAG_DISABLED) != 0 || record.applicationName.empty())
        return S_OK;
    const TASK_TRIGGER* daily = nullptr;
    for (const TASK_TRIGGER& trigger : record.triggers)
        if (trigger.TriggerType == TASK_TIME_TRIGGER_DAILY && (trigger.rgFlags & TASK_TRIGGER_FLAG_DISABLED) == 0)
        {
            daily = &trigger;
            break;
        }
    if (daily == nullptr)
        return S_OK;
    const WORD interval = daily->Type.Daily.DaysInterval;
    std::string text = std::to_string(daily->wStartMinute) + " " + std::to_string(daily->wStartHour) + " " +
                       (interval > 1 ? "*/" + std::to_string(interval) : std::string("*")) + " * * " +
                       quoteWord(absolutePath(record.applicationName));
    for (const std::string& word : words(WideString::toUtf8(record.parameters.c_str())))
        text += " " + quoteWord(word);
    line = text + kMarker + escapePercent(WideString::toUtf8(name.c_str()));
    return S_OK;
}

std::string CronTable::quoteWord(const std::string& word)
{
    std::string quoted = "'";
    for (const char c : word)
    {
        if (c == '\'')
        {
            quoted += "'\\''";
        }
        else if (c == '%')
        {
            // Cron keeps a backslash before anything but '%': an empty quoted string keeps the
            // word's own backslash away from the escape.
            if (quoted.back() == '\\')
                quoted += "''";
            quoted += "\\%";
        }
        else
        {
            quoted += c;
        }
    }
    return quoted + "'";
}

std::string CronTable::findLine(const std::string& table, const std::wstring& name)
{
    const std::string marker = kMarker + escapePercent(WideString::toUtf8(name.c_str()));
    std::istringstream in(table);
    std::string line;
    while (std::getline(in, line))
        if (isLineOf(line, marker))
            return line;
    return std::string();
}

std::string CronTable::withLine(const std::string& table, const std::wstring& name, const std::string& line)
{
    const std::string marker = kMarker + escapePercent(WideString::toUtf8(name.c_str()));
    std::string result;
    size_t start = 0;
    while (start < table.size())
    {
        const size_t end = table.find('\n', start);
        const size_t next = end == std::string::npos ? table.size() : end + 1;
        const size_t length = (end == std::string::npos ? table.size() : end) - start;
        if (!isLineOf(table.substr(start, length), marker))
            result.append(table, start, next - start);
        start = next;
    }
    if (!line.empty())
    {
        if (!result.empty() && result.back() != '\n')
            result += '\n';
        result += line + '\n';
    }
    return result;
}

std::string CronTable::userOf(const TaskRecord& record)
{
    const std::string user = TaskSchedulerSettings::cronUser();
    if (!user.empty())
        return user;
    if (!record.account.empty())
        return WideString::toUtf8(record.account.c_str());
    return WideString::toUtf8(EffectiveUser::loginName().c_str());
}

HRESULT CronTable::read(const std::string& user, std::string& table)
{
    const ChildProcess::Result result =
        ChildProcess::run(crontabCommand(user, "-l"), std::string(), kTimeoutMilliseconds);
    if (result.startError == 0 && !result.timedOut && result.exitStatus == 1 &&
        result.errors.find("no crontab for") != std::string::npos)
    {
        table.clear();
        return S_OK;
    }
    const HRESULT hr = outcome(result, user);
    if (SUCCEEDED(hr))
        table = result.output;
    return hr;
}

HRESULT CronTable::install(const std::string& user, const std::string& table)
{
    return outcome(ChildProcess::run(crontabCommand(user, "-"), table, kTimeoutMilliseconds), user);
}

HRESULT CronTable::apply(const std::string& user, const std::wstring& name, const std::string& line,
                         const std::function<HRESULT()>& commit)
{
    std::string before;
    HRESULT hr = read(user, before);
    if (FAILED(hr))
        return hr;
    const std::string after = withLine(before, name, line);
    if (after == before)
        return commit();
    hr = install(user, after);
    if (FAILED(hr))
        return hr;
    const HRESULT committed = commit();
    if (FAILED(committed) && FAILED(install(user, before)))
        logError(L"CronTable: the crontab of '%S' keeps the line of '%S' its task file lacks", user.c_str(),
                 WideString::toUtf8(name.c_str()).c_str());
    return committed;
}

bool CronTable::isScheduled(const std::wstring& name, const TaskRecord& record)
{
    std::string expected;
    std::string table;
    return SUCCEEDED(lineFor(name, record, expected)) && SUCCEEDED(read(userOf(record), table)) &&
           findLine(table, name) == expected;
}

bool CronTable::daemonRunning()
{
    std::error_code error;
    if (std::filesystem::is_directory("/run/systemd/system", error))
    {
        const ChildProcess::Result result =
            ChildProcess::run({"systemctl", "is-active", "--quiet", "cron"}, std::string(), kTimeoutMilliseconds);
        return result.startError == 0 && !result.timedOut && result.exitStatus == 0;
    }
    std::ifstream in(kPidFile);
    long pid = 0;
    return static_cast<bool>(in >> pid) && pid > 0 && isLiveCron(pid);
}
