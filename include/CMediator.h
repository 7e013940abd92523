#pragma once

#include "CComponent_Thread_NoRef.h"

#include <QPointer>
#include <QWidget>

#include <memory>

class IComponentManager;
class QObject;
class ToolConfigurationDialog;

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

    // Builds the tool-configuration window over its controllers, keeps it (replacing any earlier
    // one) and attaches it as the dialog; shown with show(). Null pointers leave the widgets
    // without a controller.
    ToolConfigurationDialog* createToolConfigurationDialog(QObject* toolConfiguration, QObject* users);
    ToolConfigurationDialog* toolConfigurationDialog() const;

private:
    QPointer<QWidget> m_dialog;
    int m_closeCount;
    std::unique_ptr<ToolConfigurationDialog> m_toolConfigurationDialog;
};
