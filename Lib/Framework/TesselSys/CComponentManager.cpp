#include "CComponentManager.h"

#include "EventDestroyingComponent.h"
#include "ProxyComponent.h"
#include "TesselLog_Static.h"
#include "WideString.h"

#include <dlfcn.h>

namespace
{
const char* const kComponent = "tesselSys";
const char* const kFile = "tesselSys.dll";
const char* const kClass = "ComponentManager";

// The folder holding this library, where the component libraries are installed beside it.
std::string ownFolder()
{
    Dl_info info{};
    if (dladdr(reinterpret_cast<const void*>(&ownFolder), &info) == 0 || info.dli_fname == nullptr)
        return std::string();
    const std::string path(info.dli_fname);
    const std::string::size_type slash = path.rfind('/');
    return slash == std::string::npos ? std::string() : path.substr(0, slash);
}
}

// A component library opened with dlopen; closed when the last component, proxy or factory
// made from it is gone.
struct CComponentManager::Library
{
    explicit Library(void* openedHandle) : handle(openedHandle) {}
    ~Library()
    {
        if (handle != nullptr)
            dlclose(handle);
    }
    Library(const Library&) = delete;
    Library& operator=(const Library&) = delete;

    void* handle;
    CreateComponentFunction createComponent = nullptr;
    CreateProxyFunction createProxy = nullptr;
};

struct CComponentManager::Entry
{
    ID id;
    // Null for a component the host registered.
    std::shared_ptr<Library> library;
    std::shared_ptr<IComponent> component;
    ProxyFactory makeProxy;
};

CComponentManager::CComponentManager() : m_references(0)
{
}

CComponentManager::~CComponentManager() = default;

void CComponentManager::acquire()
{
    ++m_references;
}

void CComponentManager::release()
{
    if (--m_references < 0)
    {
        ++m_references;
        TesselLog_Static::logError_static(kComponent, kFile, kClass, 0,
                                          "[ComponentManager::release()] released more often than acquired");
    }
}

CComponentManager::Key CComponentManager::keyOf(const ID& id)
{
    return WideString::toStd(id.getString());
}

int CComponentManager::registerComponent(std::unique_ptr<IComponent> component, ProxyFactory makeProxy)
{
    if (component == nullptr || !makeProxy)
        return eNULL_ARGUMENT;
    // Declared before the lock: a refused component is destroyed after the lock is let go.
    auto entry = std::make_shared<Entry>();
    entry->id = component->getID();
    entry->component = std::shared_ptr<IComponent>(std::move(component));
    entry->makeProxy = std::move(makeProxy);
    const Key key = keyOf(entry->id);
    bool refused = false;
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        refused = m_components.count(key) != 0 || m_creating.count(key) != 0;
        if (!refused)
            m_components.emplace(key, entry);
    }
    if (refused)
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, eALREADY_REGISTERED,
                                          "[ComponentManager::registerComponent()] '%S' is already registered",
                                          entry->id.getString().c_str());
        return eALREADY_REGISTERED;
    }
    return eOK;
}

int CComponentManager::findOrCreate(const ID& id, std::shared_ptr<Entry>& entry)
{
    if (id.isNull())
        return eNULL_ARGUMENT;
    const Key key = keyOf(id);
    std::unique_lock<std::mutex> lock(m_mutex);
    for (;;)
    {
        const auto found = m_components.find(key);
        if (found != m_components.end())
        {
            entry = found->second;
            return eOK;
        }
        const auto creating = m_creating.find(key);
        if (creating == m_creating.end())
            break;
        if (creating->second == std::this_thread::get_id())
        {
            lock.unlock();
            TesselLog_Static::logError_static(
                kComponent, kFile, kClass, eCOMPONENT_NOT_CREATED,
                "[ComponentManager::getComponent()] '%S' asked for while it is being made", id.getString().c_str());
            return eCOMPONENT_NOT_CREATED;
        }
        m_creationDone.wait(lock);
    }
    m_creating.emplace(key, std::this_thread::get_id());
    lock.unlock();

    std::shared_ptr<Entry> made;
    const int result = createFromLibrary(id, made);

    lock.lock();
    m_creating.erase(key);
    if (result == eOK)
    {
        m_components.emplace(key, made);
        entry = made;
    }
    m_creationDone.notify_all();
    return result;
}

