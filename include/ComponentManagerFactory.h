#pragma once

#include "IComponentManager.h"

class TESSEL_EXPORT ComponentManagerFactory
{
public:
    // The process's component manager, acquired once for the caller, who releases it.
    static IComponentManager* getComponentManager();
};
