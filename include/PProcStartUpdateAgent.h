#pragma once

#include "IProcStartUpdateAgent.h"
#include "ProxyComponent.h"

class CProcStartUpdateAgent;

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
    CProcStartUpdateAgent* m_pComp;
};
