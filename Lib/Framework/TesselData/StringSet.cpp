#include "StringSet.h"

StringSet::StringSet() = default;

int StringSet::length() const
{
    return static_cast<int>(m_items.size());
}

int StringSet::getAt(int index, ACE_WString& value) const
{
    if (index < 0 || static_cast<std::size_t>(index) >= m_items.size())
        return 1;
    value = m_items[static_cast<std::size_t>(index)];
    return 0;
}

void StringSet::add(const ACE_WString& value)
{
    m_items.push_back(value);
}
