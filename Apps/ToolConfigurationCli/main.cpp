// Starts the framework, loads the plug-in by its component identifier and asks its
// controllers factory for each controller name.

#include "CBText.h"
#include "CDataManager.h"
#include "ComponentManagerFactory.h"
#include "PControllerFactoryBase.h"
#include "SmartProxy.h"
#include "TesselLog_Static.h"
#include "WideString.h"
#include "WidgetCommandBase.h"

#include <QCoreApplication>

#include <cstdio>
#include <memory>
#include <unistd.h>

namespace
{
const char* const kFactoryID = "proc:ProcToolConfiguration?ToolConfigControllersFactory";
const wchar_t* const kControllerNames[] = {L"WC_TOOLCONFIGURATION", L"WC_USERSCOMMAND", L"WC_ONLINEUPDATECOMMAND"};

std::string executableFolder()
{
    char buffer[4096] = {};
    const ssize_t length = readlink("/proc/self/exe", buffer, sizeof(buffer) - 1);
    if (length <= 0)
        return std::string();
    std::string path(buffer, static_cast<size_t>(length));
    return path.substr(0, path.find_last_of('/'));
}

// Gives the manager back and destroys every component, whatever way main is left.
struct FrameworkScope
{
    IComponentManager* manager;
    explicit FrameworkScope(IComponentManager* m) : manager(m) {}
    ~FrameworkScope()
    {
        manager->destroyAllComponents();
        manager->release();
    }
};
}

int main(int argc, char** argv)
{
    QCoreApplication application(argc, argv);
    IComponentManager* manager = ComponentManagerFactory::getComponentManager();
    if (manager == nullptr)
    {
        std::fprintf(stderr, "no component manager\n");
        return 1;
    }
    FrameworkScope scope(manager);
    manager->setLibraryPath(executableFolder());
    CDataManager::registerWith(*manager);
    CBText::registerWith(*manager);

    {
        SmartProxy<PControllerFactoryBase> factory;
        if (!factory.acquire(ID(kFactoryID)))
        {
            std::fprintf(stderr, "could not load %s\n", kFactoryID);
            return 1;
        }
        std::printf("loaded %s\n", kFactoryID);
        for (const wchar_t* name : kControllerNames)
        {
            std::unique_ptr<WidgetCommandBase> controller(factory->getControllerByName(ACE_WString(name)));
            const std::string text = WideString::toUtf8(name);
            if (controller)
                std::printf("  %-24s -> %s (command id %s)\n", text.c_str(), controller->metaObject()->className(),
                            controller->getCommandID().toUtf8().constData());
            else
                std::printf("  %-24s -> none\n", text.c_str());
        }
    }
    return 0;
}
