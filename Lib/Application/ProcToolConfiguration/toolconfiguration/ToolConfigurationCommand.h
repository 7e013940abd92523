#pragma once

#include "BSet.h"
#include "CustomEvent.h"
#include "Export.h"
#include "HandlerCustomEvent.h"
#include "ID.h"
#include "OwnSaves.h"
#include "PBText.h"
#include "PDataManager.h"
#include "PMessageBoxManager.h"
#include "PProcStartUpdateAgent.h"
#include "PQ17FileSystemWatcher.h"
#include "SmartProxy.h"
#include "WidgetCommandBase.h"

#include <ace/SString.h>
#include <ace/Thread_Mutex.h>

#include <QObject>
#include <QString>
#include <QTime>

class WorkshopInfoUpdater;
class UsersUpdater;
class UpdateUpdater;
class QEvent;

// Controller of the tool-configuration dialog: owns the three settings stores, publishes every
// control's record in the data manager, follows changes of the settings files and takes the
// dialog's edits through its slots.
class TESSEL_EXPORT ToolConfigurationCommand : public WidgetCommandBase, public Handler<CustomEvent>
{
    Q_OBJECT

public:
    // Identity under which the command registers for custom events.
    static const ID m_ID;

    explicit ToolConfigurationCommand(const QString& commandID);
    ~ToolConfigurationCommand() override;

    bool init() override;
    QObject* qObject();

    // tr() comes with Q_OBJECT (context "ToolConfigurationCommand"); trUtf8 is its twin.
    static QString trUtf8(const char* sourceText, const char* comment = nullptr);

public slots:
    // The order of these declarations is the dialog's slot table: keep it.
    void onProjectNumberChanged(QString qstrValue);
    void onCompanyNameChanged(QString qstrValue);
    void onNameChanged(QString qstrValue);
    void onStreetChanged(QString qstrValue);
    void onTownOrPostCodeChanged(QString qstrPostcode, QString qstrTown);
    void onPhoneNumberChanged(QString qstrValue);
    void onFaxNumberChanged(QString qstrValue);
    void onManufacturerChanged(QString qstrValue);
    void onRecordingModeChecked(bool bChecked);
    void onPortChanged(QString qstrValue);
    void onIPAddressChanged(QString qstrValue);
    void onDealerIDChanged(QString qstrValue);
    void onOKButtonClicked();
    void onCancelButtonClicked();
    void onFolderBrowserButtonClicked();
    void onCheckInternetChecked(bool bChecked);
    void onLocalRadioButtonClicked();
    void onA2ARadioButtonClicked();
    void onOtherRadioButtonClicked();
    void onDistributionFolderPathChanged(QString qstrValue);
    void onTaskTimeEditChanged(const QTime& taksTime);
    void onConfigurationTestButtonClicked();
    void onButtonSaveLogsClicked();

protected:
    // Qt custom events are not used by this controller.
    void customEvent(QEvent* event) override;

private:
    void handleEvent(const CustomEvent& event) override;
    // Republishes the users list after the users file changed.
    void refreshUsersListData();

    // Publication of the dialog's controls.
    void createDMData(bool reset);
    void createDataForControl(const ACE_WString& name);
    void createDataForUUControl(const ACE_WString& name);
    void createDataForTwoEditControl(const ACE_WString& name);
    void createDataForStringControl(const ACE_WString& name);
    void createDataForCheckBox(const ACE_WString& name, bool reset);
    void createDataForConfigCheckBox(const ACE_WString& name);
    void updateDataForControl(const ACE_WString& name, const ACE_WString& text);
    void updateDataForControl(const ACE_WString& name, const ACE_WString& text, bool fixed);
    void updateDataForTwoEditControl(const ACE_WString& name, const ACE_WString& edit1Text,
                                     const ACE_WString& edit2Text);
    void updateDataForStringControl(const ACE_WString& name, const ACE_WString& text);

    // Static configuration data and brand list.
    void createStaticConfigData(const ACE_WString& uri, ACE_WString name);
    void createStaticConfigData(const ACE_WString& uri1, const ACE_WString& uri2, const ACE_WString& separator,
                                ACE_WString name);
    void createStaticFileData(const ACE_WString& section, const ACE_WString& key, const ACE_WString& name);
    void createMarvaneNetData();
    void createDataForCombo(const ACE_WString& name);

    // Update-mode controls.
    void createDataForUpdateRadioButtons();
    void setRadioButtonState(ACE_WString name, bool state);
    // Each dotted part becomes its decimal value, or 0 when it is not a number.
    void validateIP(ACE_WString& ip);

    // Helpers shared by the operations above.
    ACE_WString readConfigString(const ACE_WString& uri);
    void publishDisplayOnly(const ACE_WString& name, const ACE_WString& text);
    ACE_WString readPath(const wchar_t* defaultPath, const wchar_t* uri);

    WorkshopInfoUpdater* m_pWorkshopInfoUpdater;
    UsersUpdater* m_pUsersUpdater;
    UpdateUpdater* m_pUpdateUpdater;
    SmartProxy<PMessageBoxManager> m_messageBoxManager;
    SmartProxy<PBText> m_bText;
    SmartProxy<PProcStartUpdateAgent> m_procStartUpdateAgent;
    SmartProxy<PDataManager> m_dataManager;
    bool m_bRecordingMode;
    ACE_WString m_app2AppIP;
    BSet m_app2AppValues;
    ACE_Thread_Mutex m_storesMutex;
    SmartProxy<PQ17FileSystemWatcher> m_fileSystemWatcher;
    // What OK wrote, so the watcher's report of it is not taken for an outside edit.
    OwnSaves m_ownSaves;

    // OK: the users and App2App part of the users file, then the online-update settings and
    // the scheduled task, each under the stores' lock.
    // Each hands back the bytes it wrote, or leaves `written` empty when it did not save.
    void saveUsersAndApp2App(std::string& written);
    void saveOnlineUpdateAndTask(std::string& written);

    friend class ToolConfigurationCommandTestAccess;
};
