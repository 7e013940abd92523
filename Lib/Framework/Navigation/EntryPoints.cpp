// Entry points through which the component manager makes this library's component.

#include "CMessageBoxManager.h"
#include "PMessageBoxManager.h"

namespace
{
bool isMessageBoxManager(const ID& id)
{
    ACE_WString query;
    return id.getQuery(query) && query == L"MessageBoxManager";
}
}

extern "C" {
TESSEL_EXPORT IComponent* createComponent(const ID& id)
{
    return isMessageBoxManager(id) ? new CMessageBoxManager() : nullptr;
}

TESSEL_EXPORT ProxyComponent* createProxy(const ID& id, IComponent* component)
{
    if (!isMessageBoxManager(id) || dynamic_cast<CMessageBoxManager*>(component) == nullptr)
        return nullptr;
    return new PMessageBoxManager(component);
}
}
