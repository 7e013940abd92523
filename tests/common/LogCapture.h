#pragma once

#include "TesselLog_Static.h"
#include "WideString.h"

#include <algorithm>
#include <mutex>
#include <string>
#include <vector>

// Records every log line written while it lives.
class LogCapture
{
public:
    LogCapture()
    {
        m_handle = TesselLog_Static::addSink([this](const TesselLog_Static::Record& record) {
            std::lock_guard<std::mutex> lock(m_mutex);
            m_records.push_back(record);
        });
    }
    ~LogCapture() { TesselLog_Static::removeSink(m_handle); }
    LogCapture(const LogCapture&) = delete;
    LogCapture& operator=(const LogCapture&) = delete;

    std::vector<TesselLog_Static::Record> records() const
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        return m_records;
    }
    // Messages (UTF-8) of the given level, or of every level with 0.
    std::vector<std::string> messages(int level = 0) const
    {
        std::vector<std::string> result;
        for (const auto& r : records())
            if (level == 0 || r.level == level)
                result.push_back(WideString::toUtf8(r.message));
        return result;
    }
    bool contains(const std::string& message, int level = 0) const
    {
        const auto all = messages(level);
        return std::find(all.begin(), all.end(), message) != all.end();
    }
    bool containsSubstring(const std::string& part, int level = 0) const
    {
        for (const auto& m : messages(level))
            if (m.find(part) != std::string::npos)
                return true;
        return false;
    }
    void clear()
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_records.clear();
    }

private:
    mutable std::mutex m_mutex;
    std::vector<TesselLog_Static::Record> m_records;
    int m_handle = 0;
};
