#include "ComponentFixture.h"
#include "LogCapture.h"
#include "SmartProxy.h"

#include <gtest/gtest.h>

#include <dlfcn.h>

#include <atomic>
#include <filesystem>
#include <functional>
#include <thread>
#include <tuple>

namespace
{
const char* const kPluginID = "test:TesselSysTestPlugin?Counted";

// The test plug-in is built beside the test program.
const std::string kBinFolder = std::filesystem::read_symlink("/proc/self/exe").parent_path().string();

// A counter of the test plug-in, read without loading it: -1 when it is not loaded.
int pluginCounter(const char* name)
{
    void* handle = dlopen((kBinFolder + "/libTesselSysTestPlugin.so").c_str(), RTLD_NOW | RTLD_NOLOAD);
    const int count = handle == nullptr ? -1 : static_cast<std::atomic<int>*>(dlsym(handle, name))->load();
    if (handle != nullptr)
        dlclose(handle);
    return count;
}

// A component that counts its destruction, after running a hook.
struct HookedComponent : CComponent_Thread_NoRef
{
    HookedComponent(const char* id, std::function<void()> hook) : CComponent_Thread_NoRef(ID(id)), onDestroy(hook) {}
    ~HookedComponent() override { onDestroy(); }
    std::function<void()> onDestroy;
};

const IComponentManager::ProxyFactory makeProxy = [](IComponent* c) { return new ProxyComponent(c); };

class ComponentManagerTest : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_manager->setLibraryPath(kBinFolder);
        m_base = m_manager->getLiveProxyCount();
    }
    int add(
        const char* id, IComponentManager::ProxyFactory factory = makeProxy,
        const std::function<void()>& onDestroy = [] {})
    {
        auto hook = [this, onDestroy] {
            onDestroy();
            ++m_destroyed;
        };
        return m_manager->registerComponent(std::make_unique<HookedComponent>(id, hook), std::move(factory));
    }
    // Proxies handed out by this test and not given back.
    int held() const { return m_manager->getLiveProxyCount() - m_base; }

    std::atomic<int> m_destroyed{0};
    int m_base = 0;
};

// Proxy factories and component destructors may use the manager themselves.
TEST_F(ComponentManagerTest, RegistrationAndDestroyingAComponentOrphansOnlyItsProxies)
{
    bool reachedFromFactory = false;
    const auto factory = [&reachedFromFactory](IComponent* component) {
        reachedFromFactory = SmartProxy<ProxyComponent>().acquire(ID("test:Unit?B"));
        return makeProxy(component);
    };
    ASSERT_EQ(add("test:Unit?B") +
                  add("test:Unit?A", factory, [] { SmartProxy<ProxyComponent>().acquire(ID("test:Unit?B")); }),
              0);
    IComponent* registered = m_manager->getComponent(ID("test:Unit?A"));
    LogCapture log;
    EXPECT_EQ(add("test:Unit?A"), IComponentManager::eALREADY_REGISTERED);
    EXPECT_TRUE(m_destroyed == 1 && m_manager->getComponent(ID("test:Unit?A")) == registered) << "duplicate destroyed";
    EXPECT_TRUE(log.containsSubstring("'test:Unit?A' is already registered", TesselLog_Static::eERROR));
    EXPECT_EQ(m_manager->registerComponent(nullptr, makeProxy) + add("test:Unit?C", nullptr),
              2 * IComponentManager::eNULL_ARGUMENT);

    ProxyComponent* a = nullptr;
    ProxyComponent* b = nullptr;
    ASSERT_EQ(m_manager->getProxy(ID("test:Unit?A"), a) + m_manager->getProxy(ID("test:Unit?B"), b), 0);
    EXPECT_TRUE(reachedFromFactory);
    ASSERT_EQ(m_manager->destroyComponent(ID("test:Unit?A")), IComponentManager::eOK);
    EXPECT_TRUE(m_destroyed == 3 && !m_manager->hasComponent(ID("test:Unit?A")));
    // Only the destroyed component's proxies lose it.
    EXPECT_TRUE(a->component() == nullptr && a->getID() == ID("test:Unit?A") && a->test() != 0);
    EXPECT_TRUE(b->component() != nullptr && b->test() == 0);
    EXPECT_EQ(held(), 2) << "proxies live until given back";
    EXPECT_EQ(m_manager->destroyComponent(ID("test:Unit?A")), IComponentManager::eUNKNOWN_COMPONENT);

    // Only proxies handed out can be given back, and only once.
    CComponent_Thread_NoRef stranger(ID("test:Unit?Stranger"));
    ProxyComponent foreign(&stranger);
    EXPECT_EQ(m_manager->releaseProxy(&foreign), IComponentManager::eUNKNOWN_PROXY);
    EXPECT_TRUE(log.containsSubstring("is not a proxy handed out", TesselLog_Static::eERROR));
    EXPECT_EQ(m_manager->releaseProxy(nullptr), IComponentManager::eNULL_ARGUMENT);
    EXPECT_EQ(m_manager->releaseProxy(a) + m_manager->releaseProxy(b), IComponentManager::eOK);
    EXPECT_TRUE(m_manager->releaseProxy(b) == IComponentManager::eUNKNOWN_PROXY && held() == 0);
}

