#include "IParameterizedComponent.h"

IParameterizedComponent::~IParameterizedComponent() = default;
