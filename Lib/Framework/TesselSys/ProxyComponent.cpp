#include "ProxyComponent.h"

ProxyComponent::ProxyComponent(IComponent* component)
    : m_component(component),
      m_componentID(component != nullptr ? component->getID() : ID::null)
{
}

ProxyComponent::~ProxyComponent() = default;

void ProxyComponent::handleEvent(const EventDestroyingComponent& event)
{
    if (event.getComponentID() == m_componentID)
        m_component = nullptr;
}

int ProxyComponent::test()
{
    return m_component.load() != nullptr ? 0 : -1;
}

int ProxyComponent::run(const BOStream& stream)
{
    IComponent* component = m_component.load();
    return component != nullptr ? component->run(stream) : -1;
}

const ID& ProxyComponent::getID() const
{
    return m_componentID;
}

IComponent* ProxyComponent::component() const
{
    return m_component.load();
}
