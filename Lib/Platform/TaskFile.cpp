#include "TaskFile.h"

#include "CronTable.h"
#include "EffectiveUser.h"
#include "SettingsFile.h"
#include "TaskSchedulerSettings.h"
#include "TesselLog_Static.h"
#include "Win32ErrnoMap.h"

#include <pugixml.hpp>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <limits>
#include <sstream>

namespace
{
const char kVersion[] = "1";

HRESULT fromErrno(int value)
{
    if (value == EACCES || value == EPERM)
        return E_ACCESSDENIED;
    return HRESULT_FROM_WIN32(Win32ErrnoMap::win32ErrorFromErrno(value));
}

// Reads the whole file with the settings files' limits; S_OK or the HRESULT of the failure. A file
// refused by those limits (too large, not a regular file) reads as a damaged task.
HRESULT readFile(const std::string& path, std::string& content)
{
    std::string error;
    int errorNumber = 0;
    if (SettingsFile::read(path, content, error, errorNumber))
        return S_OK;
    if (errorNumber != 0)
        return fromErrno(errorNumber);
    TesselLog_Static::log_static(TesselLog_Static::eWARNING, 0, "Win32Platform", "libWin32Platform.so", "TaskFile",
                                 L"TaskFile: '%S' refused: %S", path.c_str(), error.c_str());
    return SCHED_E_UNKNOWN_OBJECT_VERSION;
}

bool readNumber(const pugi::xml_node& node, const char* name, unsigned long max, unsigned long& value)
{
    const pugi::xml_attribute attribute = node.attribute(name);
    if (!attribute)
        return false;
    const char* text = attribute.value();
    if (text[0] < '0' || text[0] > '9')
        return false;
    char* end = nullptr;
    errno = 0;
    const unsigned long long parsed = std::strtoull(text, &end, 10);
    if (errno != 0 || *end != '\0' || parsed > max)
        return false;
    value = static_cast<unsigned long>(parsed);
    return true;
}

bool readWord(const pugi::xml_node& node, const char* name, WORD& value)
{
    unsigned long parsed = 0;
    if (!readNumber(node, name, 0xFFFF, parsed))
        return false;
    value = static_cast<WORD>(parsed);
    return true;
}

bool readDword(const pugi::xml_node& node, const char* name, DWORD& value)
{
    unsigned long parsed = 0;
    if (!readNumber(node, name, 0xFFFFFFFFul, parsed))
        return false;
    value = static_cast<DWORD>(parsed);
    return true;
}

bool readTrigger(const pugi::xml_node& node, TASK_TRIGGER& trigger)
{
    std::memset(&trigger, 0, sizeof trigger);
    trigger.cbTriggerSize = sizeof(TASK_TRIGGER);
    DWORD type = 0;
    bool ok = readDword(node, "type", type) && readWord(node, "beginYear", trigger.wBeginYear) &&
              readWord(node, "beginMonth", trigger.wBeginMonth) && readWord(node, "beginDay", trigger.wBeginDay) &&
              readWord(node, "endYear", trigger.wEndYear) && readWord(node, "endMonth", trigger.wEndMonth) &&
              readWord(node, "endDay", trigger.wEndDay) && readWord(node, "startHour", trigger.wStartHour) &&
              readWord(node, "startMinute", trigger.wStartMinute) &&
              readDword(node, "minutesDuration", trigger.MinutesDuration) &&
              readDword(node, "minutesInterval", trigger.MinutesInterval) &&
              readDword(node, "flags", trigger.rgFlags) &&
              readWord(node, "randomMinutesInterval", trigger.wRandomMinutesInterval);
    if (!ok || type > TASK_EVENT_TRIGGER_AT_LOGON)
        return false;
    trigger.TriggerType = static_cast<TASK_TRIGGER_TYPE>(type);
    switch (trigger.TriggerType)
    {
    case TASK_TIME_TRIGGER_DAILY:
        ok = readWord(node, "daysInterval", trigger.Type.Daily.DaysInterval);
        break;
    case TASK_TIME_TRIGGER_WEEKLY:
        ok = readWord(node, "weeksInterval", trigger.Type.Weekly.WeeksInterval) &&
             readWord(node, "daysOfTheWeek", trigger.Type.Weekly.rgfDaysOfTheWeek);
        break;
    case TASK_TIME_TRIGGER_MONTHLYDATE:
        ok = readDword(node, "days", trigger.Type.MonthlyDate.rgfDays) &&
             readWord(node, "months", trigger.Type.MonthlyDate.rgfMonths);
        break;
    case TASK_TIME_TRIGGER_MONTHLYDOW:
        ok = readWord(node, "whichWeek", trigger.Type.MonthlyDOW.wWhichWeek) &&
             readWord(node, "daysOfTheWeek", trigger.Type.MonthlyDOW.rgfDaysOfTheWeek) &&
             readWord(node, "months", trigger.Type.MonthlyDOW.rgfMonths);
        break;
    default:
        break;
    }
    return ok && TaskFile::isValidTrigger(trigger);
}

void writeTrigger(pugi::xml_node node, const TASK_TRIGGER& trigger)
{
    node.append_attribute("type") = static_cast<unsigned int>(trigger.TriggerType);
    node.append_attribute("beginYear") = trigger.wBeginYear;
    node.append_attribute("beginMonth") = trigger.wBeginMonth;
    node.append_attribute("beginDay") = trigger.wBeginDay;
    node.append_attribute("endYear") = trigger.wEndYear;
    node.append_attribute("endMonth") = trigger.wEndMonth;
    node.append_attribute("endDay") = trigger.wEndDay;
    node.append_attribute("startHour") = trigger.wStartHour;
    node.append_attribute("startMinute") = trigger.wStartMinute;
    node.append_attribute("minutesDuration") = trigger.MinutesDuration;
    node.append_attribute("minutesInterval") = trigger.MinutesInterval;
    node.append_attribute("flags") = trigger.rgFlags;
    node.append_attribute("randomMinutesInterval") = trigger.wRandomMinutesInterval;
    switch (trigger.TriggerType)
    {
    case TASK_TIME_TRIGGER_DAILY:
        node.append_attribute("daysInterval") = trigger.Type.Daily.DaysInterval;
        break;
    case TASK_TIME_TRIGGER_WEEKLY:
        node.append_attribute("weeksInterval") = trigger.Type.Weekly.WeeksInterval;
        node.append_attribute("daysOfTheWeek") = trigger.Type.Weekly.rgfDaysOfTheWeek;
        break;
    case TASK_TIME_TRIGGER_MONTHLYDATE:
        node.append_attribute("days") = trigger.Type.MonthlyDate.rgfDays;
        node.append_attribute("months") = trigger.Type.MonthlyDate.rgfMonths;
        break;
    case TASK_TIME_TRIGGER_MONTHLYDOW:
        node.append_attribute("whichWeek") = trigger.Type.MonthlyDOW.wWhichWeek;
        node.append_attribute("daysOfTheWeek") = trigger.Type.MonthlyDOW.rgfDaysOfTheWeek;
        node.append_attribute("months") = trigger.Type.MonthlyDOW.rgfMonths;
        break;
    default:
        break;
    }
}

// Parses a task document: S_OK, or SCHED_E_UNKNOWN_OBJECT_VERSION when it is not one.
HRESULT parse(const std::string& content, TaskRecord& record)
{
    pugi::xml_document document;
    if (!document.load_buffer(content.data(), content.size(), pugi::parse_default, pugi::encoding_utf8))
        return SCHED_E_UNKNOWN_OBJECT_VERSION;
    const pugi::xml_node task = document.child("Task");
    if (!task || std::strcmp(task.attribute("version").value(), kVersion) != 0 || !task.attribute("owner"))
        return SCHED_E_UNKNOWN_OBJECT_VERSION;

    TaskRecord result;
    result.owner = pugi::as_wide(task.attribute("owner").value());
    result.applicationName = pugi::as_wide(task.child_value("ApplicationName"));
    result.parameters = pugi::as_wide(task.child_value("Parameters"));
    result.account = pugi::as_wide(task.child_value("Account"));
    const pugi::xml_node flags = task.child("Flags");
    const pugi::xml_node status = task.child("Status");
    DWORD statusValue = 0;
    if (!flags || !status || !readDword(flags, "value", result.flags) || !readDword(status, "value", statusValue))
        return SCHED_E_UNKNOWN_OBJECT_VERSION;
    result.status = static_cast<HRESULT>(statusValue);
    for (const pugi::xml_node node : task.child("Triggers").children())
    {
        TASK_TRIGGER trigger;
        if (std::strcmp(node.name(), "Trigger") != 0 || !readTrigger(node, trigger))
            return SCHED_E_UNKNOWN_OBJECT_VERSION;
        result.triggers.push_back(trigger);
    }
    if (result.triggers.size() > 0xFFFF)
        return SCHED_E_UNKNOWN_OBJECT_VERSION;
    record = std::move(result);
    return S_OK;
}

std::string serialise(const TaskRecord& record)
{
    pugi::xml_document document;
    pugi::xml_node task = document.append_child("Task");
    task.append_attribute("version") = kVersion;
    task.append_attribute("owner") = pugi::as_utf8(record.owner).c_str();
    task.append_child("ApplicationName").text() = pugi::as_utf8(record.applicationName).c_str();
    task.append_child("Parameters").text() = pugi::as_utf8(record.parameters).c_str();
    task.append_child("Account").text() = pugi::as_utf8(record.account).c_str();
    task.append_child("Flags").append_attribute("value") = record.flags;
    task.append_child("Status").append_attribute("value") = static_cast<DWORD>(record.status);
    pugi::xml_node triggers = task.append_child("Triggers");
    for (const TASK_TRIGGER& trigger : record.triggers)
        writeTrigger(triggers.append_child("Trigger"), trigger);
    std::ostringstream out;
    document.save(out, "  ", pugi::format_default, pugi::encoding_utf8);
    return out.str();
}

// Writes `content` to `path` atomically, creating the tasks folder when needed.
HRESULT writeAtomically(const std::string& path, const std::string& content)
{
    std::error_code folderError;
    std::filesystem::create_directories(std::filesystem::path(path).parent_path(), folderError);
    std::string error;
    int errorNumber = 0;
    if (SettingsFile::writeAtomically(path, content, error, errorNumber))
        return S_OK;
    if (errorNumber != 0)
        return fromErrno(errorNumber);
    return fromErrno(EFBIG);
}
}

