#pragma once

#include <QAbstractButton>
#include <QApplication>
#include <QTimer>
#include <QWidget>

#include <functional>
#include <memory>

// Acts on the modal dialog that the code under test opens and runs with exec(). Start it before
// the call: it looks for QApplication::activeModalWidget() from the event loop that exec() runs,
// acts once on the first one it finds, then stops. It gives up after `timeoutMs`.
//
//   ModalDriver::clickButton("No");
//   const int answer = boxes->showMessageBox("Title", "Text", 1, "Yes", "No", QString());
class ModalDriver
{
public:
    using Action = std::function<void(QWidget& modal)>;

    static void whenShown(Action action, int timeoutMs = 10000)
    {
        auto* timer = new QTimer(qApp);
        auto remaining = std::make_shared<int>(timeoutMs / 10);
        QObject::connect(timer, &QTimer::timeout, timer, [timer, remaining, action]() {
            QWidget* modal = QApplication::activeModalWidget();
            if (modal == nullptr && --*remaining > 0)
                return;
            timer->stop();
            timer->deleteLater();
            if (modal != nullptr)
                action(*modal);
        });
        timer->start(10);
    }

    // Clicks the first button of the modal widget whose text is `text`.
    static void clickButton(const QString& text, int timeoutMs = 10000)
    {
        whenShown([text](QWidget& modal) { clickButtonIn(modal, text); }, timeoutMs);
    }

    static bool clickButtonIn(QWidget& modal, const QString& text)
    {
        for (QAbstractButton* button : modal.findChildren<QAbstractButton*>())
        {
            if (button->text() == text)
            {
                button->click();
                return true;
            }
        }
        return false;
    }
};
