#include "OnLineUpdateCommand.h"

#include "CScheduledTaskHelper.h"
#include "Dialog_ConfigurationTestBase.h"
#include "Dialog_OnLineUpdateConfigurationTestResult.h"
#include "ID.h"
#include "PDataManager.h"
#include "PProcStartUpdateAgent.h"
#include "SafeWidgetDecorator.h"
#include "StringUtilities.h"
#include "TesselLog_Static.h"
#include "ToolConfigurationCommand.h"

#include <ace/Thread_Manager.h>

#include <QApplication>
#include <QEventLoop>
#include <QPushButton>
#include <QTimer>

#include <pthread.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <new>

using namespace OnlineUpdateCommand_NS;

namespace
{
const char* const kComponent = "ProcToolConfiguration";
const char* const kFile = "ProcToolConfiguration.dll";
const char* const kClass = "OnLineUpdateCommand";

const char* const kDataManagerID = "tessel:DM?DataManager";
const char* const kBTextID = "tessel:BText?BText";
const char* const kUpdateAgentID = "proc:ProcStartUpdateAgent?ProcStartUpdateAgent";

const wchar_t* const kTaskTimeUri = L"data:/Auto/SystemMenu/TaskTimeEdit";
const wchar_t* const kExecutablePathUri = L"data:/Configuration/MenuBar/Preparateur/ExecutablePath";
const wchar_t* const kExecutableParametersUri = L"data:/Configuration/MenuBar/Preparateur/ExecutableParameterPreparer";
const wchar_t* const kTaskNameUri = L"data:/Configuration/MenuBar/Preparateur/TimeScheduledTask";
const wchar_t* const kExecutablePathDefault = L"C:/VEXA_Q17/Lib/Application/UpdaterAgent.exe";
const wchar_t* const kExecutableParametersDefault = L"preparer";
const wchar_t* const kTaskNameDefault = L"VEXAPreparerTask";

const char* const kThreadName = "OnLineUpdateCommand::threadMethod_static";
const unsigned long kThreadFailed = 666;
const int kPollMilliseconds = 100;

const int kFirstPreparerAnswer = IProcStartUpdateAgent::eOK;
const int kLastPreparerAnswer = IProcStartUpdateAgent::eNOK_MISSING_UPDATE_AGENT;

// What the worker logs for each answer of the update agent, from 0 down to -13.
const wchar_t* const kPreparerMessages[] = {
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eOK",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_FAILED_INITIALIZE_LOG_SYSTEM",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_MISSING_CONFIGURATION_FILE",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_INVALID_CONFIGURATION_FILE",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_A2A_NOT_CONFIGURED",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_PATH_NOT_CONFIGURED",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_MISSING_ROBOCOPY",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_CONFIGURATION_UNKNOWN",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_LOCAL_CLIENT_NOT_INSTALLED",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_SERVER_NOT_FOUND",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_DISTANT_CLIENT_NOT_INSTALLED",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_DISTRIBUTION_FOLDER_NO_ACCESS",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR",
    L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_MISSING_UPDATE_AGENT",
};

// What the configuration test logs for each task check result, from 1 to 5.
const wchar_t* const kTaskResultMessages[] = {
    L"OnLineUpdateCommand::startConfigurationTestWindow: OnlineUpdateCommand_NS::eOK",
    L"OnLineUpdateCommand::startConfigurationTestWindow: OnlineUpdateCommand_NS::eTASK_NOT_REGISTERED",
    L"OnLineUpdateCommand::startConfigurationTestWindow: OnlineUpdateCommand_NS::eWRONG_SETTINGS",
    L"OnLineUpdateCommand::startConfigurationTestWindow: OnlineUpdateCommand_NS::eCAN_NOT_ACCESS_SERVICE",
    L"OnLineUpdateCommand::startConfigurationTestWindow: OnlineUpdateCommand_NS::eUNKNOWN_ERROR",
};

// Messages may hold runtime text, so they are never used as a format.
void logError(const wchar_t* message)
{
    TesselLog_Static::logError_static(kComponent, kFile, kClass, -1, L"%s", message);
}

void logWarning(const wchar_t* message)
{
    TesselLog_Static::logWarning_static(kComponent, kFile, kClass, message);
}

void logInformation(const wchar_t* message)
{
    TesselLog_Static::logInformation_static(kComponent, kFile, kClass, message);
}

void logTrace(const wchar_t* message)
{
    TesselLog_Static::logTrace_static(kComponent, kFile, kClass, message);
}

ACE_WString readString(PDataManager& dataManager, const wchar_t* uri)
{
    ACE_WString value;
    dataManager.getString(ID(uri), value);
    return value;
}

ACE_WString readString(PDataManager& dataManager, const wchar_t* uri, const wchar_t* defaultValue)
{
    ACE_WString value = readString(dataManager, uri);
    if (value.is_empty())
        value = defaultValue;
    return value;
}

// A two-digit number from `first` to at most `maximum`.
bool isTwoDigits(const ACE_WString& text, size_t first, int maximum)
{
    const wchar_t tens = text[first];
    const wchar_t units = text[first + 1];
    if (tens < L'0' || tens > L'9' || units < L'0' || units > L'9')
        return false;
    return (tens - L'0') * 10 + (units - L'0') <= maximum;
}

// "hh:mm" or "hh:mm:ss", hours 00-23, minutes and seconds 00-59.
bool isTaskTime(const ACE_WString& text)
{
    const size_t length = text.length();
    if (length != 5 && length != 8)
        return false;
    if (!isTwoDigits(text, 0, 23) || text[2] != L':' || !isTwoDigits(text, 3, 59))
        return false;
    return length == 5 || (text[5] == L':' && isTwoDigits(text, 6, 59));
}

// Names the calling thread for debuggers; the system keeps 15 characters.
void nameThisThread(const char* name)
{
    char shortName[16] = {};
    std::memcpy(shortName, name, std::min(std::strlen(name), sizeof shortName - 1));
    pthread_setname_np(pthread_self(), shortName);
}
}

