#include "CComponent_Thread_NoRef.h"

#include "WideString.h"

#include <pugixml.hpp>

#include <sstream>

namespace
{
// Decrements `counter` unless it is already 0; the new value, or -1 when it was 0.
int decrementIfPositive(std::atomic<int>& counter)
{
    int current = counter.load();
    while (current > 0)
    {
        if (counter.compare_exchange_weak(current, current - 1))
            return current - 1;
    }
    return -1;
}
}

CComponent_Thread_NoRef::CComponent_Thread_NoRef(const ID& id)
    : m_componentID(id),
      m_attachCount(0),
      m_proxyCount(0),
      m_referenceCount(0)
{
}

CComponent_Thread_NoRef::~CComponent_Thread_NoRef() = default;

int CComponent_Thread_NoRef::test()
{
    return 0;
}

int CComponent_Thread_NoRef::cleanupResources()
{
    return 0;
}

int CComponent_Thread_NoRef::run(const BOStream&)
{
    return 0;
}

const ID& CComponent_Thread_NoRef::getID() const
{
    return m_componentID;
}

ACE_WString CComponent_Thread_NoRef::getXMLState() const
{
    pugi::xml_document document;
    pugi::xml_node node = document.append_child("component");
    node.append_attribute("id").set_value(WideString::toUtf8(m_componentID.getString()).c_str());
    node.append_attribute("attached").set_value(m_attachCount.load());
    node.append_attribute("proxies").set_value(m_proxyCount.load());
    node.append_attribute("references").set_value(m_referenceCount.load());
    std::ostringstream out;
    document.save(out, "", pugi::format_raw | pugi::format_no_declaration, pugi::encoding_utf8);
    return WideString::fromUtf8(out.str());
}

int CComponent_Thread_NoRef::attach()
{
    return ++m_attachCount;
}

int CComponent_Thread_NoRef::detach()
{
    return decrementIfPositive(m_attachCount);
}

int CComponent_Thread_NoRef::attachProxy()
{
    return ++m_proxyCount;
}

int CComponent_Thread_NoRef::detachProxy()
{
    return decrementIfPositive(m_proxyCount);
}

int CComponent_Thread_NoRef::acquire()
{
    return ++m_referenceCount;
}

int CComponent_Thread_NoRef::release()
{
    return decrementIfPositive(m_referenceCount);
}

int CComponent_Thread_NoRef::getAttachedProxyCount() const
{
    return m_proxyCount.load();
}
