#pragma once

#include "IComponent.h"

#include <functional>
#include <memory>
#include <string>

class ProxyComponent;

// Finds components by identifier and hands out proxies to them. A component is either
// registered in-process by the host, or made by the shared library named by the identifier's
// library part ("proc:ProcToolConfiguration?..." -> libProcToolConfiguration.so), through its
// exported C functions createComponent(const ID&) and createProxy(const ID&, IComponent*).
class TESSEL_EXPORT IComponentManager
{
public:
    enum Result
    {
        eOK = 0,
        eUNKNOWN_COMPONENT = 1,
        eLIBRARY_NOT_LOADED = 2,
        eENTRY_POINT_MISSING = 3,
        eCOMPONENT_NOT_CREATED = 4,
        ePROXY_NOT_CREATED = 5,
        eALREADY_REGISTERED = 6,
        eUNKNOWN_PROXY = 7,
        eNULL_ARGUMENT = 8
    };
    using ProxyFactory = std::function<ProxyComponent*(IComponent*)>;

    virtual ~IComponentManager();

    // Reference count of the holders of the manager (SmartProxy takes one).
    virtual void acquire() = 0;
    virtual void release() = 0;

    // The host's own components; the manager owns them from then on.
    virtual int registerComponent(std::unique_ptr<IComponent> component, ProxyFactory makeProxy) = 0;
    // Sends EventDestroyingComponent to the component's proxies, then destroys it.
    virtual int destroyComponent(const ID& id) = 0;
    // Destroys every component, the loaded ones first, and unloads their libraries.
    virtual void destroyAllComponents() = 0;

    // The component, made (and its library loaded) on first use; null when it cannot be had.
    virtual IComponent* getComponent(const ID& id) = 0;
    // A new proxy to the component; 0 on success. Give it back with releaseProxy.
    virtual int getProxy(const ID& id, ProxyComponent*& proxy) = 0;
    virtual int releaseProxy(ProxyComponent* proxy) = 0;

    // Folder searched first for component libraries; empty: the dynamic linker's search path.
    virtual void setLibraryPath(const std::string& folder) = 0;

    // Proxies handed out and not yet given back.
    virtual int getLiveProxyCount() const = 0;
    // True while the component is registered or made and not destroyed.
    virtual bool hasComponent(const ID& id) const = 0;
};

// Signatures of the entry points of a component library.
extern "C" {
typedef IComponent* (*CreateComponentFunction)(const ID& id);
typedef ProxyComponent* (*CreateProxyFunction)(const ID& id, IComponent* component);
}
