#pragma once

#include "BData.h"
#include "StringSet.h"

#include <memory>
#include <string>
#include <unordered_map>
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

    // Ordered access, for walking a set without copying it. Out of range gives an empty key
    // and an empty string value.
    const ACE_WString& keyAt(int index) const;
    const BData& valueAt(int index) const;

private:
    int indexOf(const ACE_WString& key) const;

    void rebuildIndex();

    std::vector<std::pair<ACE_WString, std::unique_ptr<BData>>> m_entries;
    // Key -> position in m_entries, so lookups stay fast in large sets.
    std::unordered_map<std::wstring, int> m_index;
};
