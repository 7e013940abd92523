#include "EventDestroyingComponent.h"

EventDestroyingComponent::EventDestroyingComponent(const ID& componentID) : m_componentID(componentID)
{
}

const ID& EventDestroyingComponent::getComponentID() const
{
    return m_componentID;
}
