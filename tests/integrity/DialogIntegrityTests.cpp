#include "BBool.h"
#include "CScheduledTaskHelper.h"
#include "DialogDrivers.h"
#include "DialogFixture.h"
#include "Dialog_ConfigurationTestBase.h"
#include "EffectiveUser.h"
#include "LogCapture.h"
#include "OnLineUpdateCommand.h"
#include "ScheduledTaskParams.h"
#include "TaskFile.h"
#include "ToolConfigurationTestSupport.h"
#include "UsersCommand.h"

#include <gtest/gtest.h>

#include <QKeyEvent>

#include <pthread.h>
#include <sys/stat.h>

#include <atomic>
#include <filesystem>
#include <memory>
#include <string>

// Reaches the configuration test's wait dialog.
class OnLineUpdateCommandTestAccess
{
public:
    static Dialog_ConfigurationTestBase& waitDialog(OnLineUpdateCommand& c) { return c.m_waitDialog; }
};

class DialogIntegrityTest : public ToolConfigurationTest
{
protected:
    void republishUsers()
    {
        UsersCommand users(QStringLiteral("WC_USERSCOMMAND"));
        users.createDMUsersData();
    }
};

// Without a readable online-update file, OK keeps the App2App values the dialog never showed,
// and leaves the online-update switch and the task as they were.
TEST_F(DialogIntegrityTest, OkWithoutOnlineUpdateFileKeepsApp2AppSwitchAndTask)
{
    for (const bool missing : {true, false})
    {
        SCOPED_TRACE(missing ? "missing" : "malformed");
        if (missing)
            std::filesystem::remove(m_updatePath);
        else
            TempDir::write(m_updatePath, "<BSet><Bool key=\"OnlineUpdateActivated\">true");
        ASSERT_EQ(m_dataManager->createData(ID(Uri::kEnableOnlineUpdate), BBool(false)), 0);
        makeCommand();
        republishUsers();
        m_command->onOKButtonClicked();

        EXPECT_EQ(app2AppIn(m_usersPath), "8080 10.0.0.7 D77");
        EXPECT_EQ(SettingsFiles::usersIn(m_usersPath), (std::vector<User>{kAnna, kBruno, kClara}));
        bool enabled = true;
        EXPECT_EQ(m_dataManager->getBool(ID(Uri::kEnableOnlineUpdate), enabled), 0);
        EXPECT_FALSE(enabled);
        EXPECT_FALSE(std::filesystem::exists(TaskFile::pathOf(L"VEXAPreparerTask_" + EffectiveUser::loginName())));
        EXPECT_EQ(std::filesystem::exists(m_updatePath), !missing);
    }
}

// Cancel throws every pending edit away, also when a damaged file stops the rebuild early.
TEST_F(DialogIntegrityTest, CancelWithMalformedWorkshopDiscardsEveryEdit)
{
    makeCommand();
    republishUsers();
    TempDir::write(m_workshopPath, "<BSet><String key=\"nom\">");
    m_command->onPortChanged(QStringLiteral("9999"));
    m_command->onDealerIDChanged(QStringLiteral("D00"));
    m_command->onCheckInternetChecked(true);
    m_command->onOtherRadioButtonClicked();
    m_command->onDistributionFolderPathChanged(QStringLiteral("/elsewhere"));
    BSet noUsers(10);
    ASSERT_EQ(m_dataManager->createData(ID(Uri::kUserSet), noUsers), 0);

    m_command->onCancelButtonClicked();
    m_command->onOKButtonClicked();

    EXPECT_EQ(SettingsFiles::usersIn(m_usersPath), (std::vector<User>{kAnna, kBruno, kClara}));
    EXPECT_EQ(app2AppIn(m_usersPath), "8080 10.0.0.7 D77");
    const BSet update = SettingsFiles::read(m_updatePath);
    EXPECT_EQ(SettingsFiles::stringAt(update, "DeploymentMode"), "LOCAL");
    EXPECT_EQ(SettingsFiles::stringAt(update, "DistributionFolderPath"), "/srv/dist");
    bool enabled = true;
    update.getBool(L"OnlineUpdateActivated"_w, enabled);
    EXPECT_FALSE(enabled);
    EXPECT_EQ(TempDir::read(m_workshopPath), "<BSet><String key=\"nom\">");
}

