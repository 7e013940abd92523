#pragma once

#include "PControllerFactoryBase.h"

class CToolConfigControllersFactory;

// Proxy through which other components reach the controllers factory.
class TESSEL_EXPORT PToolConfigControllersFactory : public PControllerFactoryBase
{
public:
    explicit PToolConfigControllersFactory(IComponent* component);
    ~PToolConfigControllersFactory() override;

    void handleEvent(const EventDestroyingComponent& event) override;
    // Null once the component is gone or when it was never a controllers factory.
    WidgetCommandBase* getControllerByName(const ACE_WString& name) override;

private:
    CToolConfigControllersFactory* m_pComp;
};
