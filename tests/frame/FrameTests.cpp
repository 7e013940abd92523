#include "CToolConfigControllersFactory.h"
#include "ComponentManagerFactory.h"
#include "EntryPoints.h"
#include "HandlerCustomEvent.h"
#include "LogCapture.h"
#include "PToolConfigControllersFactory.h"
#include "SmartProxy.h"
#include "TestText.h"
#include "Uris.h"
#include "WidgetCommandBase.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <memory>

namespace
{
using Controller = std::unique_ptr<WidgetCommandBase>;
const ID kFactory(Uri::kFactory);

TEST(EntryPoints, OnlyTheFactoryQueryMakesAComponentAndAProxy)
{
    CToolConfigControllersFactory reference{kFactory};
    for (const auto& [id, matches] :
         {std::pair("other:Library?ToolConfigControllersFactory", true), std::pair("proc:ProcToolConfiguration", false),
          std::pair("proc:ProcToolConfiguration?toolconfigcontrollersfactory", false), std::pair("", false)})
    {
        EXPECT_EQ(std::unique_ptr<IComponent>(createComponent(ID(id))) != nullptr, matches) << id;
        EXPECT_EQ(std::unique_ptr<ProxyComponent>(createProxy(ID(id), &reference)) != nullptr, matches) << id;
    }
}

// Two names, matched exactly, each giving a new controller on every call, also through the proxy.
TEST(Factory, KnownNamesGiveNewControllersAndItsProxyOnlyWhileItLives)
{
    CToolConfigControllersFactory factory{kFactory};
    PToolConfigControllersFactory proxy(&factory);
    for (const auto& [name, className] :
         {std::pair("WC_TOOLCONFIGURATION", "ToolConfigurationCommand"), std::pair("WC_USERSCOMMAND", "UsersCommand")})
    {
        const Controller first(factory.getControllerByName(wide(name))), second(proxy.getControllerByName(wide(name)));
        ASSERT_TRUE(first && second && first.get() != second.get()) << name;
        EXPECT_EQ(first->getCommandID(), qs(name));
        EXPECT_STREQ(first->metaObject()->className(), className);
    }
    EXPECT_EQ(Controller(factory.getControllerByName(L"wc_toolconfiguration"_w)), nullptr);
    // A proxy answers null for another component class, or once its component is destroyed.
    CComponent_Thread_NoRef other{ID("other:Library?Other")};
    EXPECT_EQ(Controller(PToolConfigControllersFactory(&other).getControllerByName(L"WC_TOOLCONFIGURATION"_w)),
              nullptr);
    LogCapture log;
    proxy.handleEvent(EventDestroyingComponent(ID("tessel:DM?DataManager"))); // another component's
    EXPECT_NE(Controller(proxy.getControllerByName(L"WC_TOOLCONFIGURATION"_w)), nullptr);
    proxy.handleEvent(EventDestroyingComponent(kFactory));
    EXPECT_TRUE(Controller(proxy.getControllerByName(L"WC_TOOLCONFIGURATION"_w)) == nullptr &&
                !log.containsSubstring("m_pComp is 0"));
    proxy.handleEvent(EventDestroyingComponent(kFactory));
    EXPECT_TRUE(log.containsSubstring("m_pComp is 0", TesselLog_Static::eWARNING));
}

TEST(Manager, LoadsThePlugInByItsIdentifierAndCutsItsProxyOffOnDestruction)
{
    IComponentManager* manager = ComponentManagerFactory::getComponentManager();
    if (const char* bin = std::getenv("PTC_BIN_DIR"))
        manager->setLibraryPath(bin);
    SmartProxy<PControllerFactoryBase> factory;
    ASSERT_TRUE(factory.acquire(kFactory));
    ASSERT_TRUE(dynamic_cast<PToolConfigControllersFactory*>(factory.get()) &&
                manager->destroyComponent(kFactory) == 0);
    EXPECT_EQ(Controller(factory->getControllerByName(L"WC_TOOLCONFIGURATION"_w)), nullptr);
    factory.giveBack();
    manager->destroyAllComponents();
    manager->release();
}

class CountingHandler : public Handler<CustomEvent>
{
public:
    int received = 0;
    void handleEvent(const CustomEvent&) override { ++received; }
};

int post(const char* id)
{
    return BEvent<CustomEvent>::post(ID(id), CustomEvent(668, L"a.xml"_w));
}

TEST(CustomEventHandler, ReceivesPostedEventsWhileRegisteredAndLogsRefusals)
{
    const ID id("processing:Test?Handler");
    LogCapture log;
    CountingHandler handler;
    ASSERT_EQ(handler.Register(id), 0);
    EXPECT_EQ(post("processing:Test?Handler") + post("processing:Test?Other"), 1);
    EXPECT_TRUE(handler.Register(id) != 0 && handler.isRegistered() &&
                handler.registeredID() == id); // the first one stays
    ASSERT_EQ(handler.unregister(id), 0);
    EXPECT_TRUE(handler.unregister(id) != 0 && !handler.isRegistered());
    EXPECT_TRUE(post("processing:Test?Handler") == 0 && handler.received == 1);
    EXPECT_EQ(log.messages(TesselLog_Static::eERROR).size(), 2u);
    std::make_unique<CountingHandler>()->Register(ID("processing:Test?Dangling"));
    EXPECT_TRUE(
        log.containsSubstring("~Handler being destructed while still registered to 'processing:Test?Dangling'"));
    EXPECT_EQ(post("processing:Test?Dangling"), 0);
}
}
