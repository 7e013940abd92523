#include "LogCapture.h"
#include "SmartProxy.h"
#include "TestComponents.h"

#include <gtest/gtest.h>

#include <dlfcn.h>
#include <unistd.h>

#include <cstdlib>
#include <string>
#include <thread>

namespace
{
const char* const kPluginID = "test:TesselSysTestPlugin?Counted";

std::string binFolder()
{
    if (const char* bin = std::getenv("PTC_BIN_DIR"))
        return bin;
    char buffer[4096] = {};
    const ssize_t length = readlink("/proc/self/exe", buffer, sizeof(buffer) - 1);
    const std::string path(buffer, length > 0 ? static_cast<size_t>(length) : 0);
    return path.substr(0, path.find_last_of('/'));
}

// The test plug-in when it is loaded, without loading it.
class LoadedPlugin
{
public:
    LoadedPlugin() : m_handle(dlopen((binFolder() + "/libTesselSysTestPlugin.so").c_str(), RTLD_NOW | RTLD_NOLOAD)) {}
    ~LoadedPlugin()
    {
        if (m_handle != nullptr)
            dlclose(m_handle);
    }
    LoadedPlugin(const LoadedPlugin&) = delete;
    LoadedPlugin& operator=(const LoadedPlugin&) = delete;

    bool isLoaded() const { return m_handle != nullptr; }
    int counter(const char* name) const
    {
        auto function = reinterpret_cast<int (*)()>(dlsym(m_handle, name));
        return function != nullptr ? function() : -1;
    }

private:
    void* m_handle;
};

class ComponentManagerTest : public ::testing::Test
{
protected:
    void SetUp() override
    {
        m_manager->setLibraryPath(binFolder());
        m_baseProxies = m_manager->getLiveProxyCount();
    }

    ProxyComponent* proxyOf(const char* id)
    {
        ProxyComponent* proxy = nullptr;
        EXPECT_EQ(m_manager->getProxy(ID(id), proxy), IComponentManager::eOK) << id;
        return proxy;
    }