// Every used slot is listed in slot order, also past a free one, and OK writes them all
// without gaps.
TEST_F(DialogIntegrityTest, UsersAfterAFreeSlotAreListedAndKept)
{
    SettingsFiles::writeUsers(m_usersPath, {kAnna, kBruno, {"0", "0", "0"}, kClara});
    makeCommand();
    republishUsers();
    EXPECT_EQ(publishedUsers(*m_dataManager), (std::vector<User>{kAnna, kBruno, kClara}));
    m_command->onOKButtonClicked();
    EXPECT_EQ(SettingsFiles::usersIn(m_usersPath), (std::vector<User>{kAnna, kBruno, kClara}));
}

using TaskTimeTest = ComponentFixture;

// Only hh:mm or hh:mm:ss within the day make a task; anything else gives the invalid defaults
// and an error line that shows the text as it is, never as a format.
TEST_F(TaskTimeTest, OnlyAWellFormedTimeMakesATask)
{
    // The text, and the hour and minute it gives ("" when invalid).
    const char* const cases[][2] = {{"07:30", "07|30"}, {"23:59:59", "23|59"}, {"%s%s", ""},  {"%n%n%s%s%S", ""},
                                    {"7:30:00", ""},    {"24:00", ""},         {"07:60", ""}, {"07:30:60", ""},
                                    {"07:30:0", ""},    {"ab:cd", ""}};
    for (const auto& [text, time] : cases)
    {
        SCOPED_TRACE(text);
        setConfig(Uri::kTaskTime, text);
        LogCapture log;
        const ScheduledTaskParams params = getScheduledTaskParamsFromDM();
        EXPECT_EQ(params.isValid() ? utf8(params.startHour()) + "|" + utf8(params.startMinute()) : "", time);
        EXPECT_TRUE(*time != '\0' || log.containsSubstring("task time '" + std::string(text) + "'"));
    }
}

// Runtime text with conversions reaches the log as it is, in every field that is logged.
TEST_F(DialogIntegrityTest, RuntimeTextIsNeverAFormat)
{
    const std::string hostile = "%s%n%S%d";
    setConfig(Uri::kWorkshopFile, m_dir.file(hostile + "/InformationsGarage.xml"));
    setConfig(Uri::kUpdateFile, m_dir.file(hostile + ".xml"));
    setConfig(Uri::kTaskName, "Task" + hostile);
    setConfig(Uri::kTaskTime, hostile);
    LogCapture log;
    makeCommand();
    EXPECT_TRUE(log.containsSubstring(hostile + "/InformationsGarage.xml"));
    EXPECT_TRUE(log.containsSubstring(hostile + ".xml"));
    OnLineUpdateCommand command(QStringLiteral("WC_ONLINEUPDATECOMMAND"));
    EXPECT_FALSE(command.CreateScheduledTask());
    EXPECT_TRUE(log.containsSubstring("task time '" + hostile + "'"));
}

class ConfigurationTestIntegrity : public DialogIntegrityTest
{
protected:
    // Runs a configuration test whose agent never answers on its own; `close` acts on the wait
    // dialog once it is shown. True when a result dialog was shown.
    bool runClosingWaitDialog(const std::function<void(Dialog_ConfigurationTestBase&)>& close)
    {
        // The agent answers only once the gate file exists, which the test makes after the wait.
        const std::string gate = m_dir.file("gate");
        const std::string script = m_dir.file("agent.sh");
        TempDir::write(script, "#!/bin/sh\nwhile [ ! -e '" + gate + "' ]; do sleep 0.01; done\nexit 0\n");
        EXPECT_EQ(::chmod(script.c_str(), 0755), 0);
        setConfig(Uri::kAgentExecutable, script);
        m_agent->clearTestAnswer();
        struct GateOpener
        {
            std::string path;
            ~GateOpener() { TempDir::write(path, "open"); }
        } opener{gate};
        ResultDialogAccepter results;
        OnLineUpdateCommand command(QStringLiteral("WC_ONLINEUPDATECOMMAND"));
        Dialog_ConfigurationTestBase& wait = OnLineUpdateCommandTestAccess::waitDialog(command);
        QTimer::singleShot(0, &wait, [&wait, &close]() { close(wait); });
        command.init();
        EXPECT_FALSE(wait.isVisible());
        return !results.results.empty();
    }
};

