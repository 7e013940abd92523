#pragma once

#include "Export.h"

#include <QDialog>
#include <QStringList>

class QLabel;
class QLineEdit;
class QPushButton;

// Edits one user of the diagnostic sheet: name, address and telephone. OK refuses an empty name
// or one of the forbidden names (exact comparison): the dialog stays open and shows a note.
class TESSEL_EXPORT Dialog_EditDiagUserInfo : public QDialog
{
public:
    explicit Dialog_EditDiagUserInfo(const QStringList& forbiddenNames, QWidget* parent = nullptr,
                                     const char* name = nullptr, Qt::WindowFlags f = {});
    ~Dialog_EditDiagUserInfo() override;

    // Sets the title and the field labels; true.
    bool init(const QString& title);

    // Accepts unless the name is refused.
    void accept() override;

    // The note shown after a refused OK; empty before.
    QString note() const;
    const QStringList& forbiddenNames() const;

    QLineEdit* m_nameEdit;
    QLineEdit* m_addressEdit;
    QLineEdit* m_phoneEdit;
    QPushButton* m_okButton;
    QPushButton* m_cancelButton;

private:
    QStringList m_forbiddenNames;
    QLabel* m_nameLabel;
    QLabel* m_addressLabel;
    QLabel* m_phoneLabel;
    QLabel* m_noteLabel;
};
