#pragma once

#include "BEvent.h"
#include "ID.h"

// Base of every event handler: registers itself with the events library under an identifier
// and receives the events posted there through handleEvent.
template <class TEvent>
class Handler
{
public:
    Handler() : m_id(ID::null), m_isRegistered(false) {}

    virtual int Register(const ID& id)
    {
        m_id = id;
        const int result = BEvent<TEvent>::registerHandler(this, id);
        if (result == 0)
            m_isRegistered = true;
        return result;
    }

    virtual int unregister(const ID& id)
    {
        const int result = BEvent<TEvent>::unregisterHandler(this, id);
        if (result == 0)
            m_isRegistered = false;
        return result;
    }

    virtual ~Handler()
    {
        if (m_isRegistered)
            BEvent<TEvent>::unregisterHandler(this, m_id);
    }

    virtual void handleEvent(const TEvent& event) = 0;

    bool isRegistered() const { return m_isRegistered; }
    const ID& registeredID() const { return m_id; }

protected:
    ID m_id;
    bool m_isRegistered;

private:
    Handler(const Handler&) = delete;
    Handler& operator=(const Handler&) = delete;
};
