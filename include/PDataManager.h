#pragma once

#include "ProxyComponent.h"

#include <atomic>
#include <functional>

class BData;
class BSet;
class CDataManager;

// Proxy of the data manager; every operation answers CDataManager's result codes, and
// CDataManager::eNO_SUCH_DATA once the component is gone.
class TESSEL_EXPORT PDataManager : public ProxyComponent
{
public:
    explicit PDataManager(IComponent* component);
    ~PDataManager() override;

    void handleEvent(const EventDestroyingComponent& event) override;

    int setData(const ID& uri, const BData& value);
    int getData(const ID& uri, BData& value);
    int visitValues(const ID& uri, const std::function<void(const ACE_WString& key, const BData& value)>& visit);
    int visitNestedValues(
        const ID& uri, int& entries,
        const std::function<void(const ACE_WString& setKey, const ACE_WString& key, const BData& value)>& visit);
    int setBool(const ID& uri, bool value);
    int setString(const ID& uri, const ACE_WString& value);
    int getString(const ID& uri, ACE_WString& value);
    int getBool(const ID& uri, bool& value);
    int createData(const ID& uri, const BData& value);
    int createData(const ID& uri, BSet&& value);

private:
    std::atomic<CDataManager*> m_pComp;
};
