#pragma once

#include "EventRegistry.h"

#include <typeinfo>

template <class TEvent>
class Handler;

// The events library's typed front: handlers register under an identifier; posted events
// reach the handlers registered under the target identifier, broadcast ones reach all.
template <class TEvent>
class BEvent
{
public:
    static int registerHandler(Handler<TEvent>* handler, const ID& id)
    {
        if (handler == nullptr)
            return EventRegistry::eNULL_HANDLER;
        return EventRegistry::instance().add(typeName(), handler, id, [handler](const void* event) {
            handler->handleEvent(*static_cast<const TEvent*>(event));
        });
    }

    static int unregisterHandler(Handler<TEvent>* handler, const ID& id)
    {
        return EventRegistry::instance().remove(typeName(), handler, id);
    }

    static int post(const ID& target, const TEvent& event)
    {
        return EventRegistry::instance().deliver(typeName(), &target, &event);
    }

    static int broadcast(const TEvent& event) { return EventRegistry::instance().deliver(typeName(), nullptr, &event); }

private:
    static std::string typeName() { return typeid(TEvent).name(); }
};