    // Counts destroyed test components; declared first so it outlives the manager's teardown.
    std::atomic<int> m_destroyed{0};
    ManagerHold m_manager;
    int m_baseProxies = 0;
};

TEST_F(ComponentManagerTest, RegistrationRefusesDuplicatesAndMissingParts)
{
    auto first = std::make_unique<RecordingComponent>("test:Unit?A", &m_destroyed);
    IComponent* registered = first.get();
    ASSERT_EQ(m_manager->registerComponent(std::move(first), recordingProxyFactory()), IComponentManager::eOK);

    LogCapture log;
    EXPECT_EQ(m_manager->registerComponent(std::make_unique<RecordingComponent>("test:Unit?A", &m_destroyed),
                                           recordingProxyFactory()),
              IComponentManager::eALREADY_REGISTERED);
    EXPECT_EQ(m_destroyed, 1) << "the refused duplicate is destroyed";
    EXPECT_TRUE(log.containsSubstring("test:Unit?A", TesselLog_Static::eERROR));
    EXPECT_EQ(m_manager->getComponent(ID("test:Unit?A")), registered);

    EXPECT_EQ(m_manager->registerComponent(nullptr, recordingProxyFactory()), IComponentManager::eNULL_ARGUMENT);
    EXPECT_EQ(m_manager->registerComponent(std::make_unique<RecordingComponent>("test:Unit?B", &m_destroyed), nullptr),
              IComponentManager::eNULL_ARGUMENT);
    EXPECT_EQ(m_destroyed, 2);
    EXPECT_FALSE(m_manager->hasComponent(ID("test:Unit?B")));
}

TEST_F(ComponentManagerTest, DestroyedEventReachesOnlyTheProxiesOfThatComponent)
{
    ASSERT_EQ(m_manager->registerComponent(std::make_unique<RecordingComponent>("test:Unit?A", &m_destroyed),
                                           recordingProxyFactory()),
              0);
    ASSERT_EQ(m_manager->registerComponent(std::make_unique<RecordingComponent>("test:Unit?B"), recordingProxyFactory()),
              0);
    auto* a1 = dynamic_cast<RecordingProxy*>(proxyOf("test:Unit?A"));
    auto* a2 = dynamic_cast<RecordingProxy*>(proxyOf("test:Unit?A"));
    auto* b = dynamic_cast<RecordingProxy*>(proxyOf("test:Unit?B"));
    ASSERT_TRUE(a1 && a2 && b);
    EXPECT_NE(a1, a2);
    EXPECT_EQ(m_manager->getLiveProxyCount(), m_baseProxies + 3);

    ASSERT_EQ(m_manager->destroyComponent(ID("test:Unit?A")), IComponentManager::eOK);
    EXPECT_EQ(m_destroyed, 1);
    EXPECT_FALSE(m_manager->hasComponent(ID("test:Unit?A")));
    for (RecordingProxy* proxy : {a1, a2})
    {
        EXPECT_EQ(proxy->events(), std::vector<ID>{ID("test:Unit?A")});
        EXPECT_EQ(proxy->component(), nullptr);
        EXPECT_EQ(proxy->getID(), ID("test:Unit?A"));
        EXPECT_NE(proxy->test(), 0);
    }
    EXPECT_TRUE(b->events().empty());
    EXPECT_NE(b->component(), nullptr);
    EXPECT_EQ(m_manager->getLiveProxyCount(), m_baseProxies + 3) << "proxies live until given back";

    EXPECT_EQ(m_manager->destroyComponent(ID("test:Unit?A")), IComponentManager::eUNKNOWN_COMPONENT);
    for (ProxyComponent* proxy : {static_cast<ProxyComponent*>(a1), static_cast<ProxyComponent*>(a2),
                                  static_cast<ProxyComponent*>(b)})
        EXPECT_EQ(m_manager->releaseProxy(proxy), IComponentManager::eOK);
    EXPECT_EQ(m_manager->getLiveProxyCount(), m_baseProxies);
}

TEST_F(ComponentManagerTest, OnlyProxiesHandedOutCanBeGivenBack)
{
    ASSERT_EQ(m_manager->registerComponent(std::make_unique<RecordingComponent>("test:Unit?A"), recordingProxyFactory()),
              0);
    RecordingComponent stranger("test:Unit?Stranger");
    RecordingProxy foreign(&stranger);
    LogCapture log;
    EXPECT_EQ(m_manager->releaseProxy(&foreign), IComponentManager::eUNKNOWN_PROXY);
    EXPECT_TRUE(log.containsSubstring("is not a proxy handed out", TesselLog_Static::eERROR));
    EXPECT_EQ(m_manager->releaseProxy(nullptr), IComponentManager::eNULL_ARGUMENT);

    ProxyComponent* proxy = proxyOf("test:Unit?A");
    EXPECT_EQ(m_manager->releaseProxy(proxy), IComponentManager::eOK);
    EXPECT_EQ(m_manager->releaseProxy(proxy), IComponentManager::eUNKNOWN_PROXY);
    EXPECT_EQ(m_manager->getLiveProxyCount(), m_baseProxies);
}

TEST_F(ComponentManagerTest, ProxyFactoryAnsweringNullIsReported)
{
    ASSERT_EQ(m_manager->registerComponent(std::make_unique<RecordingComponent>("test:Unit?A"),
                                           [](IComponent*) -> ProxyComponent* { return nullptr; }),
              0);
    ProxyComponent* proxy = nullptr;
    EXPECT_EQ(m_manager->getProxy(ID("test:Unit?A"), proxy), IComponentManager::ePROXY_NOT_CREATED);
    EXPECT_EQ(proxy, nullptr);
    EXPECT_EQ(m_manager->getLiveProxyCount(), m_baseProxies);
}

struct LoadFailure
{
    const char* name;
    const char* id;
    int result;
    const char* logged;
};

class LibraryFailureTest : public ComponentManagerTest, public ::testing::WithParamInterface<LoadFailure>
{
};

TEST_P(LibraryFailureTest, ComponentThatCannotBeMadeGivesCodeLogLineAndNoProxy)
{
    LogCapture log;
    ProxyComponent* proxy = nullptr;
    EXPECT_EQ(m_manager->getProxy(ID(GetParam().id), proxy), GetParam().result);
    EXPECT_EQ(proxy, nullptr);
    EXPECT_EQ(m_manager->getComponent(ID(GetParam().id)), nullptr);
    EXPECT_FALSE(m_manager->hasComponent(ID(GetParam().id)));
    EXPECT_EQ(m_manager->getLiveProxyCount(), m_baseProxies);
    EXPECT_TRUE(log.containsSubstring(GetParam().logged, TesselLog_Static::eERROR)) << GetParam().logged;
}

INSTANTIATE_TEST_SUITE_P(
    Identifiers, LibraryFailureTest,
    ::testing::Values(
        LoadFailure{"UnknownLibrary", "test:NoSuchLibraryQx?Any", IComponentManager::eLIBRARY_NOT_LOADED, "libNoSuchLibraryQx.so: cannot open"},
        LoadFailure{"PathInLibraryName", "test:../bin/TesselSys?Any", IComponentManager::eLIBRARY_NOT_LOADED, "is not a plain name"},
        LoadFailure{"NoEntryPoints", "test:TesselSys?Any", IComponentManager::eENTRY_POINT_MISSING, "lacks the entry point 'createComponent'"},
        LoadFailure{"QueryTheLibraryRefuses", "test:TesselSysTestPlugin?Other", IComponentManager::eCOMPONENT_NOT_CREATED, "made no component"},
        LoadFailure{"NoLibraryPart", "NoLibraryHere", IComponentManager::eUNKNOWN_COMPONENT, "names no library"}),
    [](const ::testing::TestParamInfo<LoadFailure>& info) { return std::string(info.param.name); });

TEST_F(ComponentManagerTest, NullIdentifierIsRefused)
{
    ProxyComponent* proxy = nullptr;
    EXPECT_EQ(m_manager->getProxy(ID::null, proxy), IComponentManager::eNULL_ARGUMENT);
    EXPECT_EQ(proxy, nullptr);
}

TEST_F(ComponentManagerTest, LibraryComponentIsMadeOnceAndItsLibraryUnloadedWithTheLastProxy)
{
    IComponent* component = m_manager->getComponent(ID(kPluginID));
    ASSERT_NE(component, nullptr);
    EXPECT_EQ(component->getID(), ID(kPluginID));
    EXPECT_EQ(m_manager->getComponent(ID(kPluginID)), component);
    ProxyComponent* first = proxyOf(kPluginID);
    ProxyComponent* second = proxyOf(kPluginID);
    ASSERT_TRUE(first && second);
    EXPECT_NE(first, second);
    EXPECT_EQ(first->component(), component);
    {
        LoadedPlugin plugin;
        ASSERT_TRUE(plugin.isLoaded());
        EXPECT_EQ(plugin.counter("testPluginComponentsMade"), 1);
        EXPECT_EQ(plugin.counter("testPluginProxiesMade"), 2);
    }

    m_manager->destroyAllComponents();
    EXPECT_FALSE(m_manager->hasComponent(ID(kPluginID)));
    EXPECT_EQ(first->component(), nullptr);
    EXPECT_EQ(second->component(), nullptr);
    EXPECT_TRUE(LoadedPlugin().isLoaded()) << "live proxies keep their library";

    EXPECT_EQ(m_manager->releaseProxy(first), 0);
    EXPECT_EQ(m_manager->releaseProxy(second), 0);
    EXPECT_FALSE(LoadedPlugin().isLoaded());
}

TEST_F(ComponentManagerTest, ConcurrentFirstUseMakesTheComponentOnce)
{
    std::vector<std::thread> threads;
    std::atomic<int> failures{0};
    for (int t = 0; t < 4; ++t)
        threads.emplace_back([this, &failures] {
            for (int i = 0; i < 50; ++i)
            {
                SmartProxy<ProxyComponent> proxy;
                if (!proxy.acquire(ID(kPluginID)) || proxy->component() == nullptr)
                    ++failures;
            }
        });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(failures, 0);
    EXPECT_EQ(m_manager->getLiveProxyCount(), m_baseProxies);
    LoadedPlugin plugin;
    EXPECT_EQ(plugin.counter("testPluginComponentsMade"), 1);
    EXPECT_EQ(plugin.counter("testPluginProxiesMade"), 200);
}

// Proxy factories and destructors may use the manager themselves.
TEST_F(ComponentManagerTest, ComponentCodeMayComeBackToTheManager)
{
    ASSERT_EQ(m_manager->registerComponent(std::make_unique<RecordingComponent>("test:Unit?Inner"), recordingProxyFactory()),
              0);
    bool innerReachedFromFactory = false;
    auto outer = std::make_unique<RecordingComponent>("test:Unit?Outer");
    bool destructorRan = false;
    outer->m_onDestroy = [&destructorRan] {
        SmartProxy<RecordingProxy> inner;
        inner.acquire(ID("test:Unit?Inner"));
        destructorRan = true;
    };
    ASSERT_EQ(m_manager->registerComponent(std::move(outer),
                                           [&innerReachedFromFactory](IComponent* component) {
                                               SmartProxy<RecordingProxy> inner;
                                               innerReachedFromFactory = inner.acquire(ID("test:Unit?Inner"));
                                               return new RecordingProxy(component);
                                           }),
              0);
    SmartProxy<RecordingProxy> proxy;
    ASSERT_TRUE(proxy.acquire(ID("test:Unit?Outer")));
    EXPECT_TRUE(innerReachedFromFactory);
    m_manager->destroyAllComponents();
    EXPECT_TRUE(destructorRan);
    EXPECT_EQ(proxy->events(), std::vector<ID>{ID("test:Unit?Outer")});
}
}
