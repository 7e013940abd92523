#include "CProcStartUpdateAgent.h"

#include "IComponentManager.h"
#include "PProcStartUpdateAgent.h"
#include "UpdateAgentRunner.h"

const wchar_t* const CProcStartUpdateAgent::componentID = L"proc:ProcStartUpdateAgent?ProcStartUpdateAgent";

CProcStartUpdateAgent::CProcStartUpdateAgent()
    : CComponent_Thread_NoRef(ID(componentID)),
      m_runner(std::make_shared<UpdateAgentRunner>())
{
}

CProcStartUpdateAgent::~CProcStartUpdateAgent() = default;

CProcStartUpdateAgent* CProcStartUpdateAgent::registerWith(IComponentManager& manager)
{
    auto component = std::make_unique<CProcStartUpdateAgent>();
    CProcStartUpdateAgent* agent = component.get();
    const int result = manager.registerComponent(
        std::move(component), [](IComponent* registered) { return new PProcStartUpdateAgent(registered); });
    return result == 0 ? agent : nullptr;
}

bool CProcStartUpdateAgent::isOnlineUpdateEnabled()
{
    return m_runner->isOnlineUpdateEnabled();
}

IProcStartUpdateAgent::_enum_CheckConfigurationPreparer CProcStartUpdateAgent::checkConfigurationPreparer()
{
    return m_runner->checkConfigurationPreparer();
}

void CProcStartUpdateAgent::setTestAnswer(int answer, int delayMs)
{
    m_runner->setTestAnswer(answer, delayMs);
}

void CProcStartUpdateAgent::clearTestAnswer()
{
    m_runner->clearTestAnswer();
}

void CProcStartUpdateAgent::setTimeoutMilliseconds(int milliseconds)
{
    m_runner->setTimeoutMilliseconds(milliseconds);
}

std::shared_ptr<UpdateAgentRunner> CProcStartUpdateAgent::runner() const
{
    return m_runner;
}
