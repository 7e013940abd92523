#include "BString.h"

BString::BString() = default;

BString::BString(const ACE_WString& value) : m_value(value)
{
}

BString::BString(const wchar_t* value, std::size_t length) : m_value(value, length)
{
}

BString::BString(const wchar_t* value) : m_value(value != nullptr ? ACE_WString(value) : ACE_WString())
{
}

BData::Type BString::type() const
{
    return eSTRING;
}

std::unique_ptr<BData> BString::clone() const
{
    return std::make_unique<BString>(*this);
}

bool BString::assign(const BData& other)
{
    if (other.type() != eSTRING)
        return false;
    m_value = static_cast<const BString&>(other).m_value;
    return true;
}

bool BString::equals(const BData& other) const
{
    return other.type() == eSTRING && static_cast<const BString&>(other).m_value == m_value;
}

int BString::get(ACE_WString& value) const
{
    value = m_value;
    return 0;
}

void BString::set(const ACE_WString& value)
{
    m_value = value;
}

const ACE_WString& BString::value() const
{
    return m_value;
}
