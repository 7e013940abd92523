#include "BSet.h"

#include "BBool.h"
#include "BDouble.h"
#include "BInt.h"
#include "BString.h"

#include <algorithm>
#include <cwchar>

namespace
{
bool sameKey(const ACE_WString& stored, const wchar_t* key, std::size_t length)
{
    return stored.length() == length && std::wmemcmp(stored.fast_rep(), key, length) == 0;
}

template <typename Kind>
struct KindOf;
template <>
struct KindOf<BString>
{
    static constexpr BData::Type type = BData::eSTRING;
};
template <>
struct KindOf<BInt>
{
    static constexpr BData::Type type = BData::eINT;
};
template <>
struct KindOf<BBool>
{
    static constexpr BData::Type type = BData::eBOOL;
};
template <>
struct KindOf<BDouble>
{
    static constexpr BData::Type type = BData::eDOUBLE;
};

// Reads the value under `key` as a `Kind` into `value`; untouched on failure.
template <typename Kind, typename Value>
int readTyped(const BSet& set, const ACE_WString& key, Value& value)
{
    const BData* found = set.find(key);
    if (found == nullptr)
        return BSet::eNO_SUCH_KEY;
    if (found->type() != KindOf<Kind>::type)
        return BSet::eWRONG_TYPE;
    value = static_cast<const Kind*>(found)->value();
    return BSet::eOK;
}
}

BSet::BSet(int sizeHint)
{
    m_entries.reserve(static_cast<std::size_t>(std::clamp(sizeHint, 0, 1024)));
}

BSet::Entry::Entry(const ACE_WString& key, std::unique_ptr<BData> value) : key(key), value(std::move(value))
{
}

BSet::Entry::Entry(std::unique_ptr<BData> value) : value(std::move(value))
{
}

BSet::Entry::Entry(Entry&& other) noexcept : value(std::move(other.value))
{
    key.swap(other.key);
}

BSet::Entry& BSet::Entry::operator=(Entry&& other) noexcept
{
    key.swap(other.key);
    value = std::move(other.value);
    return *this;
}

BSet::BSet(const BSet& other) : BData(other), m_index(other.m_index)
{
    m_entries.reserve(other.m_entries.size());
    for (const auto& entry : other.m_entries)
        m_entries.emplace_back(entry.key, entry.value->clone());
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
    : BData(other),
      m_entries(std::move(other.m_entries)),
      m_index(std::move(other.m_index))
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
        if (!(m_entries[i].key == theirs[i].key) || !m_entries[i].value->equals(*theirs[i].value))
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
        keys.add(entry.key);
    return keys;
}

void BSet::drain(const std::function<void(const ACE_WString& key, std::unique_ptr<BData> value)>& take)
{
    std::vector<Entry> entries;
    entries.swap(m_entries);
    m_index.clear();
    for (Entry& entry : entries)
        take(entry.key, std::move(entry.value));
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
    return index < 0 ? nullptr : m_entries[static_cast<std::size_t>(index)].value.get();
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
    std::size_t hash = 0;
    const int index = lookUp(key.fast_rep(), key.length(), hash);
    if (index >= 0)
    {
        m_entries[static_cast<std::size_t>(index)].value = std::move(value);
        return eOK;
    }
    ACE_WString copy(key);
    append(copy, std::move(value), hash);
    return eOK;
}

template <typename Kind, typename Value>
int BSet::writeTyped(const ACE_WString& key, const Value& value)
{
    std::size_t hash = 0;
    const int index = lookUp(key.fast_rep(), key.length(), hash);
    if (index < 0)
    {
        ACE_WString copy(key);
        append(copy, std::make_unique<Kind>(value), hash);
        return eOK;
    }
    std::unique_ptr<BData>& stored = m_entries[static_cast<std::size_t>(index)].value;
    // A value of the same kind is overwritten in place, reusing its storage.
    if (stored->type() == KindOf<Kind>::type)
        static_cast<Kind&>(*stored).set(value);
    else
        stored = std::make_unique<Kind>(value);
    return eOK;
}

int BSet::getString(const ACE_WString& key, ACE_WString& value) const
{
    return readTyped<BString>(*this, key, value);
}

int BSet::setString(const ACE_WString& key, const ACE_WString& value)
{
    return writeTyped<BString>(key, value);
}

int BSet::getInt(const ACE_WString& key, long& value) const
{
    return readTyped<BInt>(*this, key, value);
}

int BSet::setInt(const ACE_WString& key, long value)
{
    return writeTyped<BInt>(key, value);
}