bool TaskFile::isValidName(const std::wstring& name)
{
    if (name.empty() || name == L"." || name == L"..")
        return false;
    for (const wchar_t c : name)
        if (c < 0x20 || c == 0x7F || std::wcschr(L"\\/:*?\"<>|", c) != nullptr)
            return false;
    return true;
}

bool TaskFile::isValidTrigger(const TASK_TRIGGER& trigger)
{
    if (trigger.cbTriggerSize != sizeof(TASK_TRIGGER))
        return false;
    if (trigger.TriggerType < TASK_TIME_TRIGGER_ONCE || trigger.TriggerType > TASK_EVENT_TRIGGER_AT_LOGON)
        return false;
    if (trigger.wStartHour > 23 || trigger.wStartMinute > 59)
        return false;
    if (trigger.wBeginMonth < 1 || trigger.wBeginMonth > 12 || trigger.wBeginDay < 1 || trigger.wBeginDay > 31)
        return false;
    if ((trigger.rgFlags & TASK_TRIGGER_FLAG_HAS_END_DATE) != 0 &&
        (trigger.wEndMonth < 1 || trigger.wEndMonth > 12 || trigger.wEndDay < 1 || trigger.wEndDay > 31))
        return false;
    if (trigger.TriggerType == TASK_TIME_TRIGGER_DAILY && trigger.Type.Daily.DaysInterval == 0)
        return false;
    if (trigger.TriggerType == TASK_TIME_TRIGGER_WEEKLY && trigger.Type.Weekly.WeeksInterval == 0)
        return false;
    return true;
}

