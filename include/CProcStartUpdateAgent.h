#pragma once

#include "CComponent_Thread_NoRef.h"
#include "IProcStartUpdateAgent.h"

#include <memory>

class IComponentManager;
class UpdateAgentRunner;

// The update-agent starter component ("proc:ProcStartUpdateAgent?ProcStartUpdateAgent").
//
// isOnlineUpdateEnabled: the data manager's bool "data:/Configuration/MenuBar/EnableOnlineUpdate"
// (false when absent). checkConfigurationPreparer: runs the executable named by the data
// manager's "data:/Configuration/OnlineUpdate/UpdateAgentExecutable" with "--check-configuration"
// followed by the settings file in use (the data manager's "data:/Auto/SystemMenu/ActivePreparateur",
// else "data:/Configuration/MenuBar/PreparateurConfigFile"; left out when neither is set), and
// answers minus its exit status (exit 0: eOK, exit 3: -3, exit 40: -40 as it comes). No
// executable, or one that cannot be started: eNOK_MISSING_UPDATE_AGENT. An agent killed by a
// signal or still running after the time limit (60 s unless set) is stopped and answers
// eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR. Every operation may be called from any thread.
class TESSEL_EXPORT CProcStartUpdateAgent : public CComponent_Thread_NoRef, public IProcStartUpdateAgent
{
public:
    static const wchar_t* const componentID;

    CProcStartUpdateAgent();
    ~CProcStartUpdateAgent() override;

    static CProcStartUpdateAgent* registerWith(IComponentManager& manager);

    bool isOnlineUpdateEnabled() override;
    _enum_CheckConfigurationPreparer checkConfigurationPreparer() override;

    // For tests: checkConfigurationPreparer answers `answer` after `delayMs` instead of running
    // the agent, until clearTestAnswer.
    void setTestAnswer(int answer, int delayMs);
    void clearTestAnswer();

    void setTimeoutMilliseconds(int milliseconds);

    // The part that does the work, shared with the proxies.
    std::shared_ptr<UpdateAgentRunner> runner() const;

private:
    std::shared_ptr<UpdateAgentRunner> m_runner;
};
