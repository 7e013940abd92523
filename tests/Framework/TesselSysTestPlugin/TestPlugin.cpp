// A component library for the component manager's tests: it makes a component for the query
// "Counted" and none for any other, and counts how often each entry point ran.

#include "CComponent_Thread_NoRef.h"
#include "ProxyComponent.h"

#include <atomic>

namespace
{
std::atomic<int> s_componentsMade{0};
std::atomic<int> s_proxiesMade{0};

bool isCountedQuery(const ID& id)
{
    ACE_WString query;
    return id.getQuery(query) && query == L"Counted";
}
}

extern "C" {
TESSEL_EXPORT IComponent* createComponent(const ID& id)
{
    if (!isCountedQuery(id))
        return nullptr;
    ++s_componentsMade;
    return new CComponent_Thread_NoRef(id);
}

TESSEL_EXPORT ProxyComponent* createProxy(const ID& id, IComponent* component)
{
    if (!isCountedQuery(id))
        return nullptr;
    ++s_proxiesMade;
    return new ProxyComponent(component);
}

TESSEL_EXPORT int testPluginComponentsMade()
{
    return s_componentsMade.load();
}

TESSEL_EXPORT int testPluginProxiesMade()
{
    return s_proxiesMade.load();
}
}
