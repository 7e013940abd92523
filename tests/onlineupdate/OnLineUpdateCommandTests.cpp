#include "OnLineUpdateCommand.h"

#include "BBool.h"
#include "CProcStartUpdateAgent.h"
#include "ComponentFixture.h"
#include "DialogDrivers.h"
#include "Dialog_ConfigurationTestBase.h"
#include "EffectiveUser.h"
#include "LogCapture.h"
#include "SettingsFiles.h"
#include "TaskFile.h"
#include "TaskRecord.h"
#include "TaskSchedulerFaults.h"
#include "TaskSchedulerSettings.h"
#include "TempDir.h"
#include "Uris.h"
#include "Win32Service.h"

#include <ace/Thread_Manager.h>

#include <sys/stat.h>

#include <algorithm>
#include <filesystem>
#include <memory>
#include <string>
#include <tuple>

// Reaches the command's private parts: the test's future, the worker and the wait dialog.
class OnLineUpdateCommandTestAccess
{
public:
    static std::shared_ptr<OnLineUpdateCommand::ResultFutureType> future(OnLineUpdateCommand& c)
    {
        return c.m_testFuture;
    }
    static unsigned long threadMethod(void* parameter) { return OnLineUpdateCommand::threadMethod_static(parameter); }
    static Dialog_ConfigurationTestBase& waitDialog(OnLineUpdateCommand& c) { return c.m_waitDialog; }
};

using namespace OnlineUpdateCommand_NS;
using Access = OnLineUpdateCommandTestAccess;
using Results = OnLineUpdateCommand::TCheckResults;
using ResultDialog = Dialog_OnLineUpdateConfigurationTestResult;

const int kError = TesselLog_Static::eERROR;
const int kWarning = TesselLog_Static::eWARNING;
const int kInformation = TesselLog_Static::eINFORMATION;

// A fresh data manager, text component and update-agent starter, a tasks folder of the test's
// own and a running scheduler service. The task time is 07:30:00, online updates are off.
class OnlineUpdateFixture : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks"));
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerFaults::clear();
        m_manager->destroyComponent(ID(CProcStartUpdateAgent::componentID));
        m_agent = CProcStartUpdateAgent::registerWith(*m_manager);
        ASSERT_NE(m_agent, nullptr);
        setConfig(Uri::kTaskTime, "07:30:00");
        setEnabled(false);
    }

    void TearDown() override
    {
        // A worker still blocked in the gated agent is let go, then every worker is joined.
        openGate();
        ACE_Thread_Manager::instance()->wait();
        TaskSchedulerFaults::clear();
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerSettings::setTasksFolder(std::string());
        ComponentFixture::TearDown();
    }

    void setEnabled(bool enabled)
    {
        ASSERT_EQ(0, m_dataManager->createData(ID(Uri::kEnableOnlineUpdate), BBool(enabled)));
    }

    // The default task as the scheduler stores it for this user.
    static std::wstring storedName() { return L"VEXAPreparerTask_" + EffectiveUser::loginName(); }
    static bool taskExists() { return std::filesystem::exists(TaskFile::pathOf(storedName())); }

    // Stores the default task as Create does, starting daily at `time`.
    void writeTask(const char* time)
    {
        setConfig(Uri::kTaskTime, time);
        ASSERT_TRUE(OnLineUpdateCommand("WC_TOOLCONFIGURATION").CreateScheduledTask());
        setConfig(Uri::kTaskTime, "07:30:00");
    }

    // A real update agent that answers minus `exitStatus` once the gate file exists.
    void useGatedAgent(int exitStatus)
    {
        m_gate = m_dir.file("gate");
        const std::string script = m_dir.file("agent.sh");
        TempDir::write(script, "#!/bin/sh\nwhile [ ! -e '" + m_gate + "' ]; do sleep 0.01; done\nexit " +
                                   std::to_string(exitStatus) + "\n");
        ASSERT_EQ(0, chmod(script.c_str(), 0755));
        setConfig(Uri::kAgentExecutable, script);
    }
    void openGate()
    {
        if (!m_gate.empty())
            TempDir::write(m_gate, "open");
    }

    CProcStartUpdateAgent* m_agent = nullptr;
    std::string m_gate;
    TempDir m_dir;
    LogCapture m_log;
};

