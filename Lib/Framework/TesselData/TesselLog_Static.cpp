#include "TesselLog_Static.h"

#include "StringUtilities.h"
#include "WideString.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <ctime>
#include <limits>
#include <memory>
#include <mutex>
#include <new>
#include <thread>
#include <vector>

namespace
{
constexpr int kNoSink = std::numeric_limits<int>::max();

struct SinkEntry
{
    int handle = 0;
    int minimumLevel = 0;
    TesselLog_Static::Sink sink;
    int activeCalls = 0; // guarded by the logger's mutex
    std::atomic<bool> removed{false};
};

struct FileCloser
{
    void operator()(std::FILE* file) const { std::fclose(file); }
};

// The logger's process-wide state, behind one mutex.
struct LoggerState
{
    std::mutex mutex;
    std::condition_variable callsDone;
    // Written under the mutex, read without it so an unrecorded line costs no lock.
    std::atomic<int> level{10};
    std::atomic<bool> hasFile{false};
    // The lowest level any sink takes; above every level while there is none.
    std::atomic<int> sinkMinimum{kNoSink};
    ACE_WString path;
    std::unique_ptr<std::FILE, FileCloser> file;
    std::vector<std::shared_ptr<SinkEntry>> sinks;
    int nextHandle = 1;
};

// Built on first use and never destroyed, so objects that log from their destructors at exit
// still find the logger (lines are flushed as they are written).
class ImmortalLoggerState
{
public:
    ImmortalLoggerState() { new (m_storage) LoggerState(); }
    LoggerState& get() { return *std::launder(reinterpret_cast<LoggerState*>(m_storage)); }

private:
    alignas(LoggerState) unsigned char m_storage[sizeof(LoggerState)];
};

LoggerState& state()
{
    static ImmortalLoggerState s_state;
    return s_state.get();
}

// Sink calls this thread has taken on (pending or running), so a sink may log again or remove
// sinks without waiting for itself.
thread_local std::vector<SinkEntry*> t_held;
thread_local std::size_t t_depth = 0;
constexpr std::size_t kMaxSinkNesting = 4;
constexpr int kRecordingLevel = 10;

const char* levelName(int level)
{
    switch (level)
    {
    case TesselLog_Static::eTRACE:
        return "TRACE";
    case TesselLog_Static::eINFORMATION:
        return "INFORMATION";
    case TesselLog_Static::eWARNING:
        return "WARNING";
    case TesselLog_Static::eERROR:
        return "ERROR";
    default:
        return nullptr;
    }
}

std::string orDash(const std::string& text)
{
    return text.empty() ? std::string("-") : text;
}

std::string formatLine(const TesselLog_Static::Record& record)
{
    const auto now = std::chrono::system_clock::now();
    const std::time_t seconds = std::chrono::system_clock::to_time_t(now);
    const auto millis = std::chrono::duration_cast<std::chrono::milliseconds>(now.time_since_epoch()).count() % 1000;
    std::tm local{};
    localtime_r(&seconds, &local);
    char stamp[64];
    std::snprintf(stamp, sizeof stamp, "%04d-%02d-%02d %02d:%02d:%02d.%03d", local.tm_year + 1900, local.tm_mon + 1,
                  local.tm_mday, local.tm_hour, local.tm_min, local.tm_sec, static_cast<int>(millis));
    const char* name = levelName(record.level);
    std::string line = stamp;
    line += ' ';
    line += name != nullptr ? std::string(name) : "LEVEL" + std::to_string(record.level);
    line += ' ' + orDash(record.component) + ' ' + orDash(record.file) + ' ' + orDash(record.className);
    line += " [" + std::to_string(record.code) + "]: ";
    line += WideString::toUtf8(record.message);
    line += '\n';
    return line;
}

bool passesVerbosity(int verbosity, int level)
{
    return verbosity >= kRecordingLevel || level >= TesselLog_Static::eWARNING;
}

std::string text(const char* value)
{
    return value != nullptr ? std::string(value) : std::string();
}

void dispatch(int level, int code, const char* component, const char* file, const char* className, ACE_WString message)
{
    TesselLog_Static::Record record{level, code, text(component), text(file), text(className), std::move(message)};
    LoggerState& s = state();
    std::vector<std::shared_ptr<SinkEntry>> sinks;
    {
        std::lock_guard<std::mutex> lock(s.mutex);
        if (s.file && passesVerbosity(s.level, level))
        {
            const std::string line = formatLine(record);
            // One write per recorded line: a crash loses nothing that was logged before it.
            std::fwrite(line.data(), 1, line.size(), s.file.get());
            std::fflush(s.file.get());
        }
        if (t_depth < kMaxSinkNesting)
        {
            for (const auto& entry : s.sinks)
            {
                if (level < entry->minimumLevel)
                    continue;
                sinks.push_back(entry);
                ++entry->activeCalls;
                t_held.push_back(entry.get());
            }
        }
    }
    // Sinks run outside the lock: they may log or remove sinks themselves.
    for (auto& entry : sinks)
    {
        if (!entry->removed.load())
        {
            ++t_depth;
            try
            {
                entry->sink(record);
            }
            catch (...)
            {
                // A failing sink must not stop the others or the caller.
            }
            --t_depth;
        }
        std::lock_guard<std::mutex> lock(s.mutex);
        --entry->activeCalls;
        t_held.erase(std::find(t_held.begin(), t_held.end(), entry.get()));
        s.callsDone.notify_all();
    }
}

// Under the logger's mutex, after the sinks changed.
void updateSinkMinimum(LoggerState& s)
{
    int minimum = kNoSink;
    for (const auto& entry : s.sinks)
        minimum = std::min(minimum, entry->minimumLevel);
    s.sinkMinimum.store(minimum);
}

// Whether a line of `level` goes anywhere: the file at the current verbosity, or a sink.
bool recorded(int level)
{
    const LoggerState& s = state();
    return level >= s.sinkMinimum.load() || (s.hasFile.load() && passesVerbosity(s.level.load(), level));
}

ACE_WString messageText(const wchar_t* message)
{
    return message != nullptr ? ACE_WString(message) : ACE_WString(L"(null)");
}
}

