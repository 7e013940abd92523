#pragma once

#include "IComponentManager.h"

#include <atomic>
#include <condition_variable>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <unordered_map>
#include <vector>

// The process's component manager (see IComponentManager). One mutex guards its tables; it
// never holds it while calling into component code (constructors, proxy factories, handlers,
// destructors), which may come back to the manager.
class CComponentManager : public IComponentManager
{
public:
    CComponentManager();
    ~CComponentManager() override;

    void acquire() override;
    void release() override;

    int registerComponent(std::unique_ptr<IComponent> component, ProxyFactory makeProxy) override;
    int destroyComponent(const ID& id) override;
    void destroyAllComponents() override;

    IComponent* getComponent(const ID& id) override;
    int getProxy(const ID& id, ProxyComponent*& proxy) override;
    int releaseProxy(ProxyComponent* proxy) override;

    void setLibraryPath(const std::string& folder) override;

    int getLiveProxyCount() const override;
    bool hasComponent(const ID& id) const override;

private:
    CComponentManager(const CComponentManager&) = delete;
    CComponentManager& operator=(const CComponentManager&) = delete;

    struct Library;
    struct Entry;
    using Key = std::wstring;

    static Key keyOf(const ID& id);
    // The entry of `id`, made from its library when needed.
    int findOrCreate(const ID& id, std::shared_ptr<Entry>& entry);
    int createFromLibrary(const ID& id, std::shared_ptr<Entry>& entry);
    int loadLibrary(const std::string& fileName, std::shared_ptr<Library>& library);
    std::vector<std::shared_ptr<ProxyComponent>> proxiesOf(const Key& key) const;
    static void destroyEntry(std::shared_ptr<Entry> entry, const std::vector<std::shared_ptr<ProxyComponent>>& proxies);

    mutable std::mutex m_mutex;
    std::condition_variable m_creationDone;
    std::atomic<int> m_references;
    std::string m_libraryPath;
    std::map<Key, std::shared_ptr<Entry>> m_components;
    // Components being made from their library, and by which thread.
    std::map<Key, std::thread::id> m_creating;
    std::map<std::string, std::shared_ptr<Library>> m_libraries;
    struct ProxyRecord
    {
        Key componentKey;
        std::shared_ptr<ProxyComponent> proxy;
    };
    std::unordered_map<const ProxyComponent*, ProxyRecord> m_proxies;
};
