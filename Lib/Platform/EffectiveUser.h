#pragma once

#include "Export.h"

#include <string>

// The login name of the effective user of the process (empty when it has none).
class TESSEL_EXPORT EffectiveUser
{
public:
    static std::wstring loginName();
};
