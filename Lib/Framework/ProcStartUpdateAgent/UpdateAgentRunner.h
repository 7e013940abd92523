#pragma once

#include "IProcStartUpdateAgent.h"

#include <mutex>
#include <optional>
#include <string>

// The update-agent starter's work, shared by the component and its proxies so that a check under
// way on a worker thread outlives the component. Thread-safe.
class UpdateAgentRunner
{
public:
    UpdateAgentRunner();

    bool isOnlineUpdateEnabled() const;
    IProcStartUpdateAgent::_enum_CheckConfigurationPreparer checkConfigurationPreparer() const;

    void setTestAnswer(int answer, int delayMilliseconds);
    void clearTestAnswer();
    void setTimeoutMilliseconds(int milliseconds);

private:
    struct TestAnswer
    {
        int answer;
        int delayMilliseconds;
    };

    // Runs the agent; its answer is minus its exit status.
    static int runAgent(const std::string& executable, const std::string& settings, int timeoutMilliseconds);

    mutable std::mutex m_mutex;
    std::optional<TestAnswer> m_testAnswer;
    int m_timeoutMilliseconds;
};
