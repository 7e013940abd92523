#pragma once

#include "IControllerFactoryBase.h"
#include "ProxyComponent.h"

class TESSEL_EXPORT PControllerFactoryBase : public ProxyComponent, public IControllerFactoryBase
{
public:
    explicit PControllerFactoryBase(IComponent* component);
    ~PControllerFactoryBase() override;
};
