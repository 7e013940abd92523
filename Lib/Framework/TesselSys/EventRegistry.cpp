#include "EventRegistry.h"

#include <mutex>
#include <new>
#include <vector>

struct EventRegistry::Impl
{
    struct Entry
    {
        unsigned long serial;
        std::string eventType;
        const void* handler;
        ID id;
        Dispatch dispatch;
    };

    bool matches(const Entry& entry, const std::string& eventType, const void* handler, const ID& id) const
    {
        return entry.handler == handler && entry.eventType == eventType && entry.id == id;
    }

    bool contains(unsigned long serial) const
    {
        for (const Entry& entry : entries)
            if (entry.serial == serial)
                return true;
        return false;
    }

    mutable std::mutex mutex;
    std::vector<Entry> entries;
    unsigned long nextSerial = 1;
};

EventRegistry::EventRegistry() : m_impl(std::make_unique<Impl>())
{
}

EventRegistry::~EventRegistry() = default;

EventRegistry& EventRegistry::instance()
{
    // Never destroyed: handlers may unregister from static destructors, so the table outlives
    // them all. What it holds stays reachable from this storage.
    alignas(EventRegistry) static unsigned char storage[sizeof(EventRegistry)];
    static EventRegistry* const registry = new (storage) EventRegistry();
    return *registry;
}

int EventRegistry::add(const std::string& eventType, const void* handler, const ID& id, Dispatch dispatch)
{
    if (handler == nullptr || !dispatch)
        return eNULL_HANDLER;
    if (id.isNull())
        return eNULL_IDENTIFIER;
    std::lock_guard<std::mutex> lock(m_impl->mutex);
    for (const Impl::Entry& entry : m_impl->entries)
        if (m_impl->matches(entry, eventType, handler, id))
            return eALREADY_REGISTERED;
    m_impl->entries.push_back(Impl::Entry{m_impl->nextSerial++, eventType, handler, id, std::move(dispatch)});
    return eOK;
}

int EventRegistry::remove(const std::string& eventType, const void* handler, const ID& id)
{
    if (handler == nullptr)
        return eNULL_HANDLER;
    // The entry's dispatch function is destroyed outside the lock.
    Dispatch removed;
    std::lock_guard<std::mutex> lock(m_impl->mutex);
    auto& entries = m_impl->entries;
    for (auto it = entries.begin(); it != entries.end(); ++it)
    {
        if (m_impl->matches(*it, eventType, handler, id))
        {
            removed = std::move(it->dispatch);
            entries.erase(it);
            return eOK;
        }
    }
    return eNOT_REGISTERED;
}

bool EventRegistry::isRegistered(const std::string& eventType, const void* handler, const ID& id) const
{
    std::lock_guard<std::mutex> lock(m_impl->mutex);
    for (const Impl::Entry& entry : m_impl->entries)
        if (m_impl->matches(entry, eventType, handler, id))
            return true;
    return false;
}

int EventRegistry::deliver(const std::string& eventType, const ID* target, const void* event)
{
    if (event == nullptr)
        return 0;
    std::vector<std::pair<unsigned long, Dispatch>> selected;
    {
        std::lock_guard<std::mutex> lock(m_impl->mutex);
        for (const Impl::Entry& entry : m_impl->entries)
            if (entry.eventType == eventType && (target == nullptr || entry.id == *target))
                selected.emplace_back(entry.serial, entry.dispatch);
    }
    int reached = 0;
    for (const auto& [serial, dispatch] : selected)
    {
        {
            // A handler that an earlier one unregistered is skipped.
            std::lock_guard<std::mutex> lock(m_impl->mutex);
            if (!m_impl->contains(serial))
                continue;
        }
        dispatch(event);
        ++reached;
    }
    return reached;
}
