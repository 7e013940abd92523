#pragma once

#include "CComponent_Thread_NoRef.h"

#include <QPointer>
#include <QWidget>

class IComponentManager;

// The tool-configuration dialog's mediator
// ("gui:GuiToolConfiguration?MedToolConfiguration#ToolConfiguaration.ui"): the host attaches the
// dialog it shows; closeDialog closes it. GUI thread only.
class TESSEL_EXPORT CMediator : public CComponent_Thread_NoRef
{
public:
    static const wchar_t* const componentID;

    CMediator();
    ~CMediator() override;

    static CMediator* registerWith(IComponentManager& manager);

    // The dialog closeDialog closes; not owned (forgotten when it is destroyed).
    void setDialog(QWidget* dialog);
    QWidget* dialog() const;

    // Closes (hides) the attached dialog: 0 when there was one, 1 when there was none (never
    // attached, or destroyed since).
    int closeDialog();
    // Calls of closeDialog so far.
    int closeCount() const;

private:
    QPointer<QWidget> m_dialog;
    int m_closeCount;
};
