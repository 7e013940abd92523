#include "ComponentFixture.h"
#include "PMediator.h"
#include "PMessageBoxManager.h"
#include "PProcStartUpdateAgent.h"
#include "PQ17FileSystemWatcher.h"
#include "ProxyComponent.h"

#include <gtest/gtest.h>

namespace
{
// Without a registration, the component manager makes each component from the library its
// identifier names, through the library's entry points.
class LibraryLoading : public ComponentFixture, public ::testing::WithParamInterface<const char*>
{
};

TEST_P(LibraryLoading, ComponentIsMadeFromItsLibrary)
{
    ProxyComponent* proxy = nullptr;
    ASSERT_EQ(m_manager->getProxy(ID(GetParam()), proxy), 0);
    ASSERT_NE(proxy, nullptr);
    ASSERT_NE(proxy->component(), nullptr);
    const bool rightKind = dynamic_cast<PQ17FileSystemWatcher*>(proxy) != nullptr ||
                           dynamic_cast<PProcStartUpdateAgent*>(proxy) != nullptr ||
                           dynamic_cast<PMessageBoxManager*>(proxy) != nullptr ||
                           dynamic_cast<PMediator*>(proxy) != nullptr;
    EXPECT_TRUE(rightKind);
    EXPECT_EQ(m_manager->releaseProxy(proxy), 0);
}

INSTANTIATE_TEST_SUITE_P(Identifiers, LibraryLoading,
                         ::testing::Values("util:FileSystemUtilities?CQ17FileSystemWatcher",
                                           "proc:ProcStartUpdateAgent?ProcStartUpdateAgent",
                                           "tessel:Navigation?MessageBoxManager",
                                           "gui:GuiToolConfiguration?MedToolConfiguration#ToolConfiguaration.ui"));

TEST_F(ComponentFixture, UnknownQueryInAKnownLibraryGivesNoComponent)
{
    ProxyComponent* proxy = nullptr;
    EXPECT_NE(m_manager->getProxy(ID("tessel:Navigation?NoSuchComponent"), proxy), 0);
    EXPECT_EQ(proxy, nullptr);
}
}
