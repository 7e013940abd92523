#pragma once

#include "EventDestroyingComponent.h"
#include "Handler.h"
#include "IComponent.h"

#include <ace/Copy_Disabled.h>

#include <atomic>

// Base of every proxy: the only way one component reaches another. It remembers the
// identifier of the component it serves; the component manager sends it
// EventDestroyingComponent before that component goes away.
class TESSEL_EXPORT ProxyComponent : public Handler<EventDestroyingComponent>, private ACE_Copy_Disabled
{
public:
    explicit ProxyComponent(IComponent* component);
    ~ProxyComponent() override;

    void handleEvent(const EventDestroyingComponent& event) override;
    virtual int test();
    virtual int run(const BOStream& stream);
    virtual const ID& getID() const;

    // The component served, or null once it was destroyed.
    IComponent* component() const;

private:
    std::atomic<IComponent*> m_component;
    ID m_componentID;
};