namespace
{
const char* const kCanceledLine =
    "OnLineUpdateCommand::startConfigurationTestWindow: test was canceled, returning without processing results";

std::string agentLine(const std::string& name)
{
    return "OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::" + name;
}

std::string taskLine(const std::string& name)
{
    return "OnLineUpdateCommand::startConfigurationTestWindow: OnlineUpdateCommand_NS::" + name;
}

Results delivered(OnLineUpdateCommand& command)
{
    Results results;
    EXPECT_EQ(0, Access::future(command)->get(results));
    return results;
}
}

// ---- Parameters read from the data manager ----

// Keys set override the defaults, empty ones count as absent; task times shorter than "hh:mm" are
// invalid (the times a task takes: TaskTimeTest in the integrity tests).
TEST_F(OnlineUpdateFixture, ParametersComeFromTheDataManager)
{
    setConfig(Uri::kExecutablePath, "/opt/agent/UpdaterAgent");
    setConfig(Uri::kTaskName, "");
    ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    EXPECT_EQ(utf8(params.applicationPath()), "/opt/agent/UpdaterAgent");
    EXPECT_EQ(utf8(params.getTaskName()).rfind("VEXAPreparerTask_", 0), 0u);
    EXPECT_TRUE(params.isValid());
    setConfig(Uri::kTaskTime, "7:30");
    EXPECT_FALSE(getScheduledTaskParamsFromDM().isValid());
    EXPECT_TRUE(m_log.containsSubstring("task time '7:30' is shorter than hh:mm", kError));
}

TEST_F(OnlineUpdateFixture, WithoutDataManagerNothingCanBeDone)
{
    destroyDataManager();
    OnLineUpdateCommand command("WC_TOOLCONFIGURATION");
    EXPECT_FALSE(command.CreateScheduledTask());
    EXPECT_FALSE(command.DeleteScheduledTask());
    EXPECT_EQ(eWRONG_SETTINGS, command.checkScheduledTask());
    EXPECT_TRUE(m_log.contains("getScheduledTaskParamsFromDM: spDM is not valid", kError));
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::CreateScheduledTask: invalid scheduled task DM settings", kError));
}

TEST_F(OnlineUpdateFixture, PublicCheckWithoutUpdateAgentIsUnknownError)
{
    makeUnreachable(ID(CProcStartUpdateAgent::componentID));
    EXPECT_EQ(eUNKNOWN_ERROR, OnLineUpdateCommand("WC_ONLINEUPDATECOMMAND").checkScheduledTask());
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::checkScheduledTask: spPSUA is not valid", kError));
}

// Nobody has published the task time: the dialog's controller is built once to publish it.
TEST_F(OnlineUpdateFixture, MissingTaskTimeIsPublishedByOneInitialisationAttempt)
{
    ASSERT_EQ(0, m_dataManager->removeData(ID(Uri::kTaskTime)));
    setConfig(Uri::kWorkshopFile, m_dir.file("User/InformationsGarage.xml"));
    setConfig(Uri::kUsersFile, m_dir.file("User/FicheDiagParams.xml"));
    setConfig(Uri::kUpdateFile, m_dir.file("User/OnLineUpdate/Preparateur.xml"));
    SettingsFiles::writeUsers(m_dir.file("User/FicheDiagParams.xml"), {});
    SettingsFiles::Update update;
    update.time = "06:45:00";
    SettingsFiles::writeUpdate(m_dir.file("User/OnLineUpdate/Preparateur.xml"), update);
    EXPECT_EQ(utf8(getScheduledTaskParamsFromDM().startMinute()), "45");
    EXPECT_TRUE(m_log.contains("getScheduledTaskParamsFromDM: uri 'data:/Auto/SystemMenu/TaskTimeEdit' does not "
                               "exist or empty - will attempt to init",
                               kWarning));
}

// ---- Checking the task as the settings ask ----

struct CheckCase
{
    const char* name;
    bool enabled;
    bool taskBefore;                 // the task stored as set
    TaskSchedulerFaults::Call fault; // eCALL_COUNT: none, with S_FALSE: the scheduler service stopped
    HRESULT faultResult;
    _enum_CheckConfigurationScheduledTaskResult expected;
    const char* line; // what the check itself logs, if anything
    bool taskAfter;
};

class CheckTest : public OnlineUpdateFixture, public ::testing::WithParamInterface<CheckCase>
{};

