#include "CMediator.h"

#include "IComponentManager.h"
#include "PMediator.h"
#include "TesselLog_Static.h"
#include "ToolConfigurationDialog.h"

namespace
{
const char* const kComponent = "GuiToolConfiguration";
const char* const kFile = "GuiToolConfiguration.dll";
const char* const kClass = "CMediator";
}

const wchar_t* const CMediator::componentID = L"gui:GuiToolConfiguration?MedToolConfiguration#ToolConfiguaration.ui";

CMediator::CMediator() : CComponent_Thread_NoRef(ID(componentID)), m_closeCount(0)
{
}

CMediator::~CMediator() = default;

CMediator* CMediator::registerWith(IComponentManager& manager)
{
    auto component = std::make_unique<CMediator>();
    CMediator* mediator = component.get();
    const int result = manager.registerComponent(std::move(component),
                                                 [](IComponent* registered) { return new PMediator(registered); });
    return result == 0 ? mediator : nullptr;
}

void CMediator::setDialog(QWidget* dialog)
{
    m_dialog = dialog;
}

QWidget* CMediator::dialog() const
{
    return m_dialog.data();
}

int CMediator::closeDialog()
{
    ++m_closeCount;
    if (m_dialog.isNull())
    {
        TesselLog_Static::logWarning_static(kComponent, kFile, kClass,
                                            L"[CMediator::closeDialog] : no dialog to close");
        return 1;
    }
    m_dialog->close();
    m_dialog->hide();
    return 0;
}

int CMediator::closeCount() const
{
    return m_closeCount;
}

ToolConfigurationDialog* CMediator::createToolConfigurationDialog(QObject* toolConfiguration, QObject* users)
{
    m_toolConfigurationDialog.reset();
    m_toolConfigurationDialog = std::make_unique<ToolConfigurationDialog>(toolConfiguration, users);
    setDialog(m_toolConfigurationDialog.get());
    return m_toolConfigurationDialog.get();
}

ToolConfigurationDialog* CMediator::toolConfigurationDialog() const
{
    return m_toolConfigurationDialog.get();
}
