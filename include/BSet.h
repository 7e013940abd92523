#pragma once

#include "BData.h"
#include "StringSet.h"

#include <cstddef>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

// A keyed set of typed values and nested sets with value semantics. Keys keep the order in
// which they were first inserted; writing an existing key replaces its value in place.
//
// Typed reads return 0 on success, eNO_SUCH_KEY for a missing key and eWRONG_TYPE for a
// value of another type; on failure the output is left untouched.
class TESSEL_EXPORT BSet : public BData
{
public:
    enum Error
    {
        eOK = 0,
        eNO_SUCH_KEY = 1,
        eWRONG_TYPE = 2
    };

    explicit BSet(int sizeHint = 10);
    BSet(const BSet& other);
    BSet& operator=(const BSet& other);
    BSet(BSet&& other) noexcept;
    BSet& operator=(BSet&& other) noexcept;
    ~BSet() override;

    Type type() const override;
    std::unique_ptr<BData> clone() const override;
    bool assign(const BData& other) override;
    bool equals(const BData& other) const override;

    int size() const;
    bool isEmpty() const;
    bool contains(const ACE_WString& key) const;
    StringSet getAllKeys() const;
    void clear();
    // 0 on success, eNO_SUCH_KEY when absent.
    int remove(const ACE_WString& key);

    // Copies the value under `key` into `value`, which must be of the same kind.
    int get(const ACE_WString& key, BData& value) const;
    // The value under `key`, or null.
    const BData* find(const ACE_WString& key) const;
    // Stores a copy of `value` under `key`. 0 on success.
    int set(const ACE_WString& key, const BData& value);
    // Stores `value` under `key`, taking ownership (no copy). 0 on success; eWRONG_TYPE for null.
    int put(const ACE_WString& key, std::unique_ptr<BData> value);

    int getString(const ACE_WString& key, ACE_WString& value) const;
    int setString(const ACE_WString& key, const ACE_WString& value);
    int getInt(const ACE_WString& key, long& value) const;
    int setInt(const ACE_WString& key, long value);
    int getBool(const ACE_WString& key, bool& value) const;
    int setBool(const ACE_WString& key, bool value);
    int getDouble(const ACE_WString& key, double& value) const;
    int setDouble(const ACE_WString& key, double value);
    int getSet(const ACE_WString& key, BSet& value) const;
    int setSet(const ACE_WString& key, const BSet& value);
    // Moves `value` in under `key` without copying it; `value` is left empty. 0 on success.
    int setSet(const ACE_WString& key, BSet&& value);
    // The nested set under `key`, to be changed in place. A missing key or a value of another
    // kind is first replaced, at its place, by an empty set.
    BSet& editSet(const ACE_WString& key);

    // Ordered access, for walking a set without copying it. Out of range gives an empty key
    // and an empty string value.
    const ACE_WString& keyAt(int index) const;
    const BData& valueAt(int index) const;
    // Hands every entry, in order, to `take` with its value, and leaves the set empty.
    void drain(const std::function<void(const ACE_WString& key, std::unique_ptr<BData> value)>& take);

private:
    friend class XmlSetCodec;

    // Sets from this size on keep a hash index; smaller ones are searched in order.
    static constexpr std::size_t kIndexFrom = 16;

    struct Entry
    {
        Entry(const ACE_WString& key, std::unique_ptr<BData> value);
        // An entry with an empty key.
        explicit Entry(std::unique_ptr<BData> value);
        Entry(Entry&& other) noexcept;
        Entry& operator=(Entry&& other) noexcept;

        ACE_WString key;
        std::unique_ptr<BData> value;
    };

    static std::size_t hashKey(const wchar_t* key, std::size_t length);
    int indexOf(const ACE_WString& key) const;
    // Position of the key, or -1. `hash` is set when the set is indexed, for a following append.
    int lookUp(const wchar_t* key, std::size_t length, std::size_t& hash) const;
    // Appends a key known to be absent, taking its text (`key` is left empty); `hash` from lookUp.
    void append(ACE_WString& key, std::unique_ptr<BData> value, std::size_t hash);
    void insertIntoIndex(int position, std::size_t hash);
    // Stores `value` as a `Kind` under `key`.
    template <typename Kind, typename Value>
    int writeTyped(const ACE_WString& key, const Value& value);
    void rebuildIndex();

    std::vector<Entry> m_entries;
    // Open-addressed table of positions in m_entries (-1 free), empty below kIndexFrom entries.
    std::vector<int> m_index;
};
