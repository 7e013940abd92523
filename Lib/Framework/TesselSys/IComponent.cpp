#include "IComponent.h"

IComponent::~IComponent() = default;
