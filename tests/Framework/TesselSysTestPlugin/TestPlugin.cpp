// A component library for the component manager's tests: it makes a component for the query
// "Counted" and none for any other, and counts how often each entry point ran.

#include "CComponent_Thread_NoRef.h"
#include "ProxyComponent.h"

#include <atomic>

extern "C" {
TESSEL_EXPORT std::atomic<int> testPluginComponentsMade{0};
TESSEL_EXPORT std::atomic<int> testPluginProxiesMade{0};

TESSEL_EXPORT IComponent* createComponent(const ID& id)
{
    ACE_WString query;
    if (!id.getQuery(query) || query != L"Counted")
        return nullptr;
    ++testPluginComponentsMade;
    return new CComponent_Thread_NoRef(id);
}

// Called only for components this library made.
TESSEL_EXPORT ProxyComponent* createProxy(const ID&, IComponent* component)
{
    ++testPluginProxiesMade;
    return new ProxyComponent(component);
}
}
