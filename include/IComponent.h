#pragma once

#include "BOStream.h"
#include "ID.h"

// A component of the framework: made by the component manager (or registered by the host),
// reached by other components only through proxies.
class TESSEL_EXPORT IComponent
{
public:
    virtual ~IComponent();

    virtual int cleanupResources() = 0;
    virtual int run(const BOStream& stream) = 0;
    virtual const ID& getID() const = 0;
};
