#pragma once

#include "Dialog_EditDiagUserInfo.h"
#include "Dialog_OnLineUpdateConfigurationTestResult.h"
#include "ModalDriver.h"
#include "TestText.h"
#include "Users.h"

#include <gtest/gtest.h>

#include <QApplication>
#include <QEvent>
#include <QLineEdit>
#include <QMessageBox>
#include <QPushButton>
#include <QTimer>

#include <functional>
#include <vector>

// Records every configuration-test result dialog as it is shown and accepts it with its OK
// button from its own event loop.
class ResultDialogAccepter : public QObject
{
public:
    struct Result
    {
        QString preparerText;
        QString taskText;
        QString style;
        bool ranModally = false;
    };

    ResultDialogAccepter() { qApp->installEventFilter(this); }
    ~ResultDialogAccepter() override { qApp->removeEventFilter(this); }

    std::vector<Result> results;

protected:
    bool eventFilter(QObject* watched, QEvent* event) override
    {
        if (event->type() != QEvent::Show)
            return false;
        if (auto* result = dynamic_cast<Dialog_OnLineUpdateConfigurationTestResult*>(watched))
        {
            const size_t index = results.size();
            results.push_back(
                {result->preparerText(), result->taskText(), result->property("decoratorStyle").toString(), false});
            QTimer::singleShot(0, result, [this, result, index]() {
                results[index].ranModally = QApplication::activeModalWidget() == result;
                result->okButton()->click();
            });
        }
        return false;
    }
};

// Types a user into the edit dialog when it is shown and presses its OK button (or Cancel).
inline void fillEditDialogWhenShown(const User& user, int* filled, bool ok = true)
{
    ModalDriver::whenShown([user, filled, ok](QWidget& modal) {
        auto* dialog = dynamic_cast<Dialog_EditDiagUserInfo*>(&modal);
        if (dialog == nullptr)
        {
            ADD_FAILURE() << "expected the edit dialog, got " << modal.metaObject()->className();
            modal.close();
            return;
        }
        dialog->m_nameEdit->setText(qs(user.name));
        dialog->m_addressEdit->setText(qs(user.address));
        dialog->m_phoneEdit->setText(qs(user.phone));
        (ok ? dialog->m_okButton : dialog->m_cancelButton)->click();
        if (filled != nullptr)
            ++*filled;
    });
}

// What a message box showed, and the button that answered it.
struct SeenMessageBox
{
    bool shown = false;
    QString title;
    QString text;
    QStringList buttons;
};

// Answers the next message box with the button labelled `buttonText` and records what it showed.
inline void answerMessageBoxWhenShown(const QString& buttonText, SeenMessageBox* seen)
{
    ModalDriver::whenShown([buttonText, seen](QWidget& modal) {
        auto* box = qobject_cast<QMessageBox*>(&modal);
        if (box == nullptr)
        {
            ADD_FAILURE() << "expected a message box, got " << modal.metaObject()->className();
            modal.close();
            return;
        }
        seen->shown = true;
        seen->title = box->windowTitle();
        seen->text = box->text();
        for (QAbstractButton* button : box->buttons())
            seen->buttons.append(button->text());
        ModalDriver::clickButtonIn(*box, buttonText);
    });
}