std::string TaskFile::pathOf(const std::wstring& name)
{
    return (std::filesystem::path(TaskSchedulerSettings::tasksFolder()) / (pugi::as_utf8(name) + ".job")).string();
}

HRESULT TaskFile::load(const std::wstring& name, TaskRecord& record)
{
    if (!isValidName(name))
        return E_INVALIDARG;
    std::string content;
    const HRESULT read = readFile(pathOf(name), content);
    if (FAILED(read))
        return read;
    TaskRecord parsed;
    const HRESULT result = parse(content, parsed);
    if (FAILED(result))
        return result;
    if (parsed.owner != EffectiveUser::loginName())
        return E_ACCESSDENIED;
    // A task cron would not run as recorded is disabled, so that it is saved again.
    if (TaskSchedulerSettings::backend() == TaskSchedulerSettings::eCron && !CronTable::isScheduled(name, parsed))
        parsed.flags |= TASK_FLAG_DISABLED;
    record = std::move(parsed);
    return S_OK;
}

HRESULT TaskFile::save(const std::wstring& name, const TaskRecord& record)
{
    if (!isValidName(name))
        return E_INVALIDARG;
    TaskRecord saved = record;
    saved.owner = EffectiveUser::loginName();
    const std::string path = pathOf(name);
    const std::string content = serialise(saved);
    if (TaskSchedulerSettings::backend() != TaskSchedulerSettings::eCron)
        return writeAtomically(path, content);
    std::string line;
    const HRESULT valid = CronTable::lineFor(name, saved, line);
    if (FAILED(valid))
        return valid;
    return CronTable::apply(CronTable::userOf(saved), name, line, [&] { return writeAtomically(path, content); });
}

HRESULT TaskFile::remove(const std::wstring& name)
{
    if (!isValidName(name))
        return E_INVALIDARG;
    const std::string path = pathOf(name);
    std::string content;
    const HRESULT read = readFile(path, content);
    // A damaged file may go (an oversized one too, but never what is not a regular file); a
    // readable one only when it is the user's own.
    struct stat info
    {};
    const bool regular = ::lstat(path.c_str(), &info) == 0 && S_ISREG(info.st_mode);
    if (FAILED(read) && (read != SCHED_E_UNKNOWN_OBJECT_VERSION || !regular))
        return read;
    TaskRecord parsed;
    const bool wellFormed = SUCCEEDED(read) && SUCCEEDED(parse(content, parsed));
    if (wellFormed && parsed.owner != EffectiveUser::loginName())
        return E_ACCESSDENIED;
    const auto unlinkFile = [&]() -> HRESULT { return ::unlink(path.c_str()) == 0 ? S_OK : fromErrno(errno); };
    if (TaskSchedulerSettings::backend() != TaskSchedulerSettings::eCron)
        return unlinkFile();
    // A damaged file names no account: its line is looked for where a new task's would be.
    return CronTable::apply(CronTable::userOf(wellFormed ? parsed : TaskRecord()), name, std::string(), unlinkFile);
}
