#pragma once

#include "Dialog_ConfigurationTestBase.h"

// The wait dialog with its texts from the text component (English when it has none).
class TESSEL_EXPORT Dialog_ConfigurationTest : public Dialog_ConfigurationTestBase
{
public:
    explicit Dialog_ConfigurationTest(QWidget* parent = nullptr, const char* name = nullptr, Qt::WindowFlags f = {});
    ~Dialog_ConfigurationTest() override;

    bool init() override;
};
