#pragma once

#include "ID.h"

// Sent to every proxy of a component just before the component is destroyed.
class TESSEL_EXPORT EventDestroyingComponent
{
public:
    explicit EventDestroyingComponent(const ID& componentID);
    const ID& getComponentID() const;

private:
    ID m_componentID;
};
