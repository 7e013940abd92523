#include "PQ17FileSystemWatcher.h"

#include "CQ17FileSystemWatcher.h"

PQ17FileSystemWatcher::PQ17FileSystemWatcher(IComponent* component)
    : ProxyComponent(component),
      m_pComp(dynamic_cast<CQ17FileSystemWatcher*>(component))
{
}

PQ17FileSystemWatcher::~PQ17FileSystemWatcher() = default;

void PQ17FileSystemWatcher::handleEvent(const EventDestroyingComponent& event)
{
    if (event.getComponentID() == getID())
        m_pComp = nullptr;
    ProxyComponent::handleEvent(event);
}

int PQ17FileSystemWatcher::addFile(const QString& path)
{
    if (m_pComp == nullptr)
        return -1;
    return m_pComp->addFile(path);
}

int PQ17FileSystemWatcher::run(const BOStream& stream)
{
    if (m_pComp == nullptr)
        return -1;
    return m_pComp->run(stream);
}
