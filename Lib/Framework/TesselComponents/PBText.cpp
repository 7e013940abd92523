#include "PBText.h"

#include "CBText.h"

PBText::PBText(IComponent* component) : ProxyComponent(component), m_pComp(dynamic_cast<CBText*>(component))
{
}

PBText::~PBText() = default;

void PBText::handleEvent(const EventDestroyingComponent& event)
{
    if (event.getComponentID() == getID())
        m_pComp = nullptr;
    ProxyComponent::handleEvent(event);
}

ACE_WString PBText::getText(const ACE_WString& textId, const ACE_WString& defaultText)
{
    CBText* component = m_pComp.load();
    return component != nullptr ? component->getText(textId, defaultText) : defaultText;
}

ACE_WString PBText::getText(int textId, const ACE_WString& defaultText)
{
    CBText* component = m_pComp.load();
    return component != nullptr ? component->getText(textId, defaultText) : defaultText;
}
