#include "OnlineUpdateTestSupport.h"

#include <dlfcn.h>
#include <pthread.h>

#include <atomic>
#include <cerrno>
#include <chrono>
#include <filesystem>
#include <thread>

using namespace OnlineUpdateTest;
using namespace OnlineUpdateCommand_NS;

namespace
{
const int kError = TesselLog_Static::eERROR;
const int kWarning = TesselLog_Static::eWARNING;
const int kInformation = TesselLog_Static::eINFORMATION;

std::atomic<bool> g_failThreadStart{false};

// True when a thread of this process carries `name`.
bool threadNamed(const std::string& name)
{
    std::error_code ignored;
    for (const auto& task : std::filesystem::directory_iterator("/proc/self/task", ignored))
    {
        std::string comm = TempDir::read((task.path() / "comm").string());
        if (!comm.empty() && comm.back() == '\n')
            comm.pop_back();
        if (comm == name)
            return true;
    }
    return false;
}

std::string agentLine(const char* name)
{
    return std::string("OnLineUpdateCommand::threadMethod_static: IProcStartUpdateAgent::") + name;
}

const char* const kCanceledLine =
    "OnLineUpdateCommand::startConfigurationTestWindow: test was canceled, returning without processing results";
}

// Stands in for the system's thread creation so that a test can make it fail; otherwise hands
// the call on to the next definition (the C library's, or a sanitizer's).
extern "C" __attribute__((visibility("default"))) int pthread_create(pthread_t* thread, const pthread_attr_t* attr,
                                                                     void* (*start)(void*), void* arg) noexcept
{
    using Real = int (*)(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*);
    static const Real real = reinterpret_cast<Real>(dlsym(RTLD_NEXT, "pthread_create"));
    if (g_failThreadStart.load() || real == nullptr)
        return EAGAIN;
    return real(thread, attr, start, arg);
}

class ConfigurationTest : public OnlineUpdateFixture
{
protected:
    std::string preparerText(int answer) const
    {
        return Dialog_OnLineUpdateConfigurationTestResult::defaultPreparerText(answer).toStdString();
    }
    std::string taskText(int result) const
    {
        return Dialog_OnLineUpdateConfigurationTestResult::defaultTaskText(result).toStdString();
    }

    DialogWatcher m_watcher;
};

// ---- Each answer of the update agent ----

struct AnswerCase
{
    int answer;
    int shown;
    const char* name;
};

void PrintTo(const AnswerCase& c, std::ostream* os)
{
    *os << c.answer;
}

class AgentAnswerTest : public ConfigurationTest, public ::testing::WithParamInterface<AnswerCase>
{
};

TEST_P(AgentAnswerTest, ResultDialogShowsTheAnswerAndTheTaskCheck)
{
    m_agent->setTestAnswer(GetParam().answer, 0);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_TRUE(command.init());

    ASSERT_EQ(1u, m_watcher.results.size());
    const DialogWatcher::Result& shown = m_watcher.results[0];
    EXPECT_EQ(shown.preparerText.toStdString(), preparerText(GetParam().shown));
    EXPECT_EQ(shown.taskText.toStdString(), taskText(eOK));
    EXPECT_EQ(shown.style, "Style85");
    EXPECT_TRUE(shown.ranModally);

    EXPECT_EQ(1, m_watcher.waitShown);
    EXPECT_EQ(m_watcher.waitStyle, "Style84");
    EXPECT_TRUE(m_watcher.waitModal);
    EXPECT_FALSE(OnLineUpdateCommandTestAccess::waitDialog(command).isVisible());

    const int level = GetParam().shown == 0 ? kInformation : kError;
    EXPECT_TRUE(m_log.contains(agentLine(GetParam().name), level)) << GetParam().name;
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::startConfigurationTestWindow: OnlineUpdateCommand_NS::eOK",
                               kInformation));
    EXPECT_FALSE(m_log.containsSubstring(kCanceledLine));
    // Online updates are off: the task made for the check is gone again.
    EXPECT_FALSE(taskExists());

    auto future = OnLineUpdateCommandTestAccess::future(command);
    ASSERT_NE(future, nullptr);
    OnLineUpdateCommand::TCheckResults delivered;
    ASSERT_EQ(0, future->get(delivered));
    EXPECT_TRUE(delivered.testCompleted);
    EXPECT_FALSE(delivered.canceled);
    EXPECT_EQ(GetParam().shown, delivered.preparerResult);
}

