// Entry points through which the component manager makes this library's component.

#include "CProcStartUpdateAgent.h"
#include "PProcStartUpdateAgent.h"

namespace
{
bool isAgent(const ID& id)
{
    ACE_WString query;
    return id.getQuery(query) && query == L"ProcStartUpdateAgent";
}
}

extern "C" {
TESSEL_EXPORT IComponent* createComponent(const ID& id)
{
    return isAgent(id) ? new CProcStartUpdateAgent() : nullptr;
}

TESSEL_EXPORT ProxyComponent* createProxy(const ID& id, IComponent* component)
{
    if (!isAgent(id) || dynamic_cast<CProcStartUpdateAgent*>(component) == nullptr)
        return nullptr;
    return new PProcStartUpdateAgent(component);
}
}
