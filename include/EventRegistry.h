#pragma once

#include "ID.h"

#include <functional>
#include <memory>
#include <string>

// Process-wide table of event handlers, keyed by event type and identifier. BEvent<T> is
// the typed front; handlers are called synchronously on the thread that posts.
class TESSEL_EXPORT EventRegistry
{
public:
    enum Result
    {
        eOK = 0,
        eNULL_IDENTIFIER = 1,
        eALREADY_REGISTERED = 2,
        eNOT_REGISTERED = 3,
        eNULL_HANDLER = 4
    };
    using Dispatch = std::function<void(const void* event)>;

    static EventRegistry& instance();

    int add(const std::string& eventType, const void* handler, const ID& id, Dispatch dispatch);
    int remove(const std::string& eventType, const void* handler, const ID& id);
    bool isRegistered(const std::string& eventType, const void* handler, const ID& id) const;
    // Number of handlers reached. A handler removed while others run is not called.
    int deliver(const std::string& eventType, const ID* target, const void* event);

private:
    EventRegistry();
    ~EventRegistry();
    EventRegistry(const EventRegistry&) = delete;
    EventRegistry& operator=(const EventRegistry&) = delete;

    struct Impl;
    std::unique_ptr<Impl> m_impl;
};