// Online updates enabled, the task stays (made when missing); disabled, none is left behind.
TEST_P(CheckTest, ResultTaskAndLogFollowTheSettings)
{
    const CheckCase& c = GetParam();
    setEnabled(c.enabled);
    if (c.taskBefore)
        writeTask("07:30:00");
    if (c.fault != TaskSchedulerFaults::eCALL_COUNT)
        TaskSchedulerFaults::inject(c.fault, c.faultResult);
    else if (c.faultResult == S_FALSE)
        TaskSchedulerSettings::setServiceState(SERVICE_STOPPED);

    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_EQ(c.expected, command.checkScheduledTask());
    TaskSchedulerFaults::clear();
    EXPECT_EQ(taskExists(), c.taskAfter);
    EXPECT_EQ(m_log.containsSubstring("OnLineUpdateCommand::checkScheduledTask"), *c.line != '\0');
    EXPECT_TRUE(*c.line == '\0' || m_log.containsSubstring(c.line)) << c.line;
}

const TaskSchedulerFaults::Call kNone = TaskSchedulerFaults::eCALL_COUNT;
const CheckCase kCheckCases[] = {
    {"EnabledNoTask", true, false, kNone, S_OK, eOK, "did not exist for this windows user - we created it.", true},
    {"DisabledNoTask", false, false, kNone, S_OK, eOK, "successfully created temporary task", false},
    {"ServiceStopped", true, false, kNone, S_FALSE, eCAN_NOT_ACCESS_SERVICE, "", false},
    {"SchedulerUnreachable", false, false, TaskSchedulerFaults::eCoCreateInstance, E_FAIL, eUNKNOWN_ERROR,
     "did not complete successfully - cannot continue", false},
    {"AccessDenied", true, false, TaskSchedulerFaults::eActivate, static_cast<HRESULT>(0x80070005),
     eCAN_NOT_ACCESS_SERVICE, "reported accessDenied", false},
    {"CreationFails", true, false, TaskSchedulerFaults::eNewWorkItem, E_FAIL, eUNKNOWN_ERROR,
     "trying to create task failed", false},
    {"DeletionFails", false, true, TaskSchedulerFaults::eDelete, E_FAIL, eUNKNOWN_ERROR,
     "trying to delete temporary task failed", true},
};
INSTANTIATE_TEST_SUITE_P(Cases, CheckTest, ::testing::ValuesIn(kCheckCases),
                         [](const auto& info) { return std::string(info.param.name); });

// ---- Create and Delete ----

TEST_F(OnlineUpdateFixture, CreateRewritesTheTaskAndAFailedDeletionOnceReachedCountsAsDone)
{
    OnLineUpdateCommand command("WC_TOOLCONFIGURATION");
    EXPECT_TRUE(command.CreateScheduledTask());
    setConfig(Uri::kTaskTime, "21:05:00");
    EXPECT_TRUE(command.CreateScheduledTask());
    TaskRecord record;
    ASSERT_EQ(S_OK, TaskFile::load(storedName(), record));
    ASSERT_EQ(1u, record.triggers.size());
    EXPECT_EQ(21 * 60 + 5, record.triggers[0].wStartHour * 60 + record.triggers[0].wStartMinute);

    TaskSchedulerFaults::inject(TaskSchedulerFaults::eDelete, E_FAIL);
    EXPECT_TRUE(command.DeleteScheduledTask());
    TaskSchedulerFaults::clear();
    EXPECT_TRUE(taskExists());
    EXPECT_TRUE(command.DeleteScheduledTask());
    EXPECT_FALSE(taskExists());
    EXPECT_TRUE(command.DeleteScheduledTask());
}

// ---- The worker's mapping of the update agent's answers ----

TEST_F(OnlineUpdateFixture, WorkerRefusesNoParameterAndMapsAnswersOutOfRangeToMinus12)
{
    const std::tuple<int, int, const char*> answers[] = {{0, 0, "eOK"},
                                                         {-3, -3, "eNOK_INVALID_CONFIGURATION_FILE"},
                                                         {-13, -13, "eNOK_MISSING_UPDATE_AGENT"},
                                                         {1, -12, "eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR"},
                                                         {-40, -12, "eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR"}};
    EXPECT_EQ(666ul, Access::threadMethod(nullptr));
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::threadMethod_static: incorrect thread method parameter", kError));
    for (const auto& [answer, expected, name] : answers)
    {
        SCOPED_TRACE(answer);
        m_log.clear();
        m_agent->setTestAnswer(answer, 0);
        const auto future = std::make_shared<OnLineUpdateCommand::ResultFutureType>();
        EXPECT_EQ(0ul, Access::threadMethod(new std::shared_ptr<OnLineUpdateCommand::ResultFutureType>(future)));
        Results results;
        ASSERT_EQ(0, future->get(results));
        EXPECT_TRUE(results.testCompleted);
        EXPECT_EQ(expected, results.preparerResult);
        EXPECT_TRUE(m_log.contains(agentLine(name), expected == 0 ? kInformation : kError));
        EXPECT_EQ(1, future.use_count()) << "the worker has given back its hold";
    }
}

