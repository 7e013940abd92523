#pragma once

#include "BData.h"

class TESSEL_EXPORT BDouble : public BData
{
public:
    BDouble();
    explicit BDouble(double value);

    Type type() const override;
    std::unique_ptr<BData> clone() const override;
    bool assign(const BData& other) override;
    bool equals(const BData& other) const override;

    // 0 on success.
    int get(double& value) const;
    void set(double value);
    double value() const;

private:
    double m_value = 0.0;
};
