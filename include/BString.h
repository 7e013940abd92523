#pragma once

#include "BData.h"

#include <cstddef>

class TESSEL_EXPORT BString : public BData
{
public:
    BString();
    explicit BString(const ACE_WString& value);
    explicit BString(const wchar_t* value);
    // The first `length` characters at `value`.
    BString(const wchar_t* value, std::size_t length);

    Type type() const override;
    std::unique_ptr<BData> clone() const override;
    bool assign(const BData& other) override;
    bool equals(const BData& other) const override;

    // 0 on success.
    int get(ACE_WString& value) const;
    void set(const ACE_WString& value);
    const ACE_WString& value() const;

private:
    ACE_WString m_value;
};
