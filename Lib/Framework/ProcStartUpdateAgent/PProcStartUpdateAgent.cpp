#include "PProcStartUpdateAgent.h"

#include "CProcStartUpdateAgent.h"
#include "UpdateAgentRunner.h"

PProcStartUpdateAgent::PProcStartUpdateAgent(IComponent* component)
    : ProxyComponent(component),
      m_pComp(dynamic_cast<CProcStartUpdateAgent*>(component))
{
    if (m_pComp != nullptr)
        m_runner = m_pComp->runner();
}

PProcStartUpdateAgent::~PProcStartUpdateAgent() = default;

void PProcStartUpdateAgent::handleEvent(const EventDestroyingComponent& event)
{
    if (event.getComponentID() == getID())
    {
        std::lock_guard<std::mutex> lock(m_compMutex);
        m_pComp = nullptr;
        m_runner.reset();
    }
    ProxyComponent::handleEvent(event);
}

bool PProcStartUpdateAgent::isOnlineUpdateEnabled()
{
    std::shared_ptr<UpdateAgentRunner> runner;
    {
        std::lock_guard<std::mutex> lock(m_compMutex);
        runner = m_runner;
    }
    return runner != nullptr && runner->isOnlineUpdateEnabled();
}

IProcStartUpdateAgent::_enum_CheckConfigurationPreparer PProcStartUpdateAgent::checkConfigurationPreparer()
{
    std::shared_ptr<UpdateAgentRunner> runner;
    {
        std::lock_guard<std::mutex> lock(m_compMutex);
        runner = m_runner;
    }
    if (runner == nullptr)
        return eNOK_NO_AGENT;
    return runner->checkConfigurationPreparer();
}
