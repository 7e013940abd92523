#include "CToolConfigControllersFactory.h"

#include "TesselLog_Static.h"
#include "ToolConfigurationCommand.h"
#include "UsersCommand.h"
#include "WidgetCommandBase.h"

namespace
{
const char* const kComponent = "ProcToolConfiguration";
const char* const kFile = "ProcToolConfiguration.dll";
const char* const kClass = "CToolConfigControllersFactory";
}

CToolConfigControllersFactory::CToolConfigControllersFactory(const ID& id) : CComponent_Thread_NoRef(id)
{
    TesselLog_Static::logTrace_static(
        kComponent, kFile, kClass,
        L"[CToolConfigControllersFactory::CToolConfigControllersFactory()] Constructor called");
}

CToolConfigControllersFactory::~CToolConfigControllersFactory()
{
    TesselLog_Static::logTrace_static(
        kComponent, kFile, kClass,
        L"[CToolConfigControllersFactory::~CToolConfigControllersFactory()] Destructor called");
    cleanUp();
}

bool CToolConfigControllersFactory::isStateless() const
{
    return true;
}

WidgetCommandBase* CToolConfigControllersFactory::getControllerByName(const ACE_WString& name)
{
    TesselLog_Static::logTrace_static(kComponent, kFile, kClass,
                                      L"[CToolConfigControllersFactory::getControllerByName()] method started");
    if (name == L"WC_TOOLCONFIGURATION")
        return new ToolConfigurationCommand(QString("WC_TOOLCONFIGURATION"));
    if (name == L"WC_USERSCOMMAND")
        return new UsersCommand(QString("WC_USERSCOMMAND"));
    return nullptr;
}

void CToolConfigControllersFactory::cleanUp()
{
    TesselLog_Static::logTrace_static(kComponent, kFile, kClass,
                                      L"[CToolConfigControllersFactory::cleanUp()] method started");
}
