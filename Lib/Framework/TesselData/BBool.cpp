#include "BBool.h"

BBool::BBool() = default;

BBool::BBool(bool value) : m_value(value)
{
}

BData::Type BBool::type() const
{
    return eBOOL;
}

std::unique_ptr<BData> BBool::clone() const
{
    return std::make_unique<BBool>(*this);
}

bool BBool::assign(const BData& other)
{
    if (other.type() != eBOOL)
        return false;
    m_value = static_cast<const BBool&>(other).m_value;
    return true;
}

bool BBool::equals(const BData& other) const
{
    if (other.type() != eBOOL)
        return false;
    return static_cast<const BBool&>(other).m_value == m_value;
}

int BBool::get(bool& value) const
{
    value = m_value;
    return 0;
}

void BBool::set(bool value)
{
    m_value = value;
}

bool BBool::value() const
{
    return m_value;
}
