#include "CScheduledTaskHelper.h"
#include "CronTable.h"
#include "CronUser.h"
#include "DialogDrivers.h"
#include "PControllerFactoryBase.h"
#include "QListViewItem.h"
#include "ScheduledTaskParams.h"
#include "SmartProxy.h"
#include "ToolConfigurationTestSupport.h"
#include "UsersCommand.h"

#include <gtest/gtest.h>

#include <QTime>

#include <pwd.h>
#include <signal.h>
#include <spawn.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <memory>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

extern char** environ;

namespace
{
const User kBrunoChanged{"Bruno Braun", "22 Mill Lane", "0222"};

// The whole dialog on real files: both controllers from the plug-in's factory, the real user
// dialogs and message boxes, and a configuration test.
class EndToEndTest : public ToolConfigurationTest
{
protected:
    void TearDown() override
    {
        m_users.reset();
        m_command.reset();
        m_factory.reset();
        ToolConfigurationTest::TearDown();
        // The cron test's table and backend.
        CronUser::setTable(TaskSchedulerSettings::cronUser(), std::string());
        TaskSchedulerSettings::setBackend(TaskSchedulerSettings::eFiles);
        TaskSchedulerSettings::setCronUser(std::string());
    }

    void openDialog()
    {
        m_users.reset();
        m_command.reset();
        m_factory = std::make_unique<SmartProxy<PControllerFactoryBase>>();
        ASSERT_TRUE(m_factory->acquire(ID(Uri::kFactory)));
        m_command.reset(
            dynamic_cast<ToolConfigurationCommand*>((*m_factory)->getControllerByName(L"WC_TOOLCONFIGURATION"_w)));
        m_users.reset(dynamic_cast<UsersCommand*>((*m_factory)->getControllerByName(L"WC_USERSCOMMAND"_w)));
        ASSERT_NE(m_command, nullptr);
        ASSERT_NE(m_users, nullptr);
        ASSERT_TRUE(m_command->init());
        ASSERT_TRUE(m_users->init());
    }

    // Every kind of field, the users list and a configuration test, as a person would.
    void editEverything()
    {
        ToolConfigurationCommand& tool = *m_command;
        tool.onProjectNumberChanged(QStringLiteral("BN-99"));
        tool.onCompanyNameChanged(QStringLiteral("Garage de la Gare"));
        tool.onNameChanged(QStringLiteral("Żaneta Nowak"));
        tool.onStreetChanged(QStringLiteral("5 avenue Foch"));
        tool.onTownOrPostCodeChanged(QStringLiteral("75016"), QStringLiteral("Paris"));
        tool.onPhoneNumberChanged(QStringLiteral("0111111111"));
        tool.onFaxNumberChanged(QStringLiteral("0122222222"));
        tool.onManufacturerChanged(QStringLiteral("Marque B"));
        tool.onRecordingModeChecked(true);
        tool.onPortChanged(QStringLiteral("9090"));
        tool.onIPAddressChanged(QStringLiteral("010.000.000.042"));
        tool.onDealerIDChanged(QStringLiteral("D88"));
        tool.onOtherRadioButtonClicked();
        tool.onDistributionFolderPathChanged(QStringLiteral("/srv/new"));
        tool.onCheckInternetChecked(true);

        int filled = 0;
        fillEditDialogWhenShown(kLukasz, &filled);
        m_users->onAddClicked();
        const QListViewItem second(qs(kBruno.name), qs(kBruno.address), qs(kBruno.phone));
        fillEditDialogWhenShown(kBrunoChanged, &filled);
        m_users->onModifyClicked(&second);
        EXPECT_EQ(filled, 2);
        const QListViewItem first(qs(kAnna.name), qs(kAnna.address), qs(kAnna.phone));
        ModalDriver::clickButton(QStringLiteral("YES"));
        m_users->onDeleteClicked(&first);
        EXPECT_EQ(publishedUsers(*m_dataManager), (std::vector<User>{kBrunoChanged, kClara, kLukasz}));
        {
            ResultDialogAccepter accepter;
            tool.onConfigurationTestButtonClicked();
            EXPECT_EQ(accepter.results.size(), 1u);
        }
        EXPECT_EQ(text(Uri::kActivePreparateur), m_updateTmpPath);
        // Changed after the test: what is saved must not come from the test's copy.
        tool.onTaskTimeEditChanged(QTime(21, 15, 0));
    }

