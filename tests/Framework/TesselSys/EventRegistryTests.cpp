#include "BEvent.h"
#include "Handler.h"

#include <gtest/gtest.h>

#include <functional>
#include <thread>

namespace
{
struct PingEvent
{
    int value;
};
struct OtherEvent
{
    int value;
};

template <class Event>
struct CountingHandler : Handler<Event>
{
    void handleEvent(const Event& event) override
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
using PingHandler = CountingHandler<PingEvent>;

const ID kA("test:Events?A");
const ID kB("test:Events?B");

TEST(EventRegistryTest, RegistrationRulesPostToTheIdentifierAndBroadcastToAllHandlersOfTheType)
{
    PingHandler a1;
    PingHandler a2;
    PingHandler b;
    CountingHandler<OtherEvent> otherTypeAtA;
    ASSERT_EQ(a1.Register(kA) + a2.Register(kA) + b.Register(kB) + otherTypeAtA.Register(kA), 0);
    EXPECT_EQ(BEvent<PingEvent>::post(kA, PingEvent{7}), 2);
    EXPECT_TRUE(a1.received + b.received == 1 && a2.lastValue == 7);
    EXPECT_EQ(BEvent<PingEvent>::post(ID("test:Events?Nobody"), PingEvent{8}), 0);
    EXPECT_EQ(BEvent<PingEvent>::broadcast(PingEvent{9}), 3);
    EXPECT_TRUE(a1.received == 2 && b.lastValue == 9 && otherTypeAtA.received == 0);

    // Handlers unregistered during a delivery are skipped; they are called in registration order.
    a1.onEvent = [&] {
        a1.unregister(kA);
        a2.unregister(kA);
    };
    EXPECT_EQ(BEvent<PingEvent>::broadcast(PingEvent{1}), 2);
    EXPECT_TRUE(a1.received == 3 && a2.received == 2 && b.received == 2);

    // Registration rules.
    PingHandler other;
    EXPECT_EQ(b.Register(kB), EventRegistry::eALREADY_REGISTERED);
    EXPECT_EQ(b.Register(kA) + other.Register(kB), EventRegistry::eOK) << "many to many";
    EXPECT_EQ(other.Register(ID::null), EventRegistry::eNULL_IDENTIFIER);
    EXPECT_EQ(BEvent<PingEvent>::registerHandler(nullptr, kA), EventRegistry::eNULL_HANDLER);
    EXPECT_EQ(b.unregister(kA) + b.unregister(kB) + other.unregister(kB), EventRegistry::eOK);
    EXPECT_EQ(b.unregister(kA), EventRegistry::eNOT_REGISTERED);
    ASSERT_EQ(std::make_unique<PingHandler>()->Register(kB), 0); // destroyed right away
    EXPECT_EQ(BEvent<PingEvent>::broadcast(PingEvent{1}), 0) << "a destroyed handler leaves no entry";

    // The untyped registry says what is registered.
    EventRegistry& registry = EventRegistry::instance();
    int seen = 0;
    ASSERT_EQ(registry.add("custom-test", &seen, kA, [&seen](const void*) { ++seen; }), 0);
    EXPECT_TRUE(registry.isRegistered("custom-test", &seen, kA) && !registry.isRegistered("custom-test", &seen, kB));
    EXPECT_TRUE(registry.deliver("custom-test", &kA, &seen) == 1 && seen == 1);
    EXPECT_TRUE(registry.remove("custom-test", &seen, kA) == 0 && !registry.isRegistered("custom-test", &seen, kA));
}

TEST(EventRegistryTest, ThreadsRegisteringAndPostingAtOnceEachSeeTheirOwnEvents)
{
    std::vector<PingHandler> handlers(3);
    std::vector<std::thread> threads;
    for (std::size_t t = 0; t < handlers.size(); ++t)
        threads.emplace_back([&handlers, t] {
            const ID id(("test:Events?Thread" + std::to_string(t)).c_str());
            for (int i = 0; i < 100; ++i)
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
        EXPECT_TRUE(handler.received == 100 && handler.lastValue == 99 && !handler.isRegistered());
}
}
