#include "EntryPoints.h"

#include "CToolConfigControllersFactory.h"
#include "PToolConfigControllersFactory.h"

#include <ace/Init_ACE.h>

namespace
{
const wchar_t* const kFactoryQuery = L"ToolConfigControllersFactory";

bool isFactoryQuery(const ID& id)
{
    ACE_WString query;
    id.getQuery(query);
    return query == kFactoryQuery;
}

// ACE is initialised while the library is loaded.
struct AceLifetime
{
    AceLifetime() { ACE::init(); }
    ~AceLifetime() { ACE::fini(); }
};
const AceLifetime s_aceLifetime;
}

IComponent* createComponent(const ID& id)
{
    if (!isFactoryQuery(id))
        return nullptr;
    return new CToolConfigControllersFactory(id);
}

ProxyComponent* createProxy(const ID& id, IComponent* component)
{
    if (!isFactoryQuery(id))
        return nullptr;
    return new PToolConfigControllersFactory(component);
}