ScheduledTaskParams getScheduledTaskParamsFromDM()
{
    SmartProxy<PDataManager> dataManager;
    if (!dataManager.acquire(ID(kDataManagerID)))
    {
        logError(L"getScheduledTaskParamsFromDM: spDM is not valid");
        return ScheduledTaskParams::s_defaultParams;
    }

    ACE_WString taskTime = readString(*dataManager.get(), kTaskTimeUri);
    if (taskTime.is_empty())
    {
        logWarning(
            StringUtilities::wideSprintf(
                L"getScheduledTaskParamsFromDM: uri '%s' does not exist or empty - will attempt to init", kTaskTimeUri)
                .c_str());
        {
            // Building the dialog's controller publishes its records, the task time among them.
            ToolConfigurationCommand publisher{QString()};
            taskTime = readString(*dataManager.get(), kTaskTimeUri);
        }
        if (taskTime.is_empty())
        {
            logError(
                L"getScheduledTaskParamsFromDM: unable to find task time in DM - second failure, after init attempt");
            return ScheduledTaskParams::s_defaultParams;
        }
    }

    // "hh:mm:ss": the hour is at 0-1, the minute at 3-4. A shorter text is cut to what it holds and
    // is no valid setting: "7:30" would otherwise start the task at 7:00.
    const size_t length = taskTime.length();
    const ACE_WString hourText = taskTime.substring(0, std::min<size_t>(2, length));
    const ACE_WString minuteText = length > 3 ? taskTime.substring(3, std::min<size_t>(2, length - 3)) : ACE_WString();
    if (length < 5)
    {
        logError(StringUtilities::wideSprintf(L"getScheduledTaskParamsFromDM: task time '%s' is shorter than hh:mm "
                                              L"(hour '%s', minute '%s') - invalid setting",
                                              taskTime.c_str(), hourText.c_str(), minuteText.c_str())
                     .c_str());
        return ScheduledTaskParams::s_defaultParams;
    }
    if (!isTaskTime(taskTime))
    {
        logError(StringUtilities::wideSprintf(
                     L"getScheduledTaskParamsFromDM: task time '%s' is not hh:mm or hh:mm:ss - invalid setting",
                     taskTime.c_str())
                     .c_str());
        return ScheduledTaskParams::s_defaultParams;
    }

    const ACE_WString applicationPath = readString(*dataManager.get(), kExecutablePathUri, kExecutablePathDefault);
    const ACE_WString parameters =
        readString(*dataManager.get(), kExecutableParametersUri, kExecutableParametersDefault);
    const ACE_WString taskName = readString(*dataManager.get(), kTaskNameUri, kTaskNameDefault);

    return ScheduledTaskParams(taskName.c_str(), applicationPath.c_str(), parameters.c_str(), hourText.c_str(),
                               minuteText.c_str());
}

