#include "BEvent.h"
#include "CustomEvent.h"
#include "Handler.h"

#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <string>
#include <thread>
#include <vector>

namespace
{
struct PingEvent
{
    int value;
};
struct OtherEvent
{
};

class PingHandler : public Handler<PingEvent>
{
public:
    void handleEvent(const PingEvent& event) override
    {
        ++received;
        lastValue = event.value;
        if (onEvent)
            onEvent();
    }
    int received = 0;
    int lastValue = 0;
    std::function<void()> onEvent;
};

class OtherHandler : public Handler<OtherEvent>
{
public:
    void handleEvent(const OtherEvent&) override { ++received; }
    int received = 0;
};

const ID kA("test:Events?A");
const ID kB("test:Events?B");

TEST(EventRegistryTest, RegistrationRules)
{
    PingHandler handler;
    PingHandler other;
    EXPECT_EQ(handler.Register(kA), EventRegistry::eOK);
    EXPECT_EQ(handler.Register(kA), EventRegistry::eALREADY_REGISTERED);
    EXPECT_EQ(handler.Register(kB), EventRegistry::eOK) << "one handler may listen under several identifiers";
    EXPECT_EQ(other.Register(kA), EventRegistry::eOK) << "several handlers may listen under one identifier";
    EXPECT_EQ(other.Register(ID::null), EventRegistry::eNULL_IDENTIFIER);
    EXPECT_EQ(BEvent<PingEvent>::registerHandler(nullptr, kA), EventRegistry::eNULL_HANDLER);

    EXPECT_EQ(handler.unregister(kA), EventRegistry::eOK);
    EXPECT_EQ(handler.unregister(kA), EventRegistry::eNOT_REGISTERED);
    EXPECT_EQ(handler.unregister(kB), EventRegistry::eOK);
    EXPECT_EQ(other.unregister(kA), EventRegistry::eOK);
    EXPECT_EQ(BEvent<PingEvent>::broadcast(PingEvent{1}), 0);
}

TEST(EventRegistryTest, PostReachesTheIdentifierAndBroadcastReachesAllOfTheEventType)
{
    PingHandler a1;
    PingHandler a2;
    PingHandler b;
    OtherHandler otherTypeAtA;
    ASSERT_EQ(a1.Register(kA), 0);
    ASSERT_EQ(a2.Register(kA), 0);
    ASSERT_EQ(b.Register(kB), 0);
    ASSERT_EQ(otherTypeAtA.Register(kA), 0);

    EXPECT_EQ(BEvent<PingEvent>::post(kA, PingEvent{7}), 2);
    EXPECT_EQ(a1.received, 1);
    EXPECT_EQ(a2.lastValue, 7);
    EXPECT_EQ(b.received, 0);
    EXPECT_EQ(otherTypeAtA.received, 0);

    EXPECT_EQ(BEvent<PingEvent>::post(ID("test:Events?Nobody"), PingEvent{8}), 0);
    EXPECT_EQ(BEvent<PingEvent>::broadcast(PingEvent{9}), 3);
    EXPECT_EQ(a1.received, 2);
    EXPECT_EQ(b.lastValue, 9);
    EXPECT_EQ(otherTypeAtA.received, 0);

    for (Handler<PingEvent>* handler : {static_cast<Handler<PingEvent>*>(&a1), static_cast<Handler<PingEvent>*>(&a2)})
        EXPECT_EQ(handler->unregister(kA), 0);
    EXPECT_EQ(b.unregister(kB), 0);
    EXPECT_EQ(otherTypeAtA.unregister(kA), 0);
}

TEST(EventRegistryTest, HandlersUnregisteredDuringDeliveryAreSkipped)
{
    PingHandler first;
    PingHandler second;
    PingHandler third;
    ASSERT_EQ(first.Register(kA), 0);
    ASSERT_EQ(second.Register(kA), 0);
    ASSERT_EQ(third.Register(kA), 0);
    first.onEvent = [&] {
        first.unregister(kA);
        second.unregister(kA);
    };

    EXPECT_EQ(BEvent<PingEvent>::post(kA, PingEvent{1}), 2);
    EXPECT_EQ(first.received, 1);
    EXPECT_EQ(second.received, 0);
    EXPECT_EQ(third.received, 1);

    EXPECT_EQ(BEvent<PingEvent>::post(kA, PingEvent{2}), 1);
    EXPECT_EQ(third.received, 2);
    third.unregister(kA);
}

TEST(EventRegistryTest, HandlerDestroyedWhileRegisteredLeavesNoEntry)
{
    {
        PingHandler handler;
        ASSERT_EQ(handler.Register(kB), 0);
    }
    EXPECT_EQ(BEvent<PingEvent>::post(kB, PingEvent{1}), 0);
}

TEST(EventRegistryTest, CustomEventCarriesTypeAndData)
{
    std::vector<std::pair<int, std::wstring>> seen;
    int marker = 0;
    ASSERT_EQ(EventRegistry::instance().add("custom-test", &marker, kA,
                                            [&seen](const void* event) {
                                                const auto& custom = *static_cast<const CustomEvent*>(event);
                                                seen.emplace_back(custom.get_type(), custom.get_data().c_str());
                                            }),
              0);
    EXPECT_TRUE(EventRegistry::instance().isRegistered("custom-test", &marker, kA));
    const CustomEvent event(668, ACE_WString(L"/data/FicheDiagParams.xml"));
    EXPECT_EQ(EventRegistry::instance().deliver("custom-test", &kA, &event), 1);
    ASSERT_EQ(seen.size(), 1u);
    EXPECT_EQ(seen[0].first, 668);
    EXPECT_EQ(seen[0].second, L"/data/FicheDiagParams.xml");
    EXPECT_EQ(EventRegistry::instance().remove("custom-test", &marker, kA), 0);
    EXPECT_FALSE(EventRegistry::instance().isRegistered("custom-test", &marker, kA));
}

TEST(EventRegistryTest, ThreadsRegisteringAndPostingAtOnceEachSeeTheirOwnEvents)
{
    constexpr int kThreads = 4;
    constexpr int kRounds = 200;
    std::vector<PingHandler> handlers(kThreads);
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t)
        threads.emplace_back([&handlers, t] {
            const ID id(("test:Events?Thread" + std::to_string(t)).c_str());
            for (int i = 0; i < kRounds; ++i)
            {
                handlers[t].Register(id);
                BEvent<PingEvent>::post(id, PingEvent{i});
                handlers[t].unregister(id);
                BEvent<PingEvent>::post(id, PingEvent{-1});
            }
        });
    for (std::thread& thread : threads)
        thread.join();
    for (const PingHandler& handler : handlers)
    {
        EXPECT_EQ(handler.received, kRounds);
        EXPECT_EQ(handler.lastValue, kRounds - 1);
        EXPECT_FALSE(handler.isRegistered());
    }
}
}
