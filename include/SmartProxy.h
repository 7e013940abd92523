#pragma once

#include "ComponentManagerFactory.h"
#include "ProxyComponent.h"

// Holds one proxy of type P: takes the component manager when built, gives the proxy back
// and releases the manager when destroyed.
template <class P>
class SmartProxy
{
public:
    SmartProxy() : m_manager(ComponentManagerFactory::getComponentManager()), m_proxy(nullptr) {}

    ~SmartProxy()
    {
        giveBack();
        if (m_manager != nullptr)
            m_manager->release();
    }

    // Gives back any proxy held, then asks for the proxy of `id`; keeps it only on success.
    bool acquire(const ID& id)
    {
        giveBack();
        if (m_manager == nullptr)
            return false;
        ProxyComponent* proxy = nullptr;
        if (m_manager->getProxy(id, proxy) != 0 || proxy == nullptr)
            return false;
        m_proxy = dynamic_cast<P*>(proxy);
        if (m_proxy == nullptr)
            m_manager->releaseProxy(proxy);
        return m_proxy != nullptr;
    }

    void giveBack()
    {
        if (m_proxy != nullptr && m_manager != nullptr)
            m_manager->releaseProxy(m_proxy);
        m_proxy = nullptr;
    }

    P* get() const { return m_proxy; }
    P* operator->() const { return m_proxy; }
    bool isAvailable() const { return m_proxy != nullptr; }
    explicit operator bool() const { return m_proxy != nullptr; }

private:
    SmartProxy(const SmartProxy&) = delete;
    SmartProxy& operator=(const SmartProxy&) = delete;

    IComponentManager* m_manager;
    P* m_proxy;
};
