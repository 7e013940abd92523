#include "PMessageBoxManager.h"

#include "CMessageBoxManager.h"

PMessageBoxManager::PMessageBoxManager(IComponent* component)
    : ProxyComponent(component),
      m_pComp(dynamic_cast<CMessageBoxManager*>(component))
{
}

PMessageBoxManager::~PMessageBoxManager() = default;

void PMessageBoxManager::handleEvent(const EventDestroyingComponent& event)
{
    if (event.getComponentID() == getID())
        m_pComp = nullptr;
    ProxyComponent::handleEvent(event);
}

int PMessageBoxManager::showMessageBox(const QString& title, const QString& text, int kind, const QString& button1,
                                       const QString& button2, const QString& button3)
{
    if (m_pComp == nullptr)
        return 0;
    return m_pComp->showMessageBox(title, text, kind, button1, button2, button3);
}
