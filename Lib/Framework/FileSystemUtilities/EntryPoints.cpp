// Entry points through which the component manager makes this library's component.

#include "CQ17FileSystemWatcher.h"
#include "PQ17FileSystemWatcher.h"

namespace
{
bool isWatcher(const ID& id)
{
    ACE_WString query;
    return id.getQuery(query) && query == L"CQ17FileSystemWatcher";
}
}

extern "C" {
TESSEL_EXPORT IComponent* createComponent(const ID& id)
{
    return isWatcher(id) ? new CQ17FileSystemWatcher() : nullptr;
}

TESSEL_EXPORT ProxyComponent* createProxy(const ID& id, IComponent* component)
{
    if (!isWatcher(id) || dynamic_cast<CQ17FileSystemWatcher*>(component) == nullptr)
        return nullptr;
    return new PQ17FileSystemWatcher(component);
}
}