OnLineUpdateCommand::OnLineUpdateCommand(const QString& commandId)
    : WidgetCommandBase(commandId),
      m_waitDialog(nullptr, nullptr, Qt::WindowFlags())
{
    if (!m_bText.acquire(ID(kBTextID)))
    {
        logWarning(L"OnLineUpdateCommand::OnLineUpdateCommand: Cannot get proxy to BText.");
        return;
    }
    QObject::connect(m_waitDialog.cancelButton(), SIGNAL(clicked()), this, SLOT(onCancelClicked()));
    // Escape and the window's close button reject the dialog: that cancels the test too.
    QObject::connect(&m_waitDialog, SIGNAL(rejected()), this, SLOT(onCancelClicked()));
}

OnLineUpdateCommand::~OnLineUpdateCommand() = default;

QObject* OnLineUpdateCommand::qObject()
{
    return this;
}

QString OnLineUpdateCommand::trUtf8(const char* sourceText, const char* comment)
{
    return staticMetaObject.tr(sourceText, comment);
}

bool OnLineUpdateCommand::CreateScheduledTask()
{
    ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    if (!params.isValid())
    {
        logError(L"OnLineUpdateCommand::CreateScheduledTask: invalid scheduled task DM settings");
        return false;
    }
    CScheduledTaskHelper helper(params);
    return helper.createScheduledTask(false);
}

bool OnLineUpdateCommand::DeleteScheduledTask()
{
    ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    if (!params.isValid())
        logError(L"OnLineUpdateCommand::DeleteScheduledTask: invalid scheduled task DM settings");
    // The helper rejects invalid parameters itself.
    CScheduledTaskHelper helper(params);
    return helper.deleteScheduledTask(false);
}

_enum_CheckConfigurationScheduledTaskResult OnLineUpdateCommand::checkScheduledTask() const
{
    SmartProxy<PProcStartUpdateAgent> agent;
    if (!agent.acquire(ID(kUpdateAgentID)))
    {
        logError(L"OnLineUpdateCommand::checkScheduledTask: spPSUA is not valid");
        return eUNKNOWN_ERROR;
    }
    return checkScheduledTask(agent->isOnlineUpdateEnabled());
}

_enum_CheckConfigurationScheduledTaskResult OnLineUpdateCommand::checkScheduledTask(bool onlineUpdateEnabled) const
{
    ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    if (!params.isValid())
    {
        logError(L"OnLineUpdateCommand::checkScheduledTask: invalid scheduled task DM settings");
        return eWRONG_SETTINGS;
    }

    CScheduledTaskHelper helper(params);
    if (!CScheduledTaskHelper::checkSchedulerServiceRunning())
        return eCAN_NOT_ACCESS_SERVICE;

    bool taskExists = false;
    bool accessDenied = false;
    if (!helper.checkTaskAvailableForCurrentUser(taskExists, accessDenied))
    {
        logError(L"OnLineUpdateCommand::checkScheduledTask: checkTaskAvailableForCurrentUser did not complete "
                 L"successfully - cannot continue");
        return eUNKNOWN_ERROR;
    }
    if (accessDenied)
    {
        logError(L"OnLineUpdateCommand::checkScheduledTask: checkTaskAvailableForCurrentUser reported accessDenied - "
                 L"most likely current windows user privileges have been changed, windows administrator needed to "
                 L"confirm and cleanup if needed. could be due an unexpected situation like windows rights having "
                 L"changed for current user, GPO for scheduled tasks having been applied, ...");
        return eCAN_NOT_ACCESS_SERVICE;
    }

    if (!taskExists)
    {
        if (!helper.createScheduledTask(true))
        {
            logError(L"OnLineUpdateCommand::checkScheduledTask: trying to create task failed");
            return eUNKNOWN_ERROR;
        }
        if (onlineUpdateEnabled)
            logWarning(L"OnLineUpdateCommand::checkScheduledTask: online updates were enabled in settings but task "
                       L"did not exist for this windows user - we created it. This is expected in case of VEXA being "
                       L"installed and configured by Windows administrator, then being run by non admin. In other "
                       L"cases it could be due an unexpected situation like windows rights having changed for "
                       L"current user, GPO for scheduled tasks having been applied, ....");
        else
            logInformation(L"OnLineUpdateCommand::checkScheduledTask: successfully created temporary task for "
                           L"checking purposes");
    }

    const _enum_CheckConfigurationScheduledTaskResult result = helper.checkScheduledTask();
    if (onlineUpdateEnabled)
        return result;

    // With online updates off no task may stay behind, whether made above or found.
    if (!helper.deleteScheduledTask(true))
    {
        logError(L"OnLineUpdateCommand::checkScheduledTask: trying to delete temporary task failed");
        return eUNKNOWN_ERROR;
    }
    return result;
}

