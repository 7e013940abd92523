// A program built against an installed ProcToolConfiguration: loads the plug-in by its component
// identifier, with no library path set, and asks its controllers factory for the dialog's
// controllers. Prints the file the plug-in was loaded from; exits non-zero on any failure.

#include "CBText.h"
#include "CDataManager.h"
#include "ComponentManagerFactory.h"
#include "PControllerFactoryBase.h"
#include "SmartProxy.h"
#include "WidgetCommandBase.h"

#include <QCoreApplication>

#include <cstdio>
#include <fstream>
#include <memory>
#include <string>

namespace
{
const char* const kFactoryID = "proc:ProcToolConfiguration?ToolConfigControllersFactory";
const wchar_t* const kControllerNames[] = {L"WC_TOOLCONFIGURATION", L"WC_USERSCOMMAND"};

// The file of the mapped plug-in library, empty when it is not loaded.
std::string loadedPluginFile()
{
    std::ifstream maps("/proc/self/maps");
    std::string line;
    while (std::getline(maps, line))
    {
        const std::string::size_type path = line.find('/');
        if (path != std::string::npos && line.find("/libProcToolConfiguration.so", path) != std::string::npos)
            return line.substr(path);
    }
    return std::string();
}

int run(IComponentManager& manager)
{
    if (CDataManager::registerWith(manager) == nullptr || CBText::registerWith(manager) == nullptr)
    {
        std::fprintf(stderr, "consumer: cannot register the data manager and the texts\n");
        return 1;
    }
    SmartProxy<PControllerFactoryBase> factory;
    if (!factory.acquire(ID(kFactoryID)))
    {
        std::fprintf(stderr, "consumer: cannot load %s\n", kFactoryID);
        return 1;
    }
    std::printf("plug-in: %s\n", loadedPluginFile().c_str());
    int missing = 0;
    for (const wchar_t* name : kControllerNames)
    {
        std::unique_ptr<WidgetCommandBase> controller(factory->getControllerByName(ACE_WString(name)));
        std::printf("%ls: %s\n", name, controller ? controller->metaObject()->className() : "none");
        missing += controller ? 0 : 1;
    }
    return missing == 0 ? 0 : 1;
}
}

int main(int argc, char** argv)
{
    QCoreApplication application(argc, argv);
    IComponentManager* manager = ComponentManagerFactory::getComponentManager();
    if (manager == nullptr)
    {
        std::fprintf(stderr, "consumer: no component manager\n");
        return 1;
    }
    const int result = run(*manager);
    manager->destroyAllComponents();
    manager->release();
    return result;
}
