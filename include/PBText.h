#pragma once

#include "ProxyComponent.h"

#include <atomic>

class CBText;

// Proxy of the text component; once the component is gone every text is the default text.
class TESSEL_EXPORT PBText : public ProxyComponent
{
public:
    explicit PBText(IComponent* component);
    ~PBText() override;

    void handleEvent(const EventDestroyingComponent& event) override;

    ACE_WString getText(const ACE_WString& textId, const ACE_WString& defaultText);
    ACE_WString getText(int textId, const ACE_WString& defaultText);

private:
    std::atomic<CBText*> m_pComp;
};
