#include "PDataManager.h"
#include "SmartProxy.h"
#include "TestComponents.h"

#include <gtest/gtest.h>

namespace
{
const char* const kComponentA = "test:Unit?A";
const char* const kComponentB = "test:Unit?B";
const char* const kUnreachable = "test:NoSuchLibraryQx?A";

class SmartProxyTest : public ::testing::Test
{
protected:
    void SetUp() override
    {
        ASSERT_EQ(m_manager->registerComponent(std::make_unique<RecordingComponent>(kComponentA), recordingProxyFactory()),
                  0);
        ASSERT_EQ(m_manager->registerComponent(std::make_unique<RecordingComponent>(kComponentB), recordingProxyFactory()),
                  0);
        m_base = m_manager->getLiveProxyCount();
    }
    int held() const { return m_manager->getLiveProxyCount() - m_base; }

    ManagerHold m_manager;
    int m_base = 0;
};

TEST_F(SmartProxyTest, FailedAcquisitionKeepsNothing)
{
    SmartProxy<RecordingProxy> proxy;
    EXPECT_FALSE(proxy.acquire(ID(kUnreachable)));
    EXPECT_FALSE(proxy.isAvailable());
    EXPECT_EQ(proxy.get(), nullptr);
    EXPECT_EQ(held(), 0);
}

TEST_F(SmartProxyTest, AcquiringAgainGivesTheHeldProxyBackFirst)
{
    SmartProxy<RecordingProxy> proxy;
    ASSERT_TRUE(proxy.acquire(ID(kComponentA)));
    EXPECT_EQ(held(), 1);
    ASSERT_TRUE(proxy.acquire(ID(kComponentB)));
    EXPECT_EQ(held(), 1);
    EXPECT_EQ(proxy->getID(), ID(kComponentB));

    EXPECT_FALSE(proxy.acquire(ID(kUnreachable)));
    EXPECT_FALSE(proxy.isAvailable());
    EXPECT_EQ(held(), 0) << "a failed acquisition still gave the old proxy back";
}

TEST_F(SmartProxyTest, ProxyOfAnotherTypeIsGivenBack)
{
    SmartProxy<PDataManager> proxy;
    EXPECT_FALSE(proxy.acquire(ID(kComponentA)));
    EXPECT_EQ(proxy.get(), nullptr);
    EXPECT_EQ(held(), 0);
}

TEST_F(SmartProxyTest, DestructionGivesTheProxyBack)
{
    {
        SmartProxy<RecordingProxy> first;
        SmartProxy<RecordingProxy> second;
        ASSERT_TRUE(first.acquire(ID(kComponentA)));
        ASSERT_TRUE(second.acquire(ID(kComponentA)));
        EXPECT_NE(first.get(), second.get());
        EXPECT_EQ(held(), 2);
        second.giveBack();
        EXPECT_EQ(held(), 1);
    }
    EXPECT_EQ(held(), 0);
}
}
