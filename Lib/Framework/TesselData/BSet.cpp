#include "BSet.h"

#include "BBool.h"
#include "BDouble.h"
#include "BInt.h"
#include "BString.h"

#include <algorithm>

namespace
{
std::wstring indexKey(const ACE_WString& key)
{
    return std::wstring(key.fast_rep(), key.length());
}

// Reads the value under `key` as a `Kind` into `value`; untouched on failure.
template <typename Kind, typename Value>
int readTyped(const BSet& set, const ACE_WString& key, Value& value)
{
    const BData* found = set.find(key);
    if (found == nullptr)
        return BSet::eNO_SUCH_KEY;
    if (found->type() != Kind().type())
        return BSet::eWRONG_TYPE;
    value = static_cast<const Kind*>(found)->value();
    return BSet::eOK;
}
}

BSet::BSet(int sizeHint)
{
    m_entries.reserve(static_cast<std::size_t>(std::clamp(sizeHint, 0, 1024)));
}

BSet::BSet(const BSet& other) : BData(other)
{
    m_entries.reserve(other.m_entries.size());
    for (const auto& entry : other.m_entries)
        m_entries.emplace_back(entry.first, entry.second->clone());
    m_index = other.m_index;
}

BSet& BSet::operator=(const BSet& other)
{
    if (this != &other)
    {
        BSet copy(other);
        *this = std::move(copy);
    }
    return *this;
}

BSet::BSet(BSet&& other) noexcept
    : BData(other), m_entries(std::move(other.m_entries)), m_index(std::move(other.m_index))
{
    other.m_entries.clear();
    other.m_index.clear();
}

BSet& BSet::operator=(BSet&& other) noexcept
{
    if (this != &other)
    {
        m_entries = std::move(other.m_entries);
        m_index = std::move(other.m_index);
        other.m_entries.clear();
        other.m_index.clear();
    }
    return *this;
}

BSet::~BSet() = default;

BData::Type BSet::type() const
{
    return eSET;
}

std::unique_ptr<BData> BSet::clone() const
{
    return std::make_unique<BSet>(*this);
}

bool BSet::assign(const BData& other)
{
    if (other.type() != eSET)
        return false;
    *this = static_cast<const BSet&>(other);
    return true;
}

bool BSet::equals(const BData& other) const
{
    if (other.type() != eSET)
        return false;
    const auto& theirs = static_cast<const BSet&>(other).m_entries;
    if (theirs.size() != m_entries.size())
        return false;
    for (std::size_t i = 0; i < m_entries.size(); ++i)
    {
        if (!(m_entries[i].first == theirs[i].first) || !m_entries[i].second->equals(*theirs[i].second))
            return false;
    }
    return true;
}

int BSet::size() const
{
    return static_cast<int>(m_entries.size());
}

bool BSet::isEmpty() const
{
    return m_entries.empty();
}

bool BSet::contains(const ACE_WString& key) const
{
    return indexOf(key) >= 0;
}

StringSet BSet::getAllKeys() const
{
    StringSet keys;
    for (const auto& entry : m_entries)
        keys.add(entry.first);
    return keys;
}

void BSet::clear()
{
    m_entries.clear();
    m_index.clear();
}

int BSet::remove(const ACE_WString& key)
{
    const int index = indexOf(key);
    if (index < 0)
        return eNO_SUCH_KEY;
    m_entries.erase(m_entries.begin() + index);
    rebuildIndex();
    return eOK;
}

int BSet::get(const ACE_WString& key, BData& value) const
{
    const BData* found = find(key);
    if (found == nullptr)
        return eNO_SUCH_KEY;
    if (found == &value)
        return eOK;
    return value.assign(*found) ? eOK : eWRONG_TYPE;
}

const BData* BSet::find(const ACE_WString& key) const
{
    const int index = indexOf(key);
    return index < 0 ? nullptr : m_entries[static_cast<std::size_t>(index)].second.get();
}

int BSet::set(const ACE_WString& key, const BData& value)
{
    // The copy is made first, so storing a set inside itself copies its old content.
    return put(key, value.clone());
}

int BSet::put(const ACE_WString& key, std::unique_ptr<BData> value)
{
    if (!value)
        return eWRONG_TYPE;
    const int index = indexOf(key);
    if (index >= 0)
    {
        m_entries[static_cast<std::size_t>(index)].second = std::move(value);
        return eOK;
    }
    m_entries.emplace_back(key, std::move(value));
    m_index.emplace(indexKey(key), static_cast<int>(m_entries.size() - 1));
    return eOK;
}

int BSet::getString(const ACE_WString& key, ACE_WString& value) const
{
    return readTyped<BString>(*this, key, value);
}

int BSet::setString(const ACE_WString& key, const ACE_WString& value)
{
    return put(key, std::make_unique<BString>(value));
}

int BSet::getInt(const ACE_WString& key, long& value) const
{
    return readTyped<BInt>(*this, key, value);
}

int BSet::setInt(const ACE_WString& key, long value)
{
    return put(key, std::make_unique<BInt>(value));
}

int BSet::getBool(const ACE_WString& key, bool& value) const
{
    return readTyped<BBool>(*this, key, value);
}

int BSet::setBool(const ACE_WString& key, bool value)
{
    return put(key, std::make_unique<BBool>(value));
}

int BSet::getDouble(const ACE_WString& key, double& value) const
{
    return readTyped<BDouble>(*this, key, value);
}

int BSet::setDouble(const ACE_WString& key, double value)
{
    return put(key, std::make_unique<BDouble>(value));
}

int BSet::getSet(const ACE_WString& key, BSet& value) const
{
    return get(key, value);
}

int BSet::setSet(const ACE_WString& key, const BSet& value)
{
    return set(key, value);
}

const ACE_WString& BSet::keyAt(int index) const
{
    static const ACE_WString empty;
    if (index < 0 || static_cast<std::size_t>(index) >= m_entries.size())
        return empty;
    return m_entries[static_cast<std::size_t>(index)].first;
}

const BData& BSet::valueAt(int index) const
{
    static const BString empty;
    if (index < 0 || static_cast<std::size_t>(index) >= m_entries.size())
        return empty;
    return *m_entries[static_cast<std::size_t>(index)].second;
}

int BSet::indexOf(const ACE_WString& key) const
{
    const auto it = m_index.find(indexKey(key));
    return it == m_index.end() ? -1 : it->second;
}

void BSet::rebuildIndex()
{
    m_index.clear();
    for (std::size_t i = 0; i < m_entries.size(); ++i)
        m_index.emplace(indexKey(m_entries[i].first), static_cast<int>(i));
}