void TesselLog_Static::logTrace_static(const char* component, const char* file, const char* className,
                                       const wchar_t* message)
{
    if (!recorded(eTRACE))
        return;
    dispatch(eTRACE, 0, component, file, className, messageText(message));
}

void TesselLog_Static::logInformation_static(const char* component, const char* file, const char* className,
                                             const wchar_t* message)
{
    if (!recorded(eINFORMATION))
        return;
    dispatch(eINFORMATION, 0, component, file, className, messageText(message));
}

void TesselLog_Static::logWarning_static(const char* component, const char* file, const char* className,
                                         const wchar_t* message)
{
    if (!recorded(eWARNING))
        return;
    dispatch(eWARNING, 0, component, file, className, messageText(message));
}

void TesselLog_Static::logError_static(const char* component, const char* file, const char* className, int code,
                                       const char* format, ...)
{
    if (!recorded(eERROR))
        return;
    va_list args;
    va_start(args, format);
    ACE_WString message = StringUtilities::narrowVsprintf(format, args);
    va_end(args);
    dispatch(eERROR, code, component, file, className, std::move(message));
}

void TesselLog_Static::logError_static(const char* component, const char* file, const char* className, int code,
                                       const wchar_t* format, ...)
{
    if (!recorded(eERROR))
        return;
    va_list args;
    va_start(args, format);
    ACE_WString message = StringUtilities::wideVsprintf(format, args);
    va_end(args);
    dispatch(eERROR, code, component, file, className, std::move(message));
}

void TesselLog_Static::log_static(int level, int code, const char* component, const char* file, const char* className,
                                  const wchar_t* format, ...)
{
    if (!recorded(level))
        return;
    va_list args;
    va_start(args, format);
    ACE_WString message = StringUtilities::wideVsprintf(format, args);
    va_end(args);
    dispatch(level, code, component, file, className, std::move(message));
}

void TesselLog_Static::setLevel_static(int level)
{
    LoggerState& s = state();
    std::lock_guard<std::mutex> lock(s.mutex);
    s.level = level;
}

int TesselLog_Static::getLevel_static()
{
    return state().level.load();
}

bool TesselLog_Static::isRecorded_static(int level)
{
    return recorded(level);
}

bool TesselLog_Static::setLogFile(const ACE_WString& path)
{
    LoggerState& s = state();
    std::unique_ptr<std::FILE, FileCloser> opened;
    if (path.length() != 0)
    {
        opened.reset(std::fopen(WideString::toUtf8(path).c_str(), "ae"));
        if (!opened)
            return false;
    }
    std::lock_guard<std::mutex> lock(s.mutex);
    s.file = std::move(opened);
    s.hasFile.store(s.file != nullptr);
    s.path = path;
    return true;
}

ACE_WString TesselLog_Static::getLogFile()
{
    LoggerState& s = state();
    std::lock_guard<std::mutex> lock(s.mutex);
    return s.path;
}

int TesselLog_Static::addSink(Sink sink, int minimumLevel)
{
    if (!sink)
        return 0;
    LoggerState& s = state();
    auto entry = std::make_shared<SinkEntry>();
    entry->sink = std::move(sink);
    entry->minimumLevel = minimumLevel;
    std::lock_guard<std::mutex> lock(s.mutex);
    entry->handle = s.nextHandle++;
    s.sinks.push_back(entry);
    updateSinkMinimum(s);
    return entry->handle;
}

void TesselLog_Static::removeSink(int handle)
{
    LoggerState& s = state();
    std::unique_lock<std::mutex> lock(s.mutex);
    const auto it = std::find_if(s.sinks.begin(), s.sinks.end(),
                                 [handle](const std::shared_ptr<SinkEntry>& e) { return e->handle == handle; });
    if (it == s.sinks.end())
        return;
    std::shared_ptr<SinkEntry> entry = *it;
    s.sinks.erase(it);
    updateSinkMinimum(s);
    entry->removed.store(true);
    // Once removed, the sink is not called any more: wait for calls running on other threads.
    const auto ownCalls = static_cast<int>(std::count(t_held.begin(), t_held.end(), entry.get()));
    s.callsDone.wait(lock, [&] { return entry->activeCalls <= ownCalls; });
}
