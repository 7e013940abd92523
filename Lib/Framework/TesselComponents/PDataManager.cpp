#include "PDataManager.h"

#include "CDataManager.h"

#include <utility>

PDataManager::PDataManager(IComponent* component)
    : ProxyComponent(component),
      m_pComp(dynamic_cast<CDataManager*>(component))
{
}

PDataManager::~PDataManager() = default;

void PDataManager::handleEvent(const EventDestroyingComponent& event)
{
    if (event.getComponentID() == getID())
        m_pComp = nullptr;
    ProxyComponent::handleEvent(event);
}

int PDataManager::setData(const ID& uri, const BData& value)
{
    CDataManager* component = m_pComp.load();
    return component != nullptr ? component->setData(uri, value) : CDataManager::eNO_SUCH_DATA;
}

int PDataManager::getData(const ID& uri, BData& value)
{
    CDataManager* component = m_pComp.load();
    return component != nullptr ? component->getData(uri, value) : CDataManager::eNO_SUCH_DATA;
}

int PDataManager::visitValues(const ID& uri,
                              const std::function<void(const ACE_WString& key, const BData& value)>& visit)
{
    CDataManager* component = m_pComp.load();
    return component != nullptr ? component->visitValues(uri, visit) : CDataManager::eNO_SUCH_DATA;
}

int PDataManager::visitNestedValues(
    const ID& uri, int& entries,
    const std::function<void(const ACE_WString& setKey, const ACE_WString& key, const BData& value)>& visit)
{
    entries = 0;
    CDataManager* component = m_pComp.load();
    return component != nullptr ? component->visitNestedValues(uri, entries, visit) : CDataManager::eNO_SUCH_DATA;
}

int PDataManager::setBool(const ID& uri, bool value)
{
    CDataManager* component = m_pComp.load();
    return component != nullptr ? component->setBool(uri, value) : CDataManager::eNO_SUCH_DATA;
}

int PDataManager::setString(const ID& uri, const ACE_WString& value)
{
    CDataManager* component = m_pComp.load();
    return component != nullptr ? component->setString(uri, value) : CDataManager::eNO_SUCH_DATA;
}

int PDataManager::getString(const ID& uri, ACE_WString& value)
{
    CDataManager* component = m_pComp.load();
    return component != nullptr ? component->getString(uri, value) : CDataManager::eNO_SUCH_DATA;
}

int PDataManager::getBool(const ID& uri, bool& value)
{
    CDataManager* component = m_pComp.load();
    return component != nullptr ? component->getBool(uri, value) : CDataManager::eNO_SUCH_DATA;
}

int PDataManager::createData(const ID& uri, const BData& value)
{
    CDataManager* component = m_pComp.load();
    return component != nullptr ? component->createData(uri, value) : CDataManager::eNO_SUCH_DATA;
}

int PDataManager::createData(const ID& uri, BSet&& value)
{
    CDataManager* component = m_pComp.load();
    return component != nullptr ? component->createData(uri, std::move(value)) : CDataManager::eNO_SUCH_DATA;
}
