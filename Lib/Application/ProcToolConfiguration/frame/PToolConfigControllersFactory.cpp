#include "PToolConfigControllersFactory.h"

#include "CToolConfigControllersFactory.h"
#include "TesselLog_Static.h"

namespace
{
const char* const kComponent = "ProcToolConfiguration";
const char* const kFile = "ProcToolConfiguration.dll";
const char* const kClass = "PProcToolConfigControllersFactory";
}

PToolConfigControllersFactory::PToolConfigControllersFactory(IComponent* component)
    : PControllerFactoryBase(component),
      m_pComp(dynamic_cast<CToolConfigControllersFactory*>(component))
{
    TesselLog_Static::logTrace_static(
        kComponent, kFile, kClass,
        L"[PProcToolConfigControllersFactory::PProcToolConfigControllersFactory()] Constructor called");
}

PToolConfigControllersFactory::~PToolConfigControllersFactory()
{
    TesselLog_Static::logTrace_static(
        kComponent, kFile, kClass,
        L"[PProcToolConfigControllersFactory::~PProcToolConfigControllersFactory()] Destructor called");
}

void PToolConfigControllersFactory::handleEvent(const EventDestroyingComponent& event)
{
    TesselLog_Static::logTrace_static(kComponent, kFile, kClass,
                                      L"[PProcToolConfigControllersFactory::handleEvent()] method started");
    if (event.getComponentID() != getID())
        return;
    if (m_pComp == nullptr)
        TesselLog_Static::logWarning_static(
            kComponent, kFile, kClass,
            L"[PProcToolConfigControllersFactory::handleEvent(const EventDestroyingComponent&)]: m_pComp is 0");
    m_pComp = nullptr;
    PControllerFactoryBase::handleEvent(event);
}

WidgetCommandBase* PToolConfigControllersFactory::getControllerByName(const ACE_WString& name)
{
    TesselLog_Static::logTrace_static(kComponent, kFile, kClass,
                                      L"[PProcToolConfigControllersFactory::getControllerByName()] method started");
    if (m_pComp == nullptr)
        return nullptr;
    return m_pComp->getControllerByName(name);
}