bool OnLineUpdateCommand::init()
{
    m_waitDialog.init();
    decorateDialog(m_waitDialog);
    m_waitDialog.setModal(true);
    m_waitDialog.show();
    startConfigurationTestWindow();
    return true;
}

bool OnLineUpdateCommand::startConfigurationTestWindow()
{
    FuturePointer future;
    std::unique_ptr<FuturePointer> workerHold;
    try
    {
        future = std::make_shared<ResultFutureType>();
        workerHold = std::make_unique<FuturePointer>(future);
    }
    catch (const std::bad_alloc&)
    {
        future.reset();
    }
    if (!future)
    {
        logError(L"OnLineUpdateCommand::startConfigurationTestWindow: failed to allocate new ResultFutureType");
        return false;
    }
    m_testFuture = future;

    // The worker takes over its hold; it is detached, so it leaves nothing behind when it ends.
    if (ACE_Thread_Manager::instance()->spawn(&OnLineUpdateCommand::threadEntry_static, workerHold.get(),
                                              THR_NEW_LWP | THR_DETACHED, nullptr, nullptr, 0) == -1)
    {
        // Without a worker nobody would answer: the test ends at once with no agent answer.
        logError(L"OnLineUpdateCommand::startConfigurationTestWindow: unable to start the test thread - "
                 L"continuing without an answer of the update agent");
        future->set(TCheckResults());
    }
    else
    {
        workerHold.release();
    }

    // Polls the future from an event loop of its own, which also ends when the application quits;
    // the test then counts as canceled.
    {
        QEventLoop loop;
        QTimer poll;
        QObject::connect(&poll, &QTimer::timeout, &loop, [&loop, &future]() {
            if (future->ready())
                loop.quit();
        });
        poll.start(kPollMilliseconds);
        if (!future->ready())
            loop.exec();
    }
    if (!future->ready())
        onCancelClicked();

    TCheckResults results;
    results.canceled = false;
    results.preparerResult = IProcStartUpdateAgent::eNOK_NO_AGENT;
    future->get(results);

    if (results.canceled)
    {
        logWarning(L"OnLineUpdateCommand::startConfigurationTestWindow: test was canceled, returning without "
                   L"processing results");
        future.reset();
        return false;
    }

    _enum_CheckConfigurationScheduledTaskResult taskResult = eUNKNOWN_ERROR;
    SmartProxy<PProcStartUpdateAgent> agent;
    if (!agent.acquire(ID(kUpdateAgentID)))
        logError(
            L"OnLineUpdateCommand::startConfigurationTestWindow: unable to instanciate proxy to PProcStartUpdateAgent");
    else
        taskResult = checkScheduledTask(agent->isOnlineUpdateEnabled());

    if (taskResult >= eOK && taskResult <= eUNKNOWN_ERROR)
    {
        const wchar_t* message = kTaskResultMessages[taskResult - eOK];
        if (taskResult == eOK)
            logInformation(message);
        else
            logError(message);
    }
    else
    {
        logError(L"OnLineUpdateCommand::startConfigurationTestWindow: value not in "
                 L"OnlineUpdateCommand_NS::_enum_CheckConfigurationScheduledTaskResult");
    }

    m_waitDialog.close();

    {
        Dialog_OnLineUpdateConfigurationTestResult resultDialog(nullptr, nullptr, Qt::WindowFlags());
        decorateDialog(resultDialog);
        resultDialog.init(results.preparerResult, taskResult);
        decorateDialog(resultDialog);
        resultDialog.exec();
    }

    agent.giveBack();
    future.reset();
    return true;
}

