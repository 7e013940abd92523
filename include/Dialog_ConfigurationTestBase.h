#pragma once

#include "Export.h"

#include <QDialog>

class QLabel;
class QPushButton;

// The configuration test's wait dialog: a message and a cancel button. The controller connects
// the cancel button's clicked() signal and closes the dialog itself.
class TESSEL_EXPORT Dialog_ConfigurationTestBase : public QDialog
{
public:
    explicit Dialog_ConfigurationTestBase(QWidget* parent = nullptr, const char* name = nullptr,
                                          Qt::WindowFlags f = {});
    ~Dialog_ConfigurationTestBase() override;

    // Sets the texts; true when they could be set.
    virtual bool init();

    QPushButton* cancelButton() const;
    QLabel* messageLabel() const;

    QLabel* m_messageLabel;
    QPushButton* m_cancelButton;
};