const AnswerCase kAnswers[] = {
    {0, 0, "eOK"},
    {-1, -1, "eNOK_FAILED_INITIALIZE_LOG_SYSTEM"},
    {-2, -2, "eNOK_MISSING_CONFIGURATION_FILE"},
    {-3, -3, "eNOK_INVALID_CONFIGURATION_FILE"},
    {-4, -4, "eNOK_A2A_NOT_CONFIGURED"},
    {-5, -5, "eNOK_PATH_NOT_CONFIGURED"},
    {-6, -6, "eNOK_MISSING_ROBOCOPY"},
    {-7, -7, "eNOK_CONFIGURATION_UNKNOWN"},
    {-8, -8, "eNOK_LOCAL_CLIENT_NOT_INSTALLED"},
    {-9, -9, "eNOK_SERVER_NOT_FOUND"},
    {-10, -10, "eNOK_DISTANT_CLIENT_NOT_INSTALLED"},
    {-11, -11, "eNOK_DISTRIBUTION_FOLDER_NO_ACCESS"},
    {-12, -12, "eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR"},
    {-13, -13, "eNOK_MISSING_UPDATE_AGENT"},
    // Answers outside the list are shown as -12.
    {5, -12, "eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR"},
    {1, -12, "eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR"},
    {-14, -12, "eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR"},
    {-40, -12, "eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR"},
};
INSTANTIATE_TEST_SUITE_P(Answers, AgentAnswerTest, ::testing::ValuesIn(kAnswers), [](const auto& info) {
    const int a = info.param.answer;
    return (a < 0 ? "Minus" + std::to_string(-a) : "Plus" + std::to_string(a));
});

TEST_F(ConfigurationTest, RealAgentExitStatusReachesTheDialog)
{
    useGatedAgent(9);
    openGate();
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_TRUE(command.init());
    ASSERT_EQ(1u, m_watcher.results.size());
    EXPECT_EQ(m_watcher.results[0].preparerText.toStdString(), preparerText(-9));
    EXPECT_TRUE(m_log.contains(agentLine("eNOK_SERVER_NOT_FOUND"), kError));
}

TEST_F(ConfigurationTest, EnabledUpdatesLeaveTheTaskInPlace)
{
    setEnabled(true);
    m_agent->setTestAnswer(0, 0);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_TRUE(command.init());
    ASSERT_EQ(1u, m_watcher.results.size());
    EXPECT_EQ(m_watcher.results[0].taskText.toStdString(), taskText(eOK));
    EXPECT_TRUE(taskExists());
}

TEST_F(ConfigurationTest, WrongTaskIsReported)
{
    setEnabled(true);
    writeTask(9, 0);
    m_agent->setTestAnswer(0, 0);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_TRUE(command.init());
    ASSERT_EQ(1u, m_watcher.results.size());
    EXPECT_EQ(m_watcher.results[0].taskText.toStdString(), taskText(eWRONG_SETTINGS));
    EXPECT_TRUE(m_log.contains(
        "OnLineUpdateCommand::startConfigurationTestWindow: OnlineUpdateCommand_NS::eWRONG_SETTINGS", kError));
}

// ---- No answer from the update agent ----

