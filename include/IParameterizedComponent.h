#pragma once

#include "IComponent.h"

class TESSEL_EXPORT IParameterizedComponent : public IComponent
{
public:
    ~IParameterizedComponent() override;

    // 0 when the component is usable.
    virtual int test() = 0;
};
