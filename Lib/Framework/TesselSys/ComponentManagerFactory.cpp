#include "ComponentManagerFactory.h"

#include "CComponentManager.h"
#include "NoDestructor.h"

IComponentManager* ComponentManagerFactory::getComponentManager()
{
    // Never destroyed: holders may release it from static destructors at process exit.
    static NoDestructor<CComponentManager> manager;
    manager.get().acquire();
    return &manager.get();
}