// Escape, the window's close button and the application's exit cancel the test as its Cancel
// button does; the test then returns at once.
TEST_F(ConfigurationTestIntegrity, ClosingTheWaitDialogAnyWayCancelsTheTest)
{
    const std::pair<const char*, std::function<void(Dialog_ConfigurationTestBase&)>> ways[] = {
        {"cancel button", [](Dialog_ConfigurationTestBase& d) { d.cancelButton()->click(); }},
        {"escape",
         [](Dialog_ConfigurationTestBase& d) {
             QKeyEvent escape(QEvent::KeyPress, Qt::Key_Escape, Qt::NoModifier);
             QApplication::sendEvent(&d, &escape);
         }},
        {"close button", [](Dialog_ConfigurationTestBase& d) { d.close(); }},
        {"application quits", [](Dialog_ConfigurationTestBase&) { QCoreApplication::exit(0); }}};
    for (const auto& way : ways)
    {
        SCOPED_TRACE(way.first);
        LogCapture log;
        EXPECT_FALSE(runClosingWaitDialog(way.second));
        EXPECT_TRUE(log.containsSubstring("test was canceled"));
    }
    // The application's exit stays requested until its own loop has run once.
    QMetaObject::invokeMethod(qApp, &QCoreApplication::quit, Qt::QueuedConnection);
    QApplication::exec();
}

// A starter that loses its agent during the test shows the no-agent result. The worker that asks
// it is detached, so it leaves nothing behind once it ends.
TEST_F(ConfigurationTestIntegrity, NoAgentAnswerShowsNoAgent)
{
    m_agent->setTestAnswer(-14, 0);
    ResultDialogAccepter results;
    std::atomic<int> workerDetachState{-1};
    // The worker's own log line is written on the worker's thread.
    const int sink = TesselLog_Static::addSink([&workerDetachState](const TesselLog_Static::Record& record) {
        if (utf8(record.message.c_str()).find("threadMethod_static") == std::string::npos)
            return;
        pthread_attr_t attributes;
        int state = -1;
        if (pthread_getattr_np(pthread_self(), &attributes) == 0)
        {
            pthread_attr_getdetachstate(&attributes, &state);
            pthread_attr_destroy(&attributes);
        }
        workerDetachState = state;
    });
    {
        OnLineUpdateCommand command(QStringLiteral("WC_ONLINEUPDATECOMMAND"));
        command.init();
    }
    TesselLog_Static::removeSink(sink);
    EXPECT_EQ(workerDetachState.load(), PTHREAD_CREATE_DETACHED);
    ASSERT_EQ(results.results.size(), 1u);
    EXPECT_EQ(results.results[0].preparerText, Dialog_OnLineUpdateConfigurationTestResult::defaultPreparerText(-14));
    EXPECT_NE(results.results[0].preparerText, Dialog_OnLineUpdateConfigurationTestResult::defaultPreparerText(-12));
}

// A task whose executable path cannot be made absolute never matches, not even itself.
TEST_F(DialogIntegrityTest, PathsThatCannotBeMadeAbsoluteNeverMatch)
{
    const std::wstring tooLong = L"/opt/" + std::wstring(300, L'a') + L"/agent";
    ScheduledTaskParams params(L"LongPathTask", tooLong.c_str(), L"preparer", L"07", L"30");
    CScheduledTaskHelper helper(params);
    ASSERT_TRUE(helper.createScheduledTask(false));
    const std::wstring otherLong = L"/srv/" + std::wstring(300, L'b') + L"/other";
    ScheduledTaskParams other(L"LongPathTask", otherLong.c_str(), L"preparer", L"07", L"30");
    CScheduledTaskHelper otherHelper(other);
    EXPECT_EQ(otherHelper.checkScheduledTask(), OnlineUpdateCommand_NS::eWRONG_SETTINGS);
    EXPECT_EQ(helper.checkScheduledTask(), OnlineUpdateCommand_NS::eWRONG_SETTINGS);
}
