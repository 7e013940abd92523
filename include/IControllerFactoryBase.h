#pragma once

#include "Export.h"

#include <ace/SString.h>

class WidgetCommandBase;

class TESSEL_EXPORT IControllerFactoryBase
{
public:
    virtual ~IControllerFactoryBase();

    // A new controller owned by the caller, or null for an unknown name.
    virtual WidgetCommandBase* getControllerByName(const ACE_WString& name) = 0;
};