TEST_F(ConfigurationTest, NoAgentGivesMinus14AndAnUnknownTaskResult)
{
    makeAgentUnreachable();
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_TRUE(command.init());

    ASSERT_EQ(1u, m_watcher.results.size());
    EXPECT_EQ(m_watcher.results[0].preparerText.toStdString(), preparerText(-14));
    EXPECT_EQ(m_watcher.results[0].taskText.toStdString(), taskText(eUNKNOWN_ERROR));
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::threadMethod_static: Cannot get proxy to ProcStartUpdateAgent.", kError));
    EXPECT_TRUE(m_log.contains(
        "OnLineUpdateCommand::startConfigurationTestWindow: unable to instanciate proxy to PProcStartUpdateAgent", kError));
    EXPECT_TRUE(m_log.contains(
        "OnLineUpdateCommand::startConfigurationTestWindow: OnlineUpdateCommand_NS::eUNKNOWN_ERROR", kError));

    OnLineUpdateCommand::TCheckResults delivered;
    ASSERT_EQ(0, OnLineUpdateCommandTestAccess::future(command)->get(delivered));
    EXPECT_TRUE(delivered.testCompleted);
    EXPECT_EQ(-14, delivered.preparerResult);
}

TEST_F(ConfigurationTest, WorkerThatCannotStartGivesMinus14AtOnce)
{
    m_agent->setTestAnswer(0, 0);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    g_failThreadStart = true;
    const bool result = command.init();
    g_failThreadStart = false;
    EXPECT_TRUE(result);

    ASSERT_EQ(1u, m_watcher.results.size());
    EXPECT_EQ(m_watcher.results[0].preparerText.toStdString(), preparerText(-14));
    EXPECT_EQ(m_watcher.results[0].taskText.toStdString(), taskText(eOK));
    EXPECT_TRUE(m_log.containsSubstring("OnLineUpdateCommand::startConfigurationTestWindow: unable to start the test thread",
                                        kError));
    // No worker ran: nothing asked the agent.
    EXPECT_FALSE(m_log.containsSubstring("OnLineUpdateCommand::threadMethod_static"));
    OnLineUpdateCommand::TCheckResults delivered;
    ASSERT_EQ(0, OnLineUpdateCommandTestAccess::future(command)->get(delivered));
    EXPECT_FALSE(delivered.testCompleted);
    EXPECT_FALSE(delivered.canceled);
}

TEST_F(ConfigurationTest, WorkerRefusesAMissingParameter)
{
    EXPECT_EQ(666ul, OnLineUpdateCommandTestAccess::threadMethod(nullptr));
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::threadMethod_static: incorrect thread method parameter", kError));
}

// ---- Cancel ----

TEST_F(ConfigurationTest, CancelBeforeTheAnswerEndsTheTestAndTheLateAnswerIsDropped)
{
    useGatedAgent(3);
    auto command = std::make_unique<OnLineUpdateCommand>("WC_ONLINEUPDATECOMMAND");
    m_watcher.onWaitShown = [](Dialog_ConfigurationTestBase& wait) { wait.cancelButton()->click(); };
    EXPECT_TRUE(command->init());

    EXPECT_TRUE(m_watcher.results.empty());
    EXPECT_TRUE(m_log.contains(kCanceledLine, kWarning));
    EXPECT_FALSE(OnLineUpdateCommandTestAccess::waitDialog(*command).isVisible());
    // Canceled before any task check: no task was made.
    EXPECT_FALSE(m_log.containsSubstring("OnLineUpdateCommand::startConfigurationTestWindow: OnlineUpdateCommand_NS"));
    EXPECT_FALSE(taskExists());

    // The worker outlives the command and ends by itself once the agent answers.
    const auto future = OnLineUpdateCommandTestAccess::future(*command);
    command.reset();
    EXPECT_FALSE(m_log.containsSubstring(agentLine("")));
    openGate();
    ACE_Thread_Manager::instance()->wait();
    EXPECT_TRUE(m_log.contains(agentLine("eNOK_INVALID_CONFIGURATION_FILE"), kError));

    OnLineUpdateCommand::TCheckResults delivered;
    ASSERT_EQ(0, future->get(delivered));
    EXPECT_TRUE(delivered.canceled);
    EXPECT_FALSE(delivered.testCompleted);
    EXPECT_EQ(-14, delivered.preparerResult);
    EXPECT_TRUE(m_watcher.results.empty());
}

