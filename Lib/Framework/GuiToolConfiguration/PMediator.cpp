#include "PMediator.h"

#include "CMediator.h"

PMediator::PMediator(IComponent* component) : ProxyComponent(component), m_pComp(dynamic_cast<CMediator*>(component))
{
}

PMediator::~PMediator() = default;

void PMediator::handleEvent(const EventDestroyingComponent& event)
{
    if (event.getComponentID() == getID())
        m_pComp = nullptr;
    ProxyComponent::handleEvent(event);
}

int PMediator::closeDialog()
{
    if (m_pComp == nullptr)
        return -1;
    return m_pComp->closeDialog();
}
