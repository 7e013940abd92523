#include "IControllerFactoryBase.h"

IControllerFactoryBase::~IControllerFactoryBase() = default;
