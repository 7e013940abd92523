#pragma once

#include "Export.h"

#include <ace/SString.h>

// An application event: a type number and a data string.
class TESSEL_EXPORT CustomEvent
{
public:
    CustomEvent(int type, const ACE_WString& data);

    int get_type() const;
    const ACE_WString& get_data() const;

private:
    int m_type;
    ACE_WString m_data;
};
