#pragma once

#include "CComponent_Thread_NoRef.h"
#include "IControllerFactoryBase.h"

// The library's component: builds the dialog controllers by name.
class TESSEL_EXPORT CToolConfigControllersFactory : public CComponent_Thread_NoRef, public IControllerFactoryBase
{
public:
    explicit CToolConfigControllersFactory(const ID& id);
    ~CToolConfigControllersFactory() override;

    // The factory keeps no state, so it can serve any caller.
    virtual bool isStateless() const;

    // A new controller owned by the caller, or null for any other name.
    WidgetCommandBase* getControllerByName(const ACE_WString& name) override;

private:
    void cleanUp();
};
