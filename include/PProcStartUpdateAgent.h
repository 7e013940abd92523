#pragma once

#include "IProcStartUpdateAgent.h"
#include "ProxyComponent.h"

#include <memory>
#include <mutex>

class CProcStartUpdateAgent;
class UpdateAgentRunner;

// Proxy of the update-agent starter ("proc:ProcStartUpdateAgent?ProcStartUpdateAgent").
class TESSEL_EXPORT PProcStartUpdateAgent : public ProxyComponent, public IProcStartUpdateAgent
{
public:
    explicit PProcStartUpdateAgent(IComponent* component);
    ~PProcStartUpdateAgent() override;

    void handleEvent(const EventDestroyingComponent& event) override;

    // False once the component is gone.
    bool isOnlineUpdateEnabled() override;
    // eNOK_NO_AGENT once the component is gone.
    _enum_CheckConfigurationPreparer checkConfigurationPreparer() override;

private:
    // Calls may come from worker threads: each takes a share of the component's runner, so a
    // call under way finishes even when the component is destroyed meanwhile.
    std::mutex m_compMutex;
    CProcStartUpdateAgent* m_pComp;
    std::shared_ptr<UpdateAgentRunner> m_runner;
};
