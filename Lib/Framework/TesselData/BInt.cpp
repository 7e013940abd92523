#include "BInt.h"

BInt::BInt() = default;

BInt::BInt(long value) : m_value(value)
{
}

BData::Type BInt::type() const
{
    return eINT;
}

std::unique_ptr<BData> BInt::clone() const
{
    return std::make_unique<BInt>(*this);
}

bool BInt::assign(const BData& other)
{
    if (other.type() != eINT)
        return false;
    m_value = static_cast<const BInt&>(other).m_value;
    return true;
}

bool BInt::equals(const BData& other) const
{
    if (other.type() != eINT)
        return false;
    return static_cast<const BInt&>(other).m_value == m_value;
}

int BInt::get(long& value) const
{
    value = m_value;
    return 0;
}

void BInt::set(long value)
{
    m_value = value;
}

long BInt::value() const
{
    return m_value;
}
