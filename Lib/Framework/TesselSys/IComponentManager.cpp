#include "IComponentManager.h"

IComponentManager::~IComponentManager() = default;