int CComponentManager::createFromLibrary(const ID& id, std::shared_ptr<Entry>& entry)
{
    const ACE_WString libraryName = id.getLibrary();
    if (libraryName.length() == 0)
    {
        TesselLog_Static::logError_static(
            kComponent, kFile, kClass, eUNKNOWN_COMPONENT,
            "[ComponentManager::getComponent()] '%S' is not registered and names no library", id.getString().c_str());
        return eUNKNOWN_COMPONENT;
    }
    const std::string name = WideString::toUtf8(libraryName);
    if (name.find('/') != std::string::npos)
    {
        TesselLog_Static::logError_static(
            kComponent, kFile, kClass, eLIBRARY_NOT_LOADED,
            "[ComponentManager::getComponent()] library name '%s' of '%S' is not a plain name", name.c_str(),
            id.getString().c_str());
        return eLIBRARY_NOT_LOADED;
    }
    std::shared_ptr<Library> library;
    const int loaded = loadLibrary("lib" + name + ".so", library);
    if (loaded != eOK)
        return loaded;

    IComponent* raw = library->createComponent(id);
    if (raw == nullptr)
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, eCOMPONENT_NOT_CREATED,
                                          "[ComponentManager::getComponent()] library '%s' made no component for '%S'",
                                          name.c_str(), id.getString().c_str());
        return eCOMPONENT_NOT_CREATED;
    }
    entry = std::make_shared<Entry>();
    entry->id = id;
    entry->library = library;
    // The library stays loaded until the component is deleted.
    entry->component = std::shared_ptr<IComponent>(raw, [library](IComponent* component) { delete component; });
    const CreateProxyFunction createProxy = library->createProxy;
    entry->makeProxy = [createProxy, id](IComponent* component) { return createProxy(id, component); };
    return eOK;
}

int CComponentManager::loadLibrary(const std::string& fileName, std::shared_ptr<Library>& library)
{
    std::string folder;
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        const auto found = m_libraries.find(fileName);
        if (found != m_libraries.end())
        {
            library = found->second;
            return eOK;
        }
        folder = m_libraryPath;
    }

    std::vector<std::string> candidates;
    if (!folder.empty())
        candidates.push_back(folder + "/" + fileName);
    const std::string own = ownFolder();
    if (!own.empty() && own != folder)
        candidates.push_back(own + "/" + fileName);
    candidates.push_back(fileName);

    void* handle = nullptr;
    std::string errors;
    for (const std::string& candidate : candidates)
    {
        handle = dlopen(candidate.c_str(), RTLD_NOW | RTLD_LOCAL);
        if (handle != nullptr)
            break;
        const char* error = dlerror();
        if (!errors.empty())
            errors += "; ";
        errors += error != nullptr ? error : candidate + ": unknown error";
    }
    if (handle == nullptr)
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, eLIBRARY_NOT_LOADED,
                                          "[ComponentManager::loadLibrary()] cannot load '%s': %s", fileName.c_str(),
                                          errors.c_str());
        return eLIBRARY_NOT_LOADED;
    }

    // Declared before the lock: a library opened twice by racing threads is closed after it.
    auto opened = std::make_shared<Library>(handle);
    opened->createComponent = reinterpret_cast<CreateComponentFunction>(dlsym(handle, "createComponent"));
    opened->createProxy = reinterpret_cast<CreateProxyFunction>(dlsym(handle, "createProxy"));
    if (opened->createComponent == nullptr || opened->createProxy == nullptr)
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, eENTRY_POINT_MISSING,
                                          "[ComponentManager::loadLibrary()] '%s' lacks the entry point '%s'",
                                          fileName.c_str(),
                                          opened->createComponent == nullptr ? "createComponent" : "createProxy");
        return eENTRY_POINT_MISSING;
    }
    std::lock_guard<std::mutex> lock(m_mutex);
    library = m_libraries.emplace(fileName, opened).first->second;
    return eOK;
}

IComponent* CComponentManager::getComponent(const ID& id)
{
    std::shared_ptr<Entry> entry;
    if (findOrCreate(id, entry) != eOK)
        return nullptr;
    return entry->component.get();
}

