#include "Dialog_ConfigurationTestBase.h"

#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>
#include <QVBoxLayout>

Dialog_ConfigurationTestBase::Dialog_ConfigurationTestBase(QWidget* parent, const char* name, Qt::WindowFlags f)
    : QDialog(parent, f),
      m_messageLabel(new QLabel(this)),
      m_cancelButton(new QPushButton(this))
{
    if (name != nullptr)
        setObjectName(QString::fromUtf8(name));
    m_messageLabel->setObjectName(QStringLiteral("messageLabel"));
    m_messageLabel->setWordWrap(true);
    m_cancelButton->setObjectName(QStringLiteral("cancelButton"));
    auto* buttons = new QHBoxLayout();
    buttons->addStretch();
    buttons->addWidget(m_cancelButton);
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(m_messageLabel);
    layout->addLayout(buttons);
}

Dialog_ConfigurationTestBase::~Dialog_ConfigurationTestBase() = default;

bool Dialog_ConfigurationTestBase::init()
{
    setWindowTitle(QStringLiteral("Configuration test"));
    m_messageLabel->setText(QStringLiteral("Testing the online-update configuration, please wait..."));
    m_cancelButton->setText(QStringLiteral("Cancel"));
    return true;
}

QPushButton* Dialog_ConfigurationTestBase::cancelButton() const
{
    return m_cancelButton;
}

QLabel* Dialog_ConfigurationTestBase::messageLabel() const
{
    return m_messageLabel;
}
