#pragma once

#include "BData.h"

class TESSEL_EXPORT BBool : public BData
{
public:
    BBool();
    explicit BBool(bool value);

    Type type() const override;
    std::unique_ptr<BData> clone() const override;
    bool assign(const BData& other) override;
    bool equals(const BData& other) const override;

    // 0 on success.
    int get(bool& value) const;
    void set(bool value);
    bool value() const;

private:
    bool m_value = false;
};