int BSet::getBool(const ACE_WString& key, bool& value) const
{
    return readTyped<BBool>(*this, key, value);
}

int BSet::setBool(const ACE_WString& key, bool value)
{
    return writeTyped<BBool>(key, value);
}

int BSet::getDouble(const ACE_WString& key, double& value) const
{
    return readTyped<BDouble>(*this, key, value);
}

int BSet::setDouble(const ACE_WString& key, double value)
{
    return writeTyped<BDouble>(key, value);
}

int BSet::getSet(const ACE_WString& key, BSet& value) const
{
    return get(key, value);
}

int BSet::setSet(const ACE_WString& key, const BSet& value)
{
    return set(key, value);
}

int BSet::setSet(const ACE_WString& key, BSet&& value)
{
    auto moved = std::make_unique<BSet>(0);
    *moved = std::move(value);
    return put(key, std::move(moved));
}

BSet& BSet::editSet(const ACE_WString& key)
{
    std::size_t hash = 0;
    const int index = lookUp(key.fast_rep(), key.length(), hash);
    if (index >= 0)
    {
        std::unique_ptr<BData>& value = m_entries[static_cast<std::size_t>(index)].value;
        if (value->type() != eSET)
            value = std::make_unique<BSet>();
        return static_cast<BSet&>(*value);
    }
    auto created = std::make_unique<BSet>();
    BSet& result = *created;
    ACE_WString copy(key);
    append(copy, std::move(created), hash);
    return result;
}

const ACE_WString& BSet::keyAt(int index) const
{
    static const ACE_WString empty;
    if (index < 0 || static_cast<std::size_t>(index) >= m_entries.size())
        return empty;
    return m_entries[static_cast<std::size_t>(index)].key;
}

const BData& BSet::valueAt(int index) const
{
    static const BString empty;
    if (index < 0 || static_cast<std::size_t>(index) >= m_entries.size())
        return empty;
    return *m_entries[static_cast<std::size_t>(index)].value;
}

std::size_t BSet::hashKey(const wchar_t* key, std::size_t length)
{
    // FNV-1a over the characters.
    std::size_t hash = 14695981039346656037ULL;
    for (std::size_t i = 0; i < length; ++i)
    {
        hash ^= static_cast<std::size_t>(key[i]);
        hash *= 1099511628211ULL;
    }
    return hash;
}

int BSet::indexOf(const ACE_WString& key) const
{
    std::size_t hash = 0;
    return lookUp(key.fast_rep(), key.length(), hash);
}

int BSet::lookUp(const wchar_t* key, std::size_t length, std::size_t& hash) const
{
    if (m_index.empty())
    {
        for (std::size_t i = 0; i < m_entries.size(); ++i)
            if (sameKey(m_entries[i].key, key, length))
                return static_cast<int>(i);
        return -1;
    }
    hash = hashKey(key, length);
    const std::size_t mask = m_index.size() - 1;
    for (std::size_t slot = hash & mask;; slot = (slot + 1) & mask)
    {
        const int position = m_index[slot];
        if (position < 0)
            return -1;
        if (sameKey(m_entries[static_cast<std::size_t>(position)].key, key, length))
            return position;
    }
}

void BSet::append(ACE_WString& key, std::unique_ptr<BData> value, std::size_t hash)
{
    m_entries.emplace_back(std::move(value));
    m_entries.back().key.swap(key);
    if (m_index.empty())
    {
        if (m_entries.size() >= kIndexFrom)
            rebuildIndex();
    }
    else if (m_entries.size() * 2 > m_index.size())
        rebuildIndex();
    else
        insertIntoIndex(static_cast<int>(m_entries.size() - 1), hash);
}

void BSet::insertIntoIndex(int position, std::size_t hash)
{
    const std::size_t mask = m_index.size() - 1;
    std::size_t slot = hash & mask;
    while (m_index[slot] >= 0)
        slot = (slot + 1) & mask;
    m_index[slot] = position;
}

void BSet::rebuildIndex()
{
    m_index.clear();
    if (m_entries.size() < kIndexFrom)
        return;
    std::size_t slots = 2 * kIndexFrom;
    while (slots < 4 * m_entries.size())
        slots *= 2;
    m_index.assign(slots, -1);
    for (std::size_t i = 0; i < m_entries.size(); ++i)
        insertIntoIndex(static_cast<int>(i), hashKey(m_entries[i].key.fast_rep(), m_entries[i].key.length()));
}