int CComponentManager::getProxy(const ID& id, ProxyComponent*& proxy)
{
    proxy = nullptr;
    std::shared_ptr<Entry> entry;
    const int found = findOrCreate(id, entry);
    if (found != eOK)
        return found;

    ProxyComponent* raw = entry->makeProxy(entry->component.get());
    if (raw == nullptr)
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, ePROXY_NOT_CREATED,
                                          "[ComponentManager::getProxy()] no proxy made for '%S'",
                                          id.getString().c_str());
        return ePROXY_NOT_CREATED;
    }
    // A proxy made by a library keeps that library loaded until it is deleted.
    std::shared_ptr<ProxyComponent> owned(raw, [library = entry->library](ProxyComponent* p) { delete p; });
    const Key key = keyOf(id);
    bool alive = false;
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        const auto current = m_components.find(key);
        alive = current != m_components.end() && current->second == entry;
        if (alive)
            m_proxies.emplace(raw, ProxyRecord{key, owned});
    }
    if (!alive)
    {
        // The component was destroyed while its proxy was being made.
        owned->handleEvent(EventDestroyingComponent(id));
        return eUNKNOWN_COMPONENT;
    }
    proxy = raw;
    return eOK;
}

int CComponentManager::releaseProxy(ProxyComponent* proxy)
{
    if (proxy == nullptr)
        return eNULL_ARGUMENT;
    // Declared before the lock: the proxy is deleted after the lock is let go.
    std::shared_ptr<ProxyComponent> released;
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        const auto found = m_proxies.find(proxy);
        if (found != m_proxies.end())
        {
            released = std::move(found->second.proxy);
            m_proxies.erase(found);
        }
    }
    if (released == nullptr)
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, eUNKNOWN_PROXY,
                                          "[ComponentManager::releaseProxy()] %p is not a proxy handed out",
                                          static_cast<const void*>(proxy));
        return eUNKNOWN_PROXY;
    }
    return eOK;
}

std::vector<std::shared_ptr<ProxyComponent>> CComponentManager::proxiesOf(const Key& key) const
{
    std::vector<std::shared_ptr<ProxyComponent>> proxies;
    for (const auto& [pointer, record] : m_proxies)
        if (record.componentKey == key)
            proxies.push_back(record.proxy);
    return proxies;
}

void CComponentManager::destroyEntry(std::shared_ptr<Entry> entry,
                                     const std::vector<std::shared_ptr<ProxyComponent>>& proxies)
{
    const EventDestroyingComponent event(entry->id);
    for (const auto& proxy : proxies)
        proxy->handleEvent(event);
    // The component goes with the last reference, normally this one.
    entry.reset();
}

int CComponentManager::destroyComponent(const ID& id)
{
    const Key key = keyOf(id);
    std::shared_ptr<Entry> entry;
    std::vector<std::shared_ptr<ProxyComponent>> proxies;
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        const auto found = m_components.find(key);
        if (found == m_components.end())
            return eUNKNOWN_COMPONENT;
        entry = std::move(found->second);
        m_components.erase(found);
        proxies = proxiesOf(key);
    }
    destroyEntry(std::move(entry), proxies);
    return eOK;
}

void CComponentManager::destroyAllComponents()
{
    // A destructor may bring a component back; a few rounds settle that, without looping forever.
    for (int round = 0; round < 4; ++round)
    {
        std::vector<std::pair<std::shared_ptr<Entry>, std::vector<std::shared_ptr<ProxyComponent>>>> doomed;
        {
            std::lock_guard<std::mutex> lock(m_mutex);
            for (const bool fromLibrary : {true, false})
                for (const auto& [key, entry] : m_components)
                    if ((entry->library != nullptr) == fromLibrary)
                        doomed.emplace_back(entry, proxiesOf(key));
            m_components.clear();
        }
        if (doomed.empty())
            break;
        for (auto& [entry, proxies] : doomed)
            destroyEntry(std::move(entry), proxies);
    }
    // Libraries still used by live proxies stay loaded until those are given back.
    std::map<std::string, std::shared_ptr<Library>> libraries;
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        libraries.swap(m_libraries);
    }
}

void CComponentManager::setLibraryPath(const std::string& folder)
{
    std::lock_guard<std::mutex> lock(m_mutex);
    m_libraryPath = folder;
}

int CComponentManager::getLiveProxyCount() const
{
    std::lock_guard<std::mutex> lock(m_mutex);
    return static_cast<int>(m_proxies.size());
}

bool CComponentManager::hasComponent(const ID& id) const
{
    const Key key = keyOf(id);
    std::lock_guard<std::mutex> lock(m_mutex);
    return m_components.count(key) != 0;
}
