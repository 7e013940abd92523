#include "HandlerCustomEvent.h"

#include "TesselLog_Static.h"

namespace
{
const char* const kComponent = "Events";
const char* const kFile = "Events.dll";
const char* const kClass = "Handler";
}

Handler<CustomEvent>::Handler() : m_id(ID::null), m_isRegistered(false)
{
}

int Handler<CustomEvent>::Register(const ID& id)
{
    m_id = id;
    const int result = BEvent<CustomEvent>::registerHandler(this, id);
    if (result == 0)
    {
        m_isRegistered = true;
        return 0;
    }
    TesselLog_Static::logError_static(kComponent, kFile, kClass, 0,
                                      "Handler<class CustomEvent>::Register %S registration failed with code '%i'",
                                      id.getString().c_str(), result);
    return result;
}

int Handler<CustomEvent>::unregister(const ID& id)
{
    const int result = BEvent<CustomEvent>::unregisterHandler(this, id);
    if (result == 0)
    {
        m_isRegistered = false;
        return 0;
    }
    TesselLog_Static::logError_static(kComponent, kFile, kClass, 0,
                                      "Handler<class CustomEvent>::unregister %S unregistration failed with code '%i'",
                                      id.getString().c_str(), result);
    return result;
}

Handler<CustomEvent>::~Handler()
{
    if (!m_isRegistered)
        return;
    TesselLog_Static::logError_static(
        kComponent, kFile, kClass, 0,
        "Handler<class CustomEvent>::~Handler being destructed while still registered to '%S'. Prepare for crash!",
        m_id.getString().c_str());
    BEvent<CustomEvent>::unregisterHandler(this, m_id);
    m_isRegistered = false;
}

void Handler<CustomEvent>::handleEvent(const CustomEvent&)
{
}
