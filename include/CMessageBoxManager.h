#pragma once

#include "CComponent_Thread_NoRef.h"

#include <QString>

#include <functional>

class IComponentManager;
class QMessageBox;

// The message-box manager component ("tessel:Navigation?MessageBoxManager").
//
// showMessageBox shows a modal QMessageBox on the GUI thread: kind 1 question icon, 2
// information, 3 warning, 4 critical, anything else no icon; up to three buttons (a null
// QString leaves one out; with none at all a single "OK" button is shown and counts as button 1).
// It answers 1, 2 or 3 for the button pressed, 0 when the box was closed otherwise or cannot be
// shown (off the GUI thread).
//
// Tests drive the real box: while exec() runs, QApplication::activeModalWidget() is the box (a
// QMessageBox whose buttons carry the given texts); a QTimer started before the call can find it
// and click a button (see tests/common/ModalDriver.h). setShownHook gives the box to a callback
// just before it runs, for tests that want to look at it first.
class TESSEL_EXPORT CMessageBoxManager : public CComponent_Thread_NoRef
{
public:
    using ShownHook = std::function<void(QMessageBox& box)>;

    static const wchar_t* const componentID;

    CMessageBoxManager();
    ~CMessageBoxManager() override;

    static CMessageBoxManager* registerWith(IComponentManager& manager);

    int showMessageBox(const QString& title, const QString& text, int kind, const QString& button1,
                       const QString& button2, const QString& button3);

    // Called with each box before it is shown; an empty hook removes it.
    void setShownHook(ShownHook hook);
    // Boxes shown so far.
    int shownCount() const;

private:
    ShownHook m_shownHook;
    int m_shownCount;
};
