#pragma once

#include "CustomEvent.h"
#include "Handler.h"

// The custom-event handler base of the library's controllers.
template <>
class TESSEL_EXPORT Handler<CustomEvent>
{
public:
    Handler();

    virtual int Register(const ID& id);
    virtual int unregister(const ID& id);
    // A handler still registered logs that it should not be, then unregisters itself so the
    // events library never keeps a dangling pointer.
    virtual ~Handler();
    virtual void handleEvent(const CustomEvent& event) = 0;

    bool isRegistered() const { return m_isRegistered; }
    const ID& registeredID() const { return m_id; }

protected:
    ID m_id;
    bool m_isRegistered;

private:
    Handler(const Handler&) = delete;
    Handler& operator=(const Handler&) = delete;
};
