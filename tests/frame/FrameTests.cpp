#include "CToolConfigControllersFactory.h"
#include "ComponentManagerFactory.h"
#include "EntryPoints.h"
#include "HandlerCustomEvent.h"
#include "LogCapture.h"
#include "PToolConfigControllersFactory.h"
#include "SmartProxy.h"
#include "WidgetCommandBase.h"

#include <gtest/gtest.h>

#include <QCoreApplication>

#include <cstdlib>
#include <memory>
#include <string>

namespace
{
const char* const kFactoryID = "proc:ProcToolConfiguration?ToolConfigControllersFactory";

struct ManagerScope
{
    IComponentManager* manager = ComponentManagerFactory::getComponentManager();
    ManagerScope()
    {
        if (const char* bin = std::getenv("PTC_BIN_DIR"))
            manager->setLibraryPath(bin);
    }
    ~ManagerScope()
    {
        manager->destroyAllComponents();
        manager->release();
    }
};

struct QueryCase
{
    const char* id;
    bool matches;
};

class EntryPointTest : public ::testing::TestWithParam<QueryCase>
{
};

TEST_P(EntryPointTest, OnlyTheFactoryQueryMakesAComponentAndAProxy)
{
    const ID id(GetParam().id);
    std::unique_ptr<IComponent> component(createComponent(id));
    EXPECT_EQ(component != nullptr, GetParam().matches);

    CToolConfigControllersFactory reference{ID(kFactoryID)};
    std::unique_ptr<ProxyComponent> proxy(createProxy(id, &reference));
    EXPECT_EQ(proxy != nullptr, GetParam().matches);
}

INSTANTIATE_TEST_SUITE_P(Queries, EntryPointTest,
                         ::testing::Values(QueryCase{kFactoryID, true},
                                           QueryCase{"other:Library?ToolConfigControllersFactory", true},
                                           QueryCase{"proc:ProcToolConfiguration?toolconfigcontrollersfactory", false},
                                           QueryCase{"proc:ProcToolConfiguration?", false},
                                           QueryCase{"proc:ProcToolConfiguration", false},
                                           QueryCase{"proc:ProcToolConfiguration?ToolConfigControllersFactoryX", false},
                                           QueryCase{"", false}));

TEST(FactoryTest, UnknownAndWrongCaseNamesGiveNoController)
{
    CToolConfigControllersFactory factory{ID(kFactoryID)};
    for (const wchar_t* name : {L"WC_ONLINEUPDATECOMMAND", L"", L"wc_toolconfiguration", L"Wc_UsersCommand",
                                L"WC_TOOLCONFIGURATION ", L" WC_USERSCOMMAND"})
    {
        std::unique_ptr<WidgetCommandBase> controller(factory.getControllerByName(ACE_WString(name)));
        EXPECT_EQ(controller, nullptr);
    }
}

struct ControllerCase
{
    const wchar_t* name;
    const char* className;
};

class FactoryControllerTest : public ::testing::TestWithParam<ControllerCase>
{
};

TEST_P(FactoryControllerTest, KnownNameGivesANewControllerOnEveryCall)
{
    CToolConfigControllersFactory factory{ID(kFactoryID)};
    const ACE_WString name(GetParam().name);
    std::unique_ptr<WidgetCommandBase> first(factory.getControllerByName(name));
    std::unique_ptr<WidgetCommandBase> second(factory.getControllerByName(name));
    ASSERT_NE(first, nullptr);
    ASSERT_NE(second, nullptr);
    EXPECT_NE(first.get(), second.get());
    EXPECT_STREQ(first->metaObject()->className(), GetParam().className);
    EXPECT_EQ(first->getCommandID(), QString::fromWCharArray(GetParam().name));
}

INSTANTIATE_TEST_SUITE_P(Names, FactoryControllerTest,
                         ::testing::Values(ControllerCase{L"WC_TOOLCONFIGURATION", "ToolConfigurationCommand"},
                                           ControllerCase{L"WC_USERSCOMMAND", "UsersCommand"}));

TEST(FactoryTest, LifecycleWritesItsTraceLines)
{
    LogCapture log;
    {
        CToolConfigControllersFactory factory{ID(kFactoryID)};
        PToolConfigControllersFactory proxy(&factory);
        std::unique_ptr<WidgetCommandBase> none(proxy.getControllerByName(ACE_WString(L"nothing")));
    }
    const std::vector<std::string> expected = {
        "[CToolConfigControllersFactory::CToolConfigControllersFactory()] Constructor called",
        "[PProcToolConfigControllersFactory::PProcToolConfigControllersFactory()] Constructor called",
        "[PProcToolConfigControllersFactory::getControllerByName()] method started",
        "[CToolConfigControllersFactory::getControllerByName()] method started",
        "[PProcToolConfigControllersFactory::~PProcToolConfigControllersFactory()] Destructor called",
        "[CToolConfigControllersFactory::~CToolConfigControllersFactory()] Destructor called",
        "[CToolConfigControllersFactory::cleanUp()] method started",
    };
    EXPECT_EQ(log.messages(TesselLog_Static::eTRACE), expected);
}

TEST(ProxyTest, ProxyOfAnotherComponentClassAnswersNull)
{
    CComponent_Thread_NoRef other{ID("other:Library?Other")};
    PToolConfigControllersFactory proxy(&other);
    std::unique_ptr<WidgetCommandBase> controller(proxy.getControllerByName(ACE_WString(L"WC_TOOLCONFIGURATION")));
    EXPECT_EQ(controller, nullptr);
}

TEST(ProxyTest, DestroyedEventOfItsOwnComponentCutsTheProxyOff)
{
    CToolConfigControllersFactory factory{ID(kFactoryID)};
    PToolConfigControllersFactory proxy(&factory);
    LogCapture log;

    proxy.handleEvent(EventDestroyingComponent(ID("tessel:DM?DataManager")));
    EXPECT_FALSE(log.containsSubstring("m_pComp is 0"));
    EXPECT_NE(proxy.component(), nullptr);

    proxy.handleEvent(EventDestroyingComponent(ID(kFactoryID)));
    EXPECT_FALSE(log.containsSubstring("m_pComp is 0"));
    std::unique_ptr<WidgetCommandBase> controller(proxy.getControllerByName(ACE_WString(L"WC_TOOLCONFIGURATION")));
    EXPECT_EQ(controller, nullptr);

    proxy.handleEvent(EventDestroyingComponent(ID(kFactoryID)));
    EXPECT_TRUE(log.contains("[PProcToolConfigControllersFactory::handleEvent(const EventDestroyingComponent&)]: m_pComp is 0",
                             TesselLog_Static::eWARNING));
}

TEST(ManagerTest, LoadsThePlugInByItsIdentifierAndDropsItOnDestruction)
{
    ManagerScope scope;
    SmartProxy<PControllerFactoryBase> factory;
    ASSERT_TRUE(factory.acquire(ID(kFactoryID)));
    EXPECT_NE(dynamic_cast<PToolConfigControllersFactory*>(factory.get()), nullptr);
    EXPECT_EQ(factory->getID(), ID(kFactoryID));

    std::unique_ptr<WidgetCommandBase> unknown(factory->getControllerByName(ACE_WString(L"WC_ONLINEUPDATECOMMAND")));
    EXPECT_EQ(unknown, nullptr);

    LogCapture log;
    ASSERT_EQ(scope.manager->destroyComponent(ID(kFactoryID)), 0);
    EXPECT_TRUE(log.contains("[PProcToolConfigControllersFactory::handleEvent()] method started"));
    EXPECT_TRUE(log.contains("[CToolConfigControllersFactory::~CToolConfigControllersFactory()] Destructor called"));
    std::unique_ptr<WidgetCommandBase> afterwards(factory->getControllerByName(ACE_WString(L"WC_TOOLCONFIGURATION")));
    EXPECT_EQ(afterwards, nullptr);
}

class CountingHandler : public Handler<CustomEvent>
{
public:
    int received = 0;
    void handleEvent(const CustomEvent&) override { ++received; }
};

TEST(CustomEventHandlerTest, RegisteredHandlerReceivesPostedEventsUntilUnregistered)
{
    const ID id("processing:Test?Handler");
    CountingHandler handler;
    EXPECT_FALSE(handler.isRegistered());
    ASSERT_EQ(handler.Register(id), 0);
    EXPECT_TRUE(handler.isRegistered());

    EXPECT_EQ(BEvent<CustomEvent>::post(id, CustomEvent(668, ACE_WString(L"a.xml"))), 1);
    EXPECT_EQ(BEvent<CustomEvent>::post(ID("processing:Test?Other"), CustomEvent(668, ACE_WString(L"a.xml"))), 0);
    EXPECT_EQ(handler.received, 1);

    ASSERT_EQ(handler.unregister(id), 0);
    EXPECT_FALSE(handler.isRegistered());
    EXPECT_EQ(BEvent<CustomEvent>::post(id, CustomEvent(668, ACE_WString(L"a.xml"))), 0);
    EXPECT_EQ(handler.received, 1);
}

TEST(CustomEventHandlerTest, RefusedRegistrationKeepsTheIdentifierAndReturnsTheCode)
{
    const ID id("processing:Test?Handler");
    CountingHandler handler;
    ASSERT_EQ(handler.Register(id), 0);
    LogCapture log;

    const int code = handler.Register(id);
    EXPECT_NE(code, 0);
    EXPECT_TRUE(handler.isRegistered());
    EXPECT_TRUE(log.contains("Handler<class CustomEvent>::Register processing:Test?Handler registration failed with code '" +
                                 std::to_string(code) + "'",
                             TesselLog_Static::eERROR));

    CountingHandler fresh;
    EXPECT_NE(fresh.Register(ID::null), 0);
    EXPECT_FALSE(fresh.isRegistered());
    EXPECT_EQ(fresh.registeredID(), ID::null);
    handler.unregister(id);

    const int unregisterCode = handler.unregister(id);
    EXPECT_NE(unregisterCode, 0);
    EXPECT_TRUE(log.contains("Handler<class CustomEvent>::unregister processing:Test?Handler unregistration failed with code '" +
                                 std::to_string(unregisterCode) + "'",
                             TesselLog_Static::eERROR));
}

TEST(CustomEventHandlerTest, RefusedRegistrationStillRemembersTheRequestedIdentifier)
{
    const ID first("processing:Test?First");
    CountingHandler handler;
    ASSERT_EQ(handler.Register(first), 0);
    ASSERT_NE(handler.Register(first), 0);
    EXPECT_EQ(handler.registeredID(), first);
    handler.unregister(first);
}

TEST(CustomEventHandlerTest, HandlerDestroyedWhileRegisteredWarnsAndLeavesNoDanglingEntry)
{
    const ID id("processing:Test?Dangling");
    LogCapture log;
    {
        CountingHandler handler;
        ASSERT_EQ(handler.Register(id), 0);
        log.clear();
    }
    const std::vector<std::string> expected = {
        "Handler<class CustomEvent>::~Handler being destructed while still registered to 'processing:Test?Dangling'. "
        "Prepare for crash!"};
    EXPECT_EQ(log.messages(), expected);
    EXPECT_EQ(log.records().at(0).component, "Events");
    EXPECT_EQ(BEvent<CustomEvent>::post(id, CustomEvent(668, ACE_WString(L"x"))), 0);
}
}
