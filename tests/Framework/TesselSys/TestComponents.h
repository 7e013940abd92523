#pragma once

#include "CComponent_Thread_NoRef.h"
#include "ComponentManagerFactory.h"
#include "ProxyComponent.h"

#include <atomic>
#include <functional>
#include <memory>
#include <mutex>
#include <vector>

// A component that counts its destructions and may run a hook while being destroyed.
class RecordingComponent : public CComponent_Thread_NoRef
{
public:
    RecordingComponent(const char* id, std::atomic<int>* destroyed = nullptr) : CComponent_Thread_NoRef(ID(id)), m_destroyed(destroyed) {}
    ~RecordingComponent() override
    {
        if (m_onDestroy)
            m_onDestroy();
        if (m_destroyed != nullptr)
            ++*m_destroyed;
    }
    std::function<void()> m_onDestroy;

private:
    std::atomic<int>* m_destroyed;
};

// A proxy that keeps the identifiers of the destroyed events it received.
class RecordingProxy : public ProxyComponent
{
public:
    using ProxyComponent::ProxyComponent;
    void handleEvent(const EventDestroyingComponent& event) override
    {
        {
            std::lock_guard<std::mutex> lock(m_mutex);
            m_events.push_back(event.getComponentID());
        }
        ProxyComponent::handleEvent(event);
    }
    std::vector<ID> events() const
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        return m_events;
    }

private:
    mutable std::mutex m_mutex;
    std::vector<ID> m_events;
};

inline IComponentManager::ProxyFactory recordingProxyFactory()
{
    return [](IComponent* component) { return new RecordingProxy(component); };
}

// Holds the process's manager for one test and destroys every component at the end.
class ManagerHold
{
public:
    ManagerHold() : m_manager(ComponentManagerFactory::getComponentManager()) {}
    ~ManagerHold()
    {
        m_manager->destroyAllComponents();
        m_manager->release();
    }
    ManagerHold(const ManagerHold&) = delete;
    ManagerHold& operator=(const ManagerHold&) = delete;
    IComponentManager* operator->() const { return m_manager; }
    IComponentManager& operator*() const { return *m_manager; }

private:
    IComponentManager* m_manager;
};
