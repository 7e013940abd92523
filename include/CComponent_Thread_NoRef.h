#pragma once

#include "IParameterizedComponent.h"

#include <ace/SString.h>

#include <atomic>

// Common base of components: keeps the identifier and counts attached proxies.
class TESSEL_EXPORT CComponent_Thread_NoRef : public IParameterizedComponent
{
public:
    explicit CComponent_Thread_NoRef(const ID& id);
    ~CComponent_Thread_NoRef() override;

    int test() override;
    int cleanupResources() override;
    int run(const BOStream& stream) override;
    const ID& getID() const override;

    virtual ACE_WString getXMLState() const;
    virtual int attach();
    virtual int detach();
    virtual int attachProxy();
    virtual int detachProxy();
    virtual int acquire();
    virtual int release();

    int getAttachedProxyCount() const;

private:
    CComponent_Thread_NoRef(const CComponent_Thread_NoRef&) = delete;
    CComponent_Thread_NoRef& operator=(const CComponent_Thread_NoRef&) = delete;

    ID m_componentID;
    std::atomic<int> m_attachCount;
    std::atomic<int> m_proxyCount;
    std::atomic<int> m_referenceCount;
};
