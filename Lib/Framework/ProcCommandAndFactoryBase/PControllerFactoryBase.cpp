#include "PControllerFactoryBase.h"

PControllerFactoryBase::PControllerFactoryBase(IComponent* component) : ProxyComponent(component)
{
}

PControllerFactoryBase::~PControllerFactoryBase() = default;
