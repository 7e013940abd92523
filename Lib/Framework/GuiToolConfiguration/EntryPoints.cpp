// Entry points through which the component manager makes this library's component.

#include "CMediator.h"
#include "PMediator.h"

namespace
{
bool isMediator(const ID& id)
{
    ACE_WString query;
    return id.getQuery(query) && query == L"MedToolConfiguration";
}
}

extern "C" {
TESSEL_EXPORT IComponent* createComponent(const ID& id)
{
    return isMediator(id) ? new CMediator() : nullptr;
}

TESSEL_EXPORT ProxyComponent* createProxy(const ID& id, IComponent* component)
{
    if (!isMediator(id) || dynamic_cast<CMediator*>(component) == nullptr)
        return nullptr;
    return new PMediator(component);
}
}
