#include "BDouble.h"

#include <cmath>

BDouble::BDouble() = default;

BDouble::BDouble(double value) : m_value(value)
{
}

BData::Type BDouble::type() const
{
    return eDOUBLE;
}

std::unique_ptr<BData> BDouble::clone() const
{
    return std::make_unique<BDouble>(*this);
}

bool BDouble::assign(const BData& other)
{
    if (other.type() != eDOUBLE)
        return false;
    m_value = static_cast<const BDouble&>(other).m_value;
    return true;
}

bool BDouble::equals(const BData& other) const
{
    if (other.type() != eDOUBLE)
        return false;
    const double theirs = static_cast<const BDouble&>(other).m_value;
    // Equal values, or both not a number (a value read back equals the one written).
    return theirs == m_value || (std::isnan(theirs) && std::isnan(m_value));
}

int BDouble::get(double& value) const
{
    value = m_value;
    return 0;
}

void BDouble::set(double value)
{
    m_value = value;
}

double BDouble::value() const
{
    return m_value;
}
