#pragma once

#include "CheckConfigurationScheduledTaskResult.h"
#include "Dialog_ConfigurationTest.h"
#include "Export.h"
#include "IProcStartUpdateAgent.h"
#include "PBText.h"
#include "ScheduledTaskParams.h"
#include "SmartProxy.h"
#include "WidgetCommandBase.h"

#include <ace/Future.h>
#include <ace/config-lite.h>

#include <QObject>
#include <QString>

#include <memory>

class Dialog_ConfigurationTestBase;
class Dialog_OnLineUpdateConfigurationTestResult;

// The update agent's scheduled task as the data manager's settings describe it; invalid
// parameters when the settings cannot be read.
TESSEL_EXPORT ScheduledTaskParams getScheduledTaskParamsFromDM();

// Keeps the update agent's scheduled task in line with the online-update settings and runs the
// configuration test: the update agent's check on a worker thread behind a wait dialog, then the
// task check, both answers shown in a result dialog.
class TESSEL_EXPORT OnLineUpdateCommand : public WidgetCommandBase
{
    Q_OBJECT

public:
    // What the test's worker delivers through the future.
    struct TCheckResults
    {
        bool testCompleted = false;
        bool canceled = false;
        IProcStartUpdateAgent::_enum_CheckConfigurationPreparer preparerResult = IProcStartUpdateAgent::eNOK_NO_AGENT;
    };
    using ResultFutureType = ACE_Future<TCheckResults>;

    explicit OnLineUpdateCommand(const QString& commandId);
    ~OnLineUpdateCommand() override;

    // Runs the configuration test; true whatever its outcome.
    bool init() override;

    // True when the task was saved (made, or an existing one rewritten).
    bool CreateScheduledTask();
    // True when the task is gone or the scheduler was reached; false for invalid settings or an
    // unreachable scheduler.
    bool DeleteScheduledTask();

    QObject* qObject();

    // tr() comes with Q_OBJECT (context "OnLineUpdateCommand"); trUtf8 is its twin.
    static QString trUtf8(const char* sourceText, const char* comment = nullptr);

public slots:
    // The order of these declarations is the slot table: keep it.
    virtual void onCancelClicked();
    // Checks the task against the settings, as online updates are enabled or not.
    OnlineUpdateCommand_NS::_enum_CheckConfigurationScheduledTaskResult checkScheduledTask() const;

private:
    friend class OnLineUpdateCommandTestAccess;

    using FuturePointer = std::shared_ptr<ResultFutureType>;

    // With online updates disabled the task is made for the check if needed and removed
    // afterwards; enabled, it is made if needed and left in place.
    OnlineUpdateCommand_NS::_enum_CheckConfigurationScheduledTaskResult checkScheduledTask(
        bool onlineUpdateEnabled) const;

    // The test proper: true when the result dialog was shown.
    bool startConfigurationTestWindow();
    // The worker: takes over and deletes `parameter`, a heap-allocated FuturePointer.
    static unsigned long threadMethod_static(void* parameter);
    // The thread entry handed to the thread manager.
    static ACE_THR_FUNC_RETURN threadEntry_static(void* parameter);

    void decorateDialog(Dialog_ConfigurationTestBase& dialog);
    void decorateDialog(Dialog_OnLineUpdateConfigurationTestResult& dialog);

    SmartProxy<PBText> m_bText;
    Dialog_ConfigurationTest m_waitDialog;
    FuturePointer m_testFuture;
};
