#include "Dialog_OnLineUpdateConfigurationTestResult.h"

#include "DialogTexts.h"

#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>
#include <QVBoxLayout>

namespace
{
const char* const kPreparerTexts[] = {
    "The update agent accepts the configuration.",        // 0
    "The update agent could not start its log.",          // -1
    "The online-update configuration file is missing.",   // -2
    "The online-update configuration file is not valid.", // -3
    "App2App is not configured.",                         // -4
    "The distribution folder is not configured.",         // -5
    "The file copy tool is missing.",                     // -6
    "The configuration is unknown.",                      // -7
    "The local update client is not installed.",          // -8
    "The update server was not found.",                   // -9
    "The update client is not installed on the server.",  // -10
    "The distribution folder cannot be accessed.",        // -11
    "Unknown error with the distribution folder.",        // -12
    "The update agent is missing.",                       // -13
    "The update agent did not answer.",                   // -14
};

const char* const kTaskTexts[] = {
    "The scheduled task is registered as it should be.", // 1
    "The scheduled task is not registered.",             // 2
    "The scheduled task has wrong settings.",            // 3
    "The task scheduler service cannot be reached.",     // 4
    "Unknown error while checking the scheduled task.",  // 5
};

bool isPreparerResult(int result)
{
    return result <= 0 && result >= -14;
}

bool isTaskResult(int result)
{
    return result >= 1 && result <= 5;
}
}

Dialog_OnLineUpdateConfigurationTestResult::Dialog_OnLineUpdateConfigurationTestResult(QWidget* parent,
                                                                                       const char* name,
                                                                                       Qt::WindowFlags f)
    : QDialog(parent, f),
      m_titleLabel(new QLabel(this)),
      m_preparerLabel(new QLabel(this)),
      m_taskLabel(new QLabel(this)),
      m_okButton(new QPushButton(QStringLiteral("OK"), this))
{
    if (name != nullptr)
        setObjectName(QString::fromUtf8(name));
    m_preparerLabel->setObjectName(QStringLiteral("preparerLabel"));
    m_preparerLabel->setWordWrap(true);
    m_taskLabel->setObjectName(QStringLiteral("taskLabel"));
    m_taskLabel->setWordWrap(true);
    m_okButton->setObjectName(QStringLiteral("okButton"));
    m_okButton->setDefault(true);
    QObject::connect(m_okButton, &QPushButton::clicked, this, &QDialog::accept);
    auto* buttons = new QHBoxLayout();
    buttons->addStretch();
    buttons->addWidget(m_okButton);
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(m_titleLabel);
    layout->addWidget(m_preparerLabel);
    layout->addWidget(m_taskLabel);
    layout->addLayout(buttons);
}

Dialog_OnLineUpdateConfigurationTestResult::~Dialog_OnLineUpdateConfigurationTestResult() = default;

QString Dialog_OnLineUpdateConfigurationTestResult::defaultPreparerText(int preparerResult)
{
    if (isPreparerResult(preparerResult))
        return QString::fromUtf8(kPreparerTexts[-preparerResult]);
    return QStringLiteral("The update agent gave the unexpected answer %1.").arg(preparerResult);
}

QString Dialog_OnLineUpdateConfigurationTestResult::defaultTaskText(int taskResult)
{
    if (isTaskResult(taskResult))
        return QString::fromUtf8(kTaskTexts[taskResult - 1]);
    return QStringLiteral("The scheduled task check gave the unexpected answer %1.").arg(taskResult);
}

bool Dialog_OnLineUpdateConfigurationTestResult::init(int preparerResult, int taskResult)
{
    setWindowTitle(DialogTexts::text(QStringLiteral("ConfigurationTest/ResultTitle"),
                                     QStringLiteral("Configuration test result")));
    m_titleLabel->setText(DialogTexts::text(QStringLiteral("ConfigurationTest/ResultHeading"),
                                            QStringLiteral("Result of the online-update configuration test:")));
    m_preparerLabel->setText(DialogTexts::text(QStringLiteral("ConfigurationTest/Preparer/%1").arg(preparerResult),
                                               defaultPreparerText(preparerResult)));
    m_taskLabel->setText(
        DialogTexts::text(QStringLiteral("ConfigurationTest/Task/%1").arg(taskResult), defaultTaskText(taskResult)));
    m_okButton->setText(DialogTexts::text(QStringLiteral("ConfigurationTest/OK"), QStringLiteral("OK")));
    return isPreparerResult(preparerResult) && isTaskResult(taskResult);
}

QString Dialog_OnLineUpdateConfigurationTestResult::preparerText() const
{
    return m_preparerLabel->text();
}

QString Dialog_OnLineUpdateConfigurationTestResult::taskText() const
{
    return m_taskLabel->text();
}

QPushButton* Dialog_OnLineUpdateConfigurationTestResult::okButton() const
{
    return m_okButton;
}
