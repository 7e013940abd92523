#pragma once

#include "IComponent.h"
#include "ProxyComponent.h"

// The library's exported entry points, found by the component manager by name.
extern "C" {
TESSEL_EXPORT IComponent* createComponent(const ID& id);
TESSEL_EXPORT ProxyComponent* createProxy(const ID& id, IComponent* component);
}
