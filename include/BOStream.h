#pragma once

#include "Export.h"

// Start-up options handed to a component's run.
class TESSEL_EXPORT BOStream
{
public:
    explicit BOStream(bool startNow = false);
    bool startNow() const;

private:
    bool m_startNow;
};
