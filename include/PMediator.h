#pragma once

#include "ProxyComponent.h"

class CMediator;

// Proxy of the tool-configuration dialog's mediator
// ("gui:GuiToolConfiguration?MedToolConfiguration#ToolConfiguaration.ui").
class TESSEL_EXPORT PMediator : public ProxyComponent
{
public:
    explicit PMediator(IComponent* component);
    ~PMediator() override;

    void handleEvent(const EventDestroyingComponent& event) override;

    // 0 when the dialog was closed.
    int closeDialog();

private:
    CMediator* m_pComp;
};
