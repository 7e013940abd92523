#include "Dialog_ConfigurationTest.h"

#include "DialogTexts.h"

#include <QLabel>
#include <QPushButton>

Dialog_ConfigurationTest::Dialog_ConfigurationTest(QWidget* parent, const char* name, Qt::WindowFlags f)
    : Dialog_ConfigurationTestBase(parent, name, f)
{
}

Dialog_ConfigurationTest::~Dialog_ConfigurationTest() = default;

bool Dialog_ConfigurationTest::init()
{
    setWindowTitle(
        DialogTexts::text(QStringLiteral("ConfigurationTest/WaitTitle"), QStringLiteral("Configuration test")));
    m_messageLabel->setText(
        DialogTexts::text(QStringLiteral("ConfigurationTest/WaitMessage"),
                          QStringLiteral("Testing the online-update configuration, please wait...")));
    m_cancelButton->setText(DialogTexts::text(QStringLiteral("ConfigurationTest/Cancel"), QStringLiteral("Cancel")));
    return true;
}