TEST_F(ConfigurationTest, CancelAfterDeliveryKeepsTheWorkersAnswer)
{
    useGatedAgent(2);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    m_watcher.onWaitShown = [this, &command](Dialog_ConfigurationTestBase& wait) {
        openGate();
        // Block until the worker has delivered, then cancel before the poll looks again.
        OnLineUpdateCommand::TCheckResults delivered;
        OnLineUpdateCommandTestAccess::future(command)->get(delivered);
        wait.cancelButton()->click();
    };
    EXPECT_TRUE(command.init());

    ASSERT_EQ(1u, m_watcher.results.size());
    EXPECT_EQ(m_watcher.results[0].preparerText.toStdString(), preparerText(-2));
    EXPECT_FALSE(m_log.containsSubstring(kCanceledLine));
    OnLineUpdateCommand::TCheckResults delivered;
    ASSERT_EQ(0, OnLineUpdateCommandTestAccess::future(command)->get(delivered));
    EXPECT_FALSE(delivered.canceled);
    EXPECT_TRUE(delivered.testCompleted);
}

TEST_F(ConfigurationTest, WithoutTextComponentCancelIsNotWiredAndTheWorkerEndsTheWait)
{
    destroyText();
    useGatedAgent(4);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    m_watcher.onWaitShown = [this](Dialog_ConfigurationTestBase& wait) {
        wait.cancelButton()->click();
        openGate();
    };
    EXPECT_TRUE(command.init());

    ASSERT_EQ(1u, m_watcher.results.size());
    EXPECT_EQ(m_watcher.results[0].preparerText.toStdString(), preparerText(-4));
    EXPECT_FALSE(m_log.containsSubstring(kCanceledLine));
}

TEST_F(ConfigurationTest, SecondTestReplacesTheFuture)
{
    m_agent->setTestAnswer(-5, 0);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_TRUE(command.init());
    const auto first = OnLineUpdateCommandTestAccess::future(command);
    m_agent->setTestAnswer(-6, 0);
    EXPECT_TRUE(command.init());
    ASSERT_EQ(2u, m_watcher.results.size());
    EXPECT_EQ(m_watcher.results[1].preparerText.toStdString(), preparerText(-6));
    EXPECT_NE(first, OnLineUpdateCommandTestAccess::future(command));
    // Once its worker has ended, the old future is held by this test alone.
    ACE_Thread_Manager::instance()->wait();
    EXPECT_EQ(1, first.use_count());
}

// ---- The GUI thread while it waits ----

TEST_F(ConfigurationTest, GuiProcessesEventsWhileWaiting)
{
    useGatedAgent(0);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    int ticks = 0;
    QWidget* modalDuringWait = nullptr;
    QTimer ticker;
    QObject::connect(&ticker, &QTimer::timeout, [&]() {
        // The gate stays shut until the GUI thread has run this three times.
        if (++ticks == 3)
        {
            modalDuringWait = QApplication::activeModalWidget();
            openGate();
        }
    });
    m_watcher.onWaitShown = [&ticker](Dialog_ConfigurationTestBase&) { ticker.start(0); };
    EXPECT_TRUE(command.init());
    ticker.stop();

    EXPECT_GE(ticks, 3);
    EXPECT_EQ(modalDuringWait, &OnLineUpdateCommandTestAccess::waitDialog(command));
    ASSERT_EQ(1u, m_watcher.results.size());
    EXPECT_EQ(m_watcher.results[0].preparerText.toStdString(), preparerText(0));
    EXPECT_TRUE(m_log.contains(agentLine("eOK"), kInformation));
}

TEST_F(ConfigurationTest, WorkerThreadIsNamed)
{
    useGatedAgent(0);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    bool named = false;
    m_watcher.onWaitShown = [this, &named](Dialog_ConfigurationTestBase&) {
        // The worker names itself first and then waits for the gated agent.
        for (int attempt = 0; attempt < 10000 && !named; ++attempt)
        {
            named = threadNamed("OnLineUpdateCom");
            if (!named)
                std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        openGate();
    };
    EXPECT_TRUE(command.init());
    EXPECT_TRUE(named);
    EXPECT_EQ(1u, m_watcher.results.size());
}