ACE_THR_FUNC_RETURN OnLineUpdateCommand::threadEntry_static(void* parameter)
{
    const unsigned long result = threadMethod_static(parameter);
    return reinterpret_cast<ACE_THR_FUNC_RETURN>(static_cast<std::uintptr_t>(result));
}

unsigned long OnLineUpdateCommand::threadMethod_static(void* parameter)
{
    nameThisThread(kThreadName);

    if (parameter == nullptr)
    {
        logError(L"OnLineUpdateCommand::threadMethod_static: incorrect thread method parameter");
        return kThreadFailed;
    }

    FuturePointer future;
    {
        std::unique_ptr<FuturePointer> hold(static_cast<FuturePointer*>(parameter));
        future = *hold;
        hold->reset();
    }

    TCheckResults results;
    results.testCompleted = false;
    results.canceled = false;
    results.preparerResult = IProcStartUpdateAgent::eNOK_NO_AGENT;

    try
    {
        SmartProxy<PProcStartUpdateAgent> agent;
        if (!agent.acquire(ID(kUpdateAgentID)))
        {
            logError(L"OnLineUpdateCommand::threadMethod_static: Cannot get proxy to ProcStartUpdateAgent.");
        }
        else
        {
            int answer = agent->checkConfigurationPreparer();
            if (answer == IProcStartUpdateAgent::eNOK_NO_AGENT)
            {
                // The starter lost its agent during the test: the user sees that no agent answered.
                logError(L"OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::eNOK_NO_AGENT");
            }
            else
            {
                if (answer > kFirstPreparerAnswer || answer < kLastPreparerAnswer)
                    answer = IProcStartUpdateAgent::eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR;
                const wchar_t* message = kPreparerMessages[kFirstPreparerAnswer - answer];
                if (answer == IProcStartUpdateAgent::eOK)
                    logInformation(message);
                else
                    logError(message);
            }
            results.preparerResult = static_cast<IProcStartUpdateAgent::_enum_CheckConfigurationPreparer>(answer);
        }
        results.testCompleted = true;
        agent.giveBack();
    }
    catch (...)
    {
        logError(
            L"OnLineUpdateCommand::threadMethod_static: exception during test. Will attempt to signal future anyway.");
    }

    try
    {
        // A test canceled meanwhile has set the future already: this value is then dropped.
        if (future->set(results) == -1)
        {
            logError(L"OnLineUpdateCommand::threadMethod_static: exception during result future setting");
            future.reset();
            return kThreadFailed;
        }
    }
    catch (...)
    {
        logError(L"OnLineUpdateCommand::threadMethod_static: exception during result future setting");
        future.reset();
        return kThreadFailed;
    }
    future.reset();
    return 0;
}

void OnLineUpdateCommand::onCancelClicked()
{
    FuturePointer future = m_testFuture;
    if (future)
    {
        TCheckResults canceled;
        canceled.testCompleted = false;
        canceled.canceled = true;
        canceled.preparerResult = IProcStartUpdateAgent::eNOK_NO_AGENT;
        // The first value set wins: after the worker's delivery this changes nothing.
        future->set(canceled);
    }
    m_waitDialog.close();
}

void OnLineUpdateCommand::decorateDialog(Dialog_ConfigurationTestBase& dialog)
{
    logTrace(L"[OnLineUpdateCommand::decorateDialog] : Method started");
    SafeWidgetDecorator::getInstance()->decorate(QStringLiteral("Style84"), dialog, true);
}

void OnLineUpdateCommand::decorateDialog(Dialog_OnLineUpdateConfigurationTestResult& dialog)
{
    logTrace(L"[OnLineUpdateCommand::decorateDialog] : Method started");
    SafeWidgetDecorator::getInstance()->decorate(QStringLiteral("Style85"), dialog, true);
}