// ---- The whole test through the real dialogs ----

TEST_F(OnlineUpdateFixture, ResultDialogShowsTheAgentsAnswerAndTheTaskCheck)
{
    ResultDialogAccepter accepter;
    // Updates on, a task at another time, and the real agent answering -9.
    setEnabled(true);
    writeTask("09:00:00");
    useGatedAgent(9);
    openGate();
    {
        OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
        EXPECT_TRUE(command.init());
        EXPECT_FALSE(Access::waitDialog(command).isVisible());
        EXPECT_EQ(-9, delivered(command).preparerResult);
    }
    EXPECT_TRUE(m_log.contains(taskLine("eWRONG_SETTINGS"), kError));
    EXPECT_TRUE(taskExists());

    // Updates off, the task as set, and the answer 0: the task is checked, then removed.
    setEnabled(false);
    writeTask("07:30:00");
    m_agent->setTestAnswer(0, 0);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_TRUE(command.init());
    EXPECT_TRUE(m_log.contains(taskLine("eOK"), kInformation));
    EXPECT_FALSE(taskExists());
    ASSERT_EQ(2u, accepter.results.size());
    EXPECT_EQ(accepter.results[0].preparerText, ResultDialog::defaultPreparerText(-9));
    EXPECT_EQ(accepter.results[0].taskText, ResultDialog::defaultTaskText(eWRONG_SETTINGS));
    EXPECT_EQ(accepter.results[1].taskText, ResultDialog::defaultTaskText(eOK));
    EXPECT_TRUE(accepter.results[1].ranModally);
    EXPECT_FALSE(m_log.containsSubstring(kCanceledLine));
}

// ---- Cancel ----

TEST_F(OnlineUpdateFixture, CancelBeforeTheAnswerEndsTheTestAndTheLateAnswerIsDropped)
{
    ResultDialogAccepter accepter;
    useGatedAgent(3);
    auto command = std::make_unique<OnLineUpdateCommand>("WC_ONLINEUPDATECOMMAND");
    Dialog_ConfigurationTestBase* wait = &Access::waitDialog(*command);
    ModalDriver::whenShown([wait](QWidget& modal) {
        EXPECT_EQ(&modal, wait) << "the wait dialog is modal while the GUI thread waits";
        wait->cancelButton()->click();
    });
    EXPECT_TRUE(command->init());

    EXPECT_TRUE(accepter.results.empty());
    EXPECT_TRUE(m_log.contains(kCanceledLine, kWarning));
    EXPECT_FALSE(m_log.containsSubstring(taskLine(""))) << "no task check after a cancel";

    // The worker outlives the command and ends by itself once the agent answers.
    const auto future = Access::future(*command);
    command.reset();
    openGate();
    ACE_Thread_Manager::instance()->wait();
    EXPECT_TRUE(m_log.contains(agentLine("eNOK_INVALID_CONFIGURATION_FILE"), kError));
    Results results;
    ASSERT_EQ(0, future->get(results));
    EXPECT_TRUE(results.canceled);
    EXPECT_EQ(1, future.use_count());
}

// Canceling once the worker has delivered, or with cancel not wired (no text component), keeps
// the worker's answer.
TEST_F(OnlineUpdateFixture, LateOrUnwiredCancelKeepsTheWorkersAnswer)
{
    ResultDialogAccepter accepter;
    useGatedAgent(2);
    for (const bool withText : {true, false})
    {
        if (!withText)
            destroyText();
        std::filesystem::remove(m_gate);
        OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
        ModalDriver::whenShown([&](QWidget&) {
            if (withText)
            {
                openGate();
                delivered(command);
            }
            Access::waitDialog(command).cancelButton()->click();
            openGate();
        });
        EXPECT_TRUE(command.init());
        EXPECT_TRUE(delivered(command).testCompleted);
    }
    ASSERT_EQ(2u, accepter.results.size());
    EXPECT_EQ(accepter.results[1].preparerText, ResultDialog::defaultPreparerText(-2));
    EXPECT_FALSE(m_log.containsSubstring(kCanceledLine));
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::OnLineUpdateCommand: Cannot get proxy to BText.", kWarning));
}
