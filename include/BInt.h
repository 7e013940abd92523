#pragma once

#include "BData.h"

class TESSEL_EXPORT BInt : public BData
{
public:
    BInt();
    explicit BInt(long value);

    Type type() const override;
    std::unique_ptr<BData> clone() const override;
    bool assign(const BData& other) override;
    bool equals(const BData& other) const override;

    // 0 on success.
    int get(long& value) const;
    void set(long value);
    long value() const;

private:
    long m_value = 0;
};
