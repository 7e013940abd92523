#pragma once

#include "Export.h"

#include <QDialog>
#include <QString>

class QLabel;
class QPushButton;

// Shows the two answers of the configuration test in words: the update agent's (0 to -14,
// IProcStartUpdateAgent::_enum_CheckConfigurationPreparer) and the scheduled task check's (1 to 5,
// OnlineUpdateCommand_NS::_enum_CheckConfigurationScheduledTaskResult). Texts come from the text
// component under the identifiers "ConfigurationTest/Preparer/<answer>" and
// "ConfigurationTest/Task/<answer>", in English when it has none.
class TESSEL_EXPORT Dialog_OnLineUpdateConfigurationTestResult : public QDialog
{
public:
    explicit Dialog_OnLineUpdateConfigurationTestResult(QWidget* parent = nullptr, const char* name = nullptr,
                                                        Qt::WindowFlags f = {});
    ~Dialog_OnLineUpdateConfigurationTestResult() override;

    // Fills the dialog; true when both answers are known values.
    bool init(int preparerResult, int taskResult);

    QString preparerText() const;
    QString taskText() const;
    QPushButton* okButton() const;

    // The English words of each answer.
    static QString defaultPreparerText(int preparerResult);
    static QString defaultTaskText(int taskResult);

private:
    QLabel* m_titleLabel;
    QLabel* m_preparerLabel;
    QLabel* m_taskLabel;
    QPushButton* m_okButton;
};
