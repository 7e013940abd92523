#include "CustomEvent.h"

CustomEvent::CustomEvent(int type, const ACE_WString& data) : m_type(type), m_data(data)
{
}

int CustomEvent::get_type() const
{
    return m_type;
}

const ACE_WString& CustomEvent::get_data() const
{
    return m_data;
}