TEST_F(ComponentManagerTest, ComponentOrProxyThatCannotBeMadeGivesCodeLogLineAndNoProxy)
{
    ASSERT_EQ(add("test:Unit?NoProxy", [](IComponent*) -> ProxyComponent* { return nullptr; }), 0);
    // identifier, result, error line fragment ("": none)
    const std::tuple<const char*, int, const char*> cases[] = {
        {"test:NoSuchLibraryQx?Any", IComponentManager::eLIBRARY_NOT_LOADED, "libNoSuchLibraryQx.so: cannot open"},
        {"test:../bin/TesselSys?Any", IComponentManager::eLIBRARY_NOT_LOADED, "is not a plain name"},
        {"test:TesselSys?Any", IComponentManager::eENTRY_POINT_MISSING, "lacks the entry point 'createComponent'"},
        {"test:TesselSysTestPlugin?Other", IComponentManager::eCOMPONENT_NOT_CREATED, "made no component"},
        {"NoLibraryHere", IComponentManager::eUNKNOWN_COMPONENT, "names no library"},
        {"test:Unit?NoProxy", IComponentManager::ePROXY_NOT_CREATED, "no proxy made for 'test:Unit?NoProxy'"},
        {"", IComponentManager::eNULL_ARGUMENT, ""},
    };
    for (const auto& [id, result, logged] : cases)
    {
        SCOPED_TRACE(id);
        LogCapture log;
        ProxyComponent* proxy = nullptr;
        EXPECT_EQ(m_manager->getProxy(ID(id), proxy), result);
        EXPECT_TRUE(proxy == nullptr && held() == 0);
        EXPECT_EQ(log.containsSubstring(logged, TesselLog_Static::eERROR), *logged != '\0');
        EXPECT_EQ(m_manager->getComponent(ID(id)) != nullptr, result == IComponentManager::ePROXY_NOT_CREATED);
    }

    // The base component's state names it, and its counts never go below zero.
    CComponent_Thread_NoRef component(ID("test:Unit?A&B<\"C\">"));
    const std::vector<int> counts{
        component.detachProxy(), component.release(), component.attachProxy(), component.attachProxy(),
        component.detachProxy(), component.acquire(), component.attach(),      component.getAttachedProxyCount()};
    EXPECT_EQ(counts, (std::vector<int>{-1, -1, 1, 2, 1, 1, 1, 1}));
    // Markup in the identifier is escaped ('>' needs none inside an attribute).
    EXPECT_EQ(utf8(component.getXMLState()), "<component id=\"test:Unit?A&amp;B&lt;&quot;C&quot;>\" attached=\"1\" "
                                             "proxies=\"1\" references=\"1\"/>");
}

// An installed plug-in lies beside the framework: without it in the configured folder, the
// manager looks in its own library's folder, then leaves the name to the loader.
TEST_F(ComponentManagerTest, LibraryIsLookedForInTheConfiguredFolderThenBesideTheManager)
{
    const std::string elsewhere = ::testing::TempDir() + "ptc-no-plugins";
    m_manager->setLibraryPath(elsewhere);
    LogCapture log;
    ProxyComponent* proxy = nullptr;
    ASSERT_EQ(m_manager->getProxy(ID("test:NoSuchLibraryQx?Any"), proxy), IComponentManager::eLIBRARY_NOT_LOADED);
    const std::vector<std::string> errors = log.messages(TesselLog_Static::eERROR);
    ASSERT_EQ(errors.size(), 1u);
    const std::string& tried = errors.front();
    const size_t configured = tried.find(elsewhere + "/libNoSuchLibraryQx.so");
    const size_t beside = tried.find(kBinFolder + "/libNoSuchLibraryQx.so");
    const size_t bare = tried.find("; libNoSuchLibraryQx.so");
    EXPECT_TRUE(configured < beside && beside < bare && bare != std::string::npos) << tried;

    SmartProxy<ProxyComponent> plugin;
    EXPECT_TRUE(plugin.acquire(ID(kPluginID)) && plugin->component() != nullptr);
}

// Threads racing to the first use make one component; the last proxy given back unloads the library.
TEST_F(ComponentManagerTest, LibraryComponentIsMadeOnceAndUnloadedWithTheLastProxy)
{
    std::atomic<int> failures{0};
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t)
        threads.emplace_back([&failures] {
            for (int i = 0; i < 25; ++i)
            {
                SmartProxy<ProxyComponent> proxy;
                failures += !proxy.acquire(ID(kPluginID)) || proxy->component() == nullptr;
            }
        });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_TRUE(failures == 0 && held() == 0);
    EXPECT_EQ(pluginCounter("testPluginComponentsMade") * 1000 + pluginCounter("testPluginProxiesMade"), 1100);

    ProxyComponent* first = nullptr;
    ProxyComponent* second = nullptr;
    ASSERT_EQ(m_manager->getProxy(ID(kPluginID), first) + m_manager->getProxy(ID(kPluginID), second), 0);
    EXPECT_TRUE(first != second && first->component() == m_manager->getComponent(ID(kPluginID)) &&
                first->component()->getID() == ID(kPluginID));
    m_manager->destroyAllComponents();
    EXPECT_TRUE(!m_manager->hasComponent(ID(kPluginID)) && second->component() == nullptr);
    EXPECT_TRUE(m_manager->releaseProxy(first) == 0 && pluginCounter("testPluginComponentsMade") == 1)
        << "a live proxy keeps its library";
    EXPECT_TRUE(m_manager->releaseProxy(second) == 0 && pluginCounter("testPluginComponentsMade") == -1);
}
}