    std::unique_ptr<SmartProxy<PControllerFactoryBase>> m_factory;
    std::unique_ptr<UsersCommand> m_users;
};

TEST_F(EndToEndTest, EditsThenOkWriteTheFilesAndTheTaskAndAReopenedDialogShowsThem)
{
    openDialog();
    editEverything();
    m_command->onOKButtonClicked();
    EXPECT_EQ(m_mediator->closeCount(), 1);
    EXPECT_EQ(TesselLog_Static::getLevel_static(), 10);
    EXPECT_EQ(text(Uri::kActivePreparateur), m_updatePath);

    ScheduledTaskParams expectedTask(L"VEXAPreparerTask", L"C:/VEXA_Q17/Lib/Application/UpdaterAgent.exe", L"preparer",
                                     L"21", L"15");
    CScheduledTaskHelper helper(expectedTask);
    EXPECT_EQ(helper.checkScheduledTask(), OnlineUpdateCommand_NS::eOK);

    // A second dialog, its records rebuilt from nothing but the files.
    m_users.reset();
    m_command.reset();
    ASSERT_EQ(m_dataManager->removeData(ID(L"data:/Auto/SystemMenu"_w)), 0);
    openDialog();
    const std::pair<const char*, const char*> expected[] = {{"ProjectNumberEdit", "3|BN-99"},
                                                            {"CompanyNameEdit", "3|Garage de la Gare"},
                                                            {"NameEdit", "3|Żaneta Nowak"},
                                                            {"StreetEdit", "3|5 avenue Foch"},
                                                            {"TownPostCodeEdit", "3|75016|Paris"},
                                                            {"PhoneNumberEdit", "3|0111111111"},
                                                            {"FaxNumberEdit", "3|0122222222"},
                                                            {"BrandCombo", "3|Marque B"},
                                                            {"App2AppPort", "3|9090"},
                                                            {"App2AppIP", "3|10.0.0.42"},
                                                            {"App2AppDealerID", "3|D88"},
                                                            {"DistributionFolderPath", "3|/srv/new"}};
    for (const auto& [name, shownText] : expected)
        EXPECT_EQ(shown(name), shownText) << name;
    EXPECT_EQ(SettingsFiles::stringAt(SettingsFiles::read(m_workshopPath), "default_brand"), "2");
    EXPECT_TRUE(flag("CheckInternet"));
    EXPECT_EQ(radios(), "001");
    EXPECT_EQ(text(Uri::kTaskTime), "21:15:00");
    EXPECT_EQ(SettingsFiles::usersIn(m_usersPath), (std::vector<User>{kBrunoChanged, kClara, kLukasz}));
    EXPECT_EQ(publishedUsers(*m_dataManager), (std::vector<User>{kBrunoChanged, kClara, kLukasz}));
}

TEST_F(EndToEndTest, EditsThenCancelLeaveTheFilesUnchangedAndShowThemAgain)
{
    const std::string paths[] = {m_workshopPath, m_usersPath, m_updatePath};
    const std::string before = TempDir::read(paths[0]) + TempDir::read(paths[1]) + TempDir::read(paths[2]);
    openDialog();
    editEverything();
    m_command->onCancelButtonClicked();

    EXPECT_EQ(m_mediator->closeCount(), 1);
    EXPECT_EQ(TempDir::read(paths[0]) + TempDir::read(paths[1]) + TempDir::read(paths[2]), before);
    EXPECT_EQ(shown("NameEdit") + " " + shown("App2AppIP"), "3|Garage Ünal 3|10.0.0.7");
    EXPECT_TRUE(flag("LocalRadioButton"));
    EXPECT_EQ(text(Uri::kActivePreparateur), m_updatePath);
    EXPECT_EQ(publishedUsers(*m_dataManager), (std::vector<User>{kAnna, kBruno, kClara}));

    // OK then saves what the files hold, not the cancelled edits.
    m_command->onOKButtonClicked();
    EXPECT_EQ(SettingsFiles::usersIn(m_usersPath), (std::vector<User>{kAnna, kBruno, kClara}));
    EXPECT_EQ(app2AppIn(m_usersPath), "8080 10.0.0.7 D77");
}

namespace
{
// A cron daemon of the test's own when none runs; only that one is stopped, by its pid.
class CronDaemon
{
public:
    CronDaemon()
    {
        if (CronTable::daemonRunning())
            return;
        char* argv[] = {const_cast<char*>("cron"), const_cast<char*>("-f"), nullptr};
        if (posix_spawnp(&m_pid, "cron", nullptr, nullptr, argv, environ) != 0)
            m_pid = 0;
    }
    ~CronDaemon()
    {
        if (m_pid <= 0)
            return;
        ::kill(m_pid, SIGTERM);
        int status = 0;
        ::waitpid(m_pid, &status, 0);
    }
    CronDaemon(const CronDaemon&) = delete;
    CronDaemon& operator=(const CronDaemon&) = delete;

private:
    pid_t m_pid = 0;
};

// The task layer's lines in the table.
size_t taskLines(const std::string& table, std::string* first = nullptr)
{
    std::istringstream in(table);
    size_t count = 0;
    for (std::string line; std::getline(in, line);)
        if (line.find(CronTable::kMarker) != std::string::npos && count++ == 0 && first != nullptr)
            *first = line;
    return count;
}
}

// OK with online updates on schedules the demo agent in cron, which runs it at that minute; OK
// with updates off takes the line out again. The one test that waits: for the agent's log, 90 s.
TEST_F(EndToEndTest, OkSchedulesTheAgentInCronAndItRuns)
{
    std::string why;
    const std::string user = CronUser::name(why);
    if (user.empty())
        GTEST_SKIP() << why;
    TaskSchedulerSettings::setBackend(TaskSchedulerSettings::eCron);
    TaskSchedulerSettings::setCronUser(user);
    const CronDaemon daemon;
    for (int i = 0; i < 100 && !CronTable::daemonRunning(); ++i)
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    ASSERT_TRUE(CronTable::daemonRunning());
    // Cron sees a changed table by its folder's time in whole seconds: a change in the second of
    // the last one (a previous test's) or of the daemon's reading would go unseen.
    std::this_thread::sleep_for(std::chrono::milliseconds(1100));

    // The agent and its log folder, where the test user can run and write.
    const std::filesystem::path agent = m_dir.path() / "Agent" / "update-agent.sh";
    const std::filesystem::path log = m_dir.path() / "Logs" / "update-agent.log";
    std::filesystem::create_directories(agent.parent_path());
    std::filesystem::create_directories(log.parent_path());
    std::filesystem::copy_file(PTC_DEMO_DIR "/Agent/update-agent.sh", agent);
    const passwd* entry = getpwnam(user.c_str());
    ASSERT_NE(entry, nullptr);
    ASSERT_EQ(::chmod(m_dir.path().c_str(), 0755), 0);
    ASSERT_EQ(::chown(log.parent_path().c_str(), entry->pw_uid, entry->pw_gid), 0);
    setConfig(Uri::kExecutablePath, agent.string());

    // The next minute, or the one after when this one is nearly over.
    const QTime now = QTime::currentTime();
    const QTime start = QTime(now.hour(), now.minute()).addSecs(now.second() < 50 ? 60 : 120);
    openDialog();
    m_command->onCheckInternetChecked(true);
    m_command->onTaskTimeEditChanged(start);
    m_command->onOKButtonClicked();
    std::string line;
    EXPECT_EQ(taskLines(CronUser::table(user), &line), 1u);
    EXPECT_EQ(line.find(std::to_string(start.minute()) + " " + std::to_string(start.hour()) + " * * * '" +
                        agent.string() + "' 'preparer'"),
              0u)
        << line;

    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(90);
    while (!std::filesystem::exists(log) && std::chrono::steady_clock::now() < deadline)
        std::this_thread::sleep_for(std::chrono::milliseconds(500));
    EXPECT_NE(TempDir::read(log.string()).find("preparer ran"), std::string::npos) << "no run of the agent in 90 s";

    openDialog();
    m_command->onCheckInternetChecked(false);
    m_command->onOKButtonClicked();
    EXPECT_EQ(taskLines(CronUser::table(user)), 0u);
}
}
