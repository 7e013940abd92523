#include "ToolConfigurationTestSupport.h"

#include "BBool.h"
#include "BString.h"
#include "CProcStartUpdateAgent.h"
#include "Dialog_OnLineUpdateConfigurationTestResult.h"
#include "LogCapture.h"
#include "ModalDriver.h"
#include "OnLineUpdateCommand.h"
#include "TaskSchedulerSettings.h"
#include "UpdateUpdater.h"

#include <gtest/gtest.h>

#include <QApplication>
#include <QEvent>
#include <QFileDialog>
#include <QPushButton>
#include <QTime>
#include <QTimer>

#include <ace/Thread_Manager.h>

#include <unistd.h>

#include <cctype>
#include <filesystem>
#include <string>
#include <vector>

namespace
{
using Access = ToolConfigurationCommandTestAccess;

const wchar_t* const kWorkshopUri = L"data:/Configuration/MenuBar/WorkshopFile";
const wchar_t* const kUsersUri = L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagParamsFileName";
const wchar_t* const kUpdateUri = L"data:/Configuration/MenuBar/PreparateurConfigFile";
const wchar_t* const kUpdateTmpUri = L"data:/Configuration/MenuBar/PreparateurConfigFileTmp";
const wchar_t* const kActiveUri = L"data:/Auto/SystemMenu/ActivePreparateur";
const wchar_t* const kTaskTimeUri = L"data:/Auto/SystemMenu/TaskTimeEdit";

const char* const kStoredFolder = "/srv/dist";
const char* const kLocalFolder = "/var/local/repo";

// Accepts every configuration-test result dialog as it is shown and counts them.
class ResultDialogAcceptor : public QObject
{
public:
    ResultDialogAcceptor() { qApp->installEventFilter(this); }
    ~ResultDialogAcceptor() override { qApp->removeEventFilter(this); }
    int shown = 0;

protected:
    bool eventFilter(QObject* watched, QEvent* event) override
    {
        if (event->type() != QEvent::Show)
            return false;
        if (auto* result = dynamic_cast<Dialog_OnLineUpdateConfigurationTestResult*>(watched))
        {
            ++shown;
            QTimer::singleShot(0, result, [result]() { result->okButton()->click(); });
        }
        return false;
    }
};

class UpdateModeTest : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_updatePath = m_dir.file("User/OnLineUpdate/Preparateur.xml");
        setConfig(kWorkshopUri, m_dir.file("User/InformationsGarage.xml"));
        setConfig(kUsersUri, m_dir.file("User/FicheDiagParams.xml"));
        setConfig(kUpdateUri, m_updatePath);
        writeWorkshop();
        writeUsers("10.0.0.7");
        writeUpdate("OTHER");
    }

    void TearDown() override
    {
        m_command.reset();
        ACE_Thread_Manager::instance()->wait();
        TaskSchedulerSettings::setTasksFolder(std::string());
        ComponentFixture::TearDown();
    }

    void setConfig(const wchar_t* uri, const std::string& value)
    {
        ASSERT_EQ(m_dataManager->createData(ID(uri), BString(wide(value))), 0);
    }

    static void save(const BSet& set, const std::string& path)
    {
        TempDir::write(path, "");
        ASSERT_TRUE(set.save(wide(path), false)) << path;
    }

    void writeWorkshop()
    {
        BSet set(10);
        set.setString(L"nom", L"Garage");
        save(set, m_dir.file("User/InformationsGarage.xml"));
    }

    void writeUsers(const std::string& ip)
    {
        BSet app2App(10);
        app2App.setString(L"Port", L"8080");
        app2App.setString(L"IP", wide(ip));
        BSet set(10);
        set.setString(L"activation", L"1");
        set.setSet(L"App2App", app2App);
        save(set, m_dir.file("User/FicheDiagParams.xml"));
    }

    void writeUpdate(const std::string& mode)
    {
        BSet set(10);
        set.setBool(L"OnlineUpdateActivated", false);
        set.setString(L"DeploymentMode", wide(mode));
        set.setString(L"DistributionFolderPath", wide(kStoredFolder));
        set.setString(L"LocalDistributionFolderPath", wide(kLocalFolder));
        set.setString(L"UpdateRetrievalTime", L"07:30:00");
        save(set, m_updatePath);
    }

    ToolConfigurationCommand& makeCommand()
    {
        m_command = std::make_unique<ToolConfigurationCommand>(QStringLiteral("WC_TOOLCONFIGURATION"));
        return *m_command;
    }

    UpdateUpdater& store() { return *Access::update(*m_command); }

    static ID controlUri(const std::string& name) { return ID(wide("data:/Auto/SystemMenu/" + name)); }

    bool hasBool(const std::string& name) const
    {
        BBool flag;
        return m_dataManager->getData(controlUri(name), flag) == 0;
    }

    bool publishedBool(const std::string& name) const
    {
        bool value = false;
        EXPECT_EQ(m_dataManager->getBool(controlUri(name), value), 0) << name;
        return value;
    }

    std::vector<bool> radios() const
    {
        return {publishedBool("LocalRadioButton"), publishedBool("A2ARadioButton"), publishedBool("OtherRadioButton")};
    }

    // The "DistributionFolderPath" record as "state|item".
    std::string folder() const
    {
        BSet record(10);
        EXPECT_EQ(m_dataManager->getData(controlUri("DistributionFolderPath"), record), 0);
        long state = -1;
        record.getInt(L"state", state);
        BSet value(10);
        record.getSet(L"value", value);
        ACE_WString item(L"<missing>");
        value.getString(L"item", item);
        return std::to_string(state) + "|" + utf8(item);
    }

    std::string publishedString(const wchar_t* uri) const
    {
        ACE_WString text(L"<missing>");
        m_dataManager->getString(ID(uri), text);
        return utf8(text);
    }

    TempDir m_dir;
    std::string m_updatePath;
    std::unique_ptr<ToolConfigurationCommand> m_command;
};

// ---------------------------------------------------------------------------------------------
// Radio buttons and folder published for the mode of the settings file

struct ModeCase
{
    const char* name;
    const char* mode;
    bool published;
    std::vector<bool> radios;
    std::string folder;
};

class UpdateModeFromFile : public UpdateModeTest, public ::testing::WithParamInterface<ModeCase>
{
};

TEST_P(UpdateModeFromFile, PublishesTheModesRowAndLeavesTheStore)
{
    const ModeCase& c = GetParam();
    writeUpdate(c.mode);
    makeCommand();

    EXPECT_EQ(hasBool("LocalRadioButton"), c.published);
    EXPECT_EQ(hasBool("A2ARadioButton"), c.published);
    EXPECT_EQ(hasBool("OtherRadioButton"), c.published);
    if (c.published)
    {
        EXPECT_EQ(radios(), c.radios);
    }
    EXPECT_EQ(folder(), c.folder);
    EXPECT_EQ(utf8(store().getDistributionFolderPath()), kStoredFolder);
    EXPECT_EQ(utf8(store().getDeploymentMode()), c.mode);
}

INSTANTIATE_TEST_SUITE_P(
    Modes, UpdateModeFromFile,
    ::testing::Values(ModeCase{"Local", "LOCAL", true, {true, false, false}, std::string("2|") + kLocalFolder},
                      ModeCase{"A2A", "A2A", true, {false, true, false}, "2|\\\\10.0.0.7\\TLD_REPOSITORY"},
                      ModeCase{"Other", "OTHER", true, {false, false, true}, std::string("3|") + kStoredFolder},
                      // Other letter cases and unknown modes select nothing; the folder record
                      // of the first publication stays.
                      ModeCase{"LowerLocal", "local", false, {}, std::string("3|") + kStoredFolder},
                      ModeCase{"LowerA2a", "a2a", false, {}, std::string("3|") + kStoredFolder},
                      ModeCase{"LowerOther", "other", false, {}, std::string("3|") + kStoredFolder},
                      ModeCase{"Unknown", "REMOTE", false, {}, std::string("3|") + kStoredFolder}),
    [](const ::testing::TestParamInfo<ModeCase>& info) { return std::string(info.param.name); });

TEST_F(UpdateModeTest, UnknownModeKeepsEarlierRadioStates)
{
    writeUpdate("LOCAL");
    makeCommand();
    writeUpdate("Remote");
    Access::createDMData(*m_command, false);
    EXPECT_EQ(radios(), (std::vector<bool>{true, false, false}));
    EXPECT_EQ(folder(), std::string("3|") + kStoredFolder);
}

// ---------------------------------------------------------------------------------------------
// Radio slots

struct ShareCase
{
    const char* name;
    const char* ip;
    const char* share;
};

class A2ASlot : public UpdateModeTest, public ::testing::WithParamInterface<ShareCase>
{
};

TEST_P(A2ASlot, PublishesAndStoresTheSharePath)
{
    writeUsers(GetParam().ip);
    makeCommand();
    LogCapture log;
    m_command->onA2ARadioButtonClicked();

    EXPECT_TRUE(log.contains("[ToolConfigurationCommand::onA2ARadioButtonClicked] : Method started"));
    EXPECT_EQ(radios(), (std::vector<bool>{false, true, false}));
    EXPECT_EQ(folder(), std::string("2|") + GetParam().share);
    EXPECT_EQ(utf8(store().getDistributionFolderPath()), GetParam().share);
    EXPECT_EQ(utf8(store().getDeploymentMode()), "A2A");
}

INSTANTIATE_TEST_SUITE_P(Addresses, A2ASlot,
                         ::testing::Values(ShareCase{"WithAddress", "10.0.0.7", "\\\\10.0.0.7\\TLD_REPOSITORY"},
                                           ShareCase{"EmptyAddress", "", "\\\\\\TLD_REPOSITORY"}),
                         [](const ::testing::TestParamInfo<ShareCase>& info) { return std::string(info.param.name); });

TEST_F(UpdateModeTest, LocalSlotShowsTheLocalFolderFixedAndKeepsTheStoredFolder)
{
    makeCommand();
    m_command->onLocalRadioButtonClicked();
    EXPECT_EQ(radios(), (std::vector<bool>{true, false, false}));
    EXPECT_EQ(folder(), std::string("2|") + kLocalFolder);
    EXPECT_EQ(utf8(store().getDeploymentMode()), "LOCAL");
    EXPECT_EQ(utf8(store().getDistributionFolderPath()), kStoredFolder);
}

TEST_F(UpdateModeTest, LocalThenOtherShowsTheFolderStoredBefore)
{
    writeUpdate("A2A");
    makeCommand();
    m_command->onLocalRadioButtonClicked();
    m_command->onOtherRadioButtonClicked();
    EXPECT_EQ(radios(), (std::vector<bool>{false, false, true}));
    EXPECT_EQ(folder(), std::string("3|") + kStoredFolder);
    EXPECT_EQ(utf8(store().getDeploymentMode()), "OTHER");
}

TEST_F(UpdateModeTest, A2AThenOtherShowsTheSharePathEditable)
{
    makeCommand();
    m_command->onA2ARadioButtonClicked();
    m_command->onOtherRadioButtonClicked();
    EXPECT_EQ(radios(), (std::vector<bool>{false, false, true}));
    EXPECT_EQ(folder(), "3|\\\\10.0.0.7\\TLD_REPOSITORY");
}

TEST_F(UpdateModeTest, WithoutDataManagerOrStoreEachSlotOnlyLogsItsEntry)
{
    destroyDataManager();
    makeCommand();
    ASSERT_EQ(Access::update(*m_command), nullptr);
    LogCapture log;
    m_command->onLocalRadioButtonClicked();
    m_command->onA2ARadioButtonClicked();
    m_command->onOtherRadioButtonClicked();
    m_command->onDistributionFolderPathChanged(QStringLiteral("/typed"));
    m_command->onCheckInternetChecked(true);
    m_command->onTaskTimeEditChanged(QTime(7, 5, 0));
    m_command->onRecordingModeChecked(true);
    EXPECT_FALSE(Access::recordingMode(*m_command));
    const std::vector<std::string> expected = {
        "[ToolConfigurationCommand::onLocalRadioButtonClicked] : Method started",
        "[ToolConfigurationCommand::onA2ARadioButtonClicked] : Method started",
        "[ToolConfigurationCommand::onOtherRadioButtonClicked] : Method started",
        "[ToolConfigurationCommand::onDistributionFolderPathChanged] : Method started",
        "[ToolConfigurationCommand::onCheckInternetChecked] : Method started",
        "[ToolConfigurationCommand::onTaskTimeEditChanged] : Method started",
        "[ToolConfigurationCommand::onRecordingModeChecked] : Method started"};
    EXPECT_EQ(log.messages(), expected);
}

// ---------------------------------------------------------------------------------------------
// Distribution folder: chooser and typed text

TEST_F(UpdateModeTest, CancelledChooserChangesNothing)
{
    writeUpdate("LOCAL");
    makeCommand();
    const std::string before = folder();
    bool shown = false;
    ModalDriver::whenShown([&shown](QWidget& modal) {
        shown = qobject_cast<QFileDialog*>(&modal) != nullptr;
        modal.close();
    });
    m_command->onFolderBrowserButtonClicked();
    EXPECT_TRUE(shown);
    EXPECT_EQ(folder(), before);
    EXPECT_EQ(utf8(store().getDistributionFolderPath()), kStoredFolder);
}

TEST_F(UpdateModeTest, ChosenFolderIsPublishedEditableWhateverTheMode)
{
    writeUpdate("LOCAL");
    makeCommand();
    const std::string chosen = m_dir.file("Repository");
    std::filesystem::create_directories(chosen);
    QString caption;
    bool dirsOnly = false;
    ModalDriver::whenShown([&](QWidget& modal) {
        auto* dialog = qobject_cast<QFileDialog*>(&modal);
        if (dialog == nullptr)
        {
            modal.close();
            return;
        }
        caption = dialog->windowTitle();
        dirsOnly = dialog->testOption(QFileDialog::ShowDirsOnly);
        dialog->setDirectory(QString::fromStdString(m_dir.path().string()));
        dialog->selectFile(QString::fromStdString(chosen));
        static_cast<QDialog*>(dialog)->accept();
        if (dialog->isVisible())
            dialog->reject();
    });
    m_command->onFolderBrowserButtonClicked();

    EXPECT_EQ(caption, QStringLiteral("Choose a directory"));
    EXPECT_TRUE(dirsOnly);
    EXPECT_EQ(folder(), "3|" + chosen);
    EXPECT_EQ(utf8(store().getDistributionFolderPath()), chosen);
    EXPECT_EQ(utf8(store().getDeploymentMode()), "LOCAL");
}

TEST_F(UpdateModeTest, ChooserOpensWithoutDataManagerOrStore)
{
    destroyDataManager();
    makeCommand();
    bool shown = false;
    ModalDriver::whenShown([&shown](QWidget& modal) {
        shown = true;
        modal.close();
    });
    m_command->onFolderBrowserButtonClicked();
    EXPECT_TRUE(shown);
}

TEST_F(UpdateModeTest, TypedFolderIsTakenEvenEmpty)
{
    makeCommand();
    for (const char* text : {"/typed/folder", ""})
    {
        m_command->onDistributionFolderPathChanged(QString::fromUtf8(text));
        EXPECT_EQ(folder(), std::string("3|") + text);
        EXPECT_EQ(utf8(store().getDistributionFolderPath()), text);
    }
}

// ---------------------------------------------------------------------------------------------
// Task time, check-internet and recording mode

TEST_F(UpdateModeTest, TaskTimeIsStoredAndPublishedWithTwoDigits)
{
    makeCommand();
    const std::vector<std::pair<QTime, std::string>> table = {
        {QTime(7, 5, 0), "07:05:00"}, {QTime(23, 59, 59), "23:59:59"}, {QTime(0, 0, 0), "00:00:00"}};
    for (const auto& row : table)
    {
        m_command->onTaskTimeEditChanged(row.first);
        EXPECT_EQ(utf8(store().getTaskTime()), row.second);
        EXPECT_EQ(publishedString(kTaskTimeUri), row.second);
    }
}

TEST_F(UpdateModeTest, TaskTimeReachesTheDataManagerWithoutStore)
{
    // A settings file that cannot be read leaves the controller without an update store.
    TempDir::write(m_updatePath, "<not xml");
    ASSERT_EQ(m_dataManager->createData(ID(kTaskTimeUri), BString(L"11:00:00")), 0);
    makeCommand();
    ASSERT_FALSE(store().isLoaded());
    m_command->onTaskTimeEditChanged(QTime(7, 5, 0));
    EXPECT_EQ(publishedString(kTaskTimeUri), "07:05:00");
}

TEST_F(UpdateModeTest, ShortTaskTimesMakeInvalidTaskParameters)
{
    makeCommand();
    m_command->onTaskTimeEditChanged(QTime(7, 5, 0));
    const ScheduledTaskParams full = getScheduledTaskParamsFromDM();
    EXPECT_EQ(utf8(full.startHour()), "07");
    EXPECT_EQ(utf8(full.startMinute()), "05");

    // An invalid time publishes the empty text; texts shorter than hh:mm are invalid settings.
    m_command->onTaskTimeEditChanged(QTime());
    EXPECT_EQ(publishedString(kTaskTimeUri), "");
    for (const char* text : {"7", "07", "7:5", "07:", "7:30"})
    {
        ASSERT_EQ(m_dataManager->setData(ID(kTaskTimeUri), BString(wide(text))), 0);
        EXPECT_FALSE(getScheduledTaskParamsFromDM().isValid()) << text;
    }
}

TEST_F(UpdateModeTest, CheckInternetFollowsTheBox)
{
    makeCommand();
    for (bool checked : {true, false, true})
    {
        m_command->onCheckInternetChecked(checked);
        EXPECT_EQ(store().getCheckInternet(), checked);
        EXPECT_EQ(publishedBool("CheckInternet"), checked);
    }
}

TEST_F(UpdateModeTest, RecordingModeKeepsTheValueBeforeEachToggle)
{
    makeCommand();
    ASSERT_FALSE(publishedBool("ASRMChk"));
    m_command->onRecordingModeChecked(true);
    EXPECT_FALSE(Access::recordingMode(*m_command));
    EXPECT_TRUE(publishedBool("ASRMChk"));
    m_command->onRecordingModeChecked(false);
    EXPECT_TRUE(Access::recordingMode(*m_command));
    EXPECT_FALSE(publishedBool("ASRMChk"));

    // A rebuild with reset publishes what the toggle kept.
    Access::createDMData(*m_command, true);
    EXPECT_TRUE(publishedBool("ASRMChk"));
}

// ---------------------------------------------------------------------------------------------
// Configuration test button

class ConfigurationTestButton : public UpdateModeTest
{
protected:
    void SetUp() override
    {
        UpdateModeTest::SetUp();
        TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks"));
        m_manager->destroyComponent(ID(CProcStartUpdateAgent::componentID));
        m_agent = CProcStartUpdateAgent::registerWith(*m_manager);
        ASSERT_NE(m_agent, nullptr);
        m_agent->setTestAnswer(0, 0);
    }

    CProcStartUpdateAgent* m_agent = nullptr;
};

TEST_F(ConfigurationTestButton, SavesTheTemporaryCopyAndMakesItActive)
{
    const std::string tmpPath = m_dir.file("User/OnLineUpdate/PreparateurTmp.xml");
    setConfig(kUpdateTmpUri, tmpPath);
    makeCommand();
    m_command->onDistributionFolderPathChanged(QStringLiteral("/typed/folder"));

    ResultDialogAcceptor acceptor;
    LogCapture log;
    m_command->onConfigurationTestButtonClicked();

    EXPECT_TRUE(log.contains("[ToolConfigurationCommand::onConfigurationTestButtonClicked] : Method started"));
    EXPECT_EQ(acceptor.shown, 1);
    EXPECT_EQ(publishedString(kActiveUri), tmpPath);
    UpdateUpdater copy(wide(tmpPath));
    ASSERT_TRUE(copy.load());
    EXPECT_EQ(utf8(copy.getDistributionFolderPath()), "/typed/folder");
    // The settings file itself is not written.
    UpdateUpdater original(wide(m_updatePath));
    ASSERT_TRUE(original.load());
    EXPECT_EQ(utf8(original.getDistributionFolderPath()), kStoredFolder);

    // A rebuild without reset keeps reading the copy; a reset goes back to the settings file.
    Access::createDMData(*m_command, false);
    EXPECT_EQ(utf8(store().getDistributionFolderPath()), "/typed/folder");
    Access::createDMData(*m_command, true);
    EXPECT_EQ(publishedString(kActiveUri), m_updatePath);
    EXPECT_EQ(utf8(store().getDistributionFolderPath()), kStoredFolder);
}

TEST_F(ConfigurationTestButton, EmptyTemporaryPathFallsBackToTheDefault)
{
    setConfig(kUpdateTmpUri, "");
    makeCommand();

    // The default path is relative: run from a folder two levels down in the test folder.
    const std::filesystem::path work = m_dir.path() / "Apps" / "Bin";
    std::filesystem::create_directories(work);
    std::filesystem::create_directories(m_dir.path() / "Data/User/OnLineUpdate");
    const std::filesystem::path previous = std::filesystem::current_path();
    std::filesystem::current_path(work);

    ResultDialogAcceptor acceptor;
    m_command->onConfigurationTestButtonClicked();
    std::filesystem::current_path(previous);

    EXPECT_EQ(acceptor.shown, 1);
    EXPECT_EQ(publishedString(kActiveUri), "../../Data/User/OnLineUpdate/PreparateurTmp.xml");
    EXPECT_TRUE(std::filesystem::exists(m_dir.path() / "Data/User/OnLineUpdate/PreparateurTmp.xml"));
}

// ---------------------------------------------------------------------------------------------
// IP address normalisation

struct IpCase
{
    const char* in;
    const char* out;
};

class ValidateIP : public UpdateModeTest, public ::testing::WithParamInterface<IpCase>
{
};

TEST_P(ValidateIP, NormalisesEachPart)
{
    makeCommand();
    ACE_WString ip = wide(GetParam().in);
    Access::validateIP(*m_command, ip);
    EXPECT_EQ(utf8(ip), GetParam().out);
}

INSTANTIATE_TEST_SUITE_P(Table, ValidateIP,
                         ::testing::Values(IpCase{"010.001.002.003", "10.1.2.3"}, IpCase{"10.a.0.1", "10.0.0.1"},
                                           IpCase{"1..2", "1.0.2"}, IpCase{"1.", "1.0"}, IpCase{"", "0"},
                                           IpCase{"300.1.1.1", "300.1.1.1"}, IpCase{"1.2", "1.2"},
                                           IpCase{"-5.+7. 8 .9", "-5.7.8.9"}, IpCase{"99999999999.1", "0.1"},
                                           IpCase{"0x10.1", "0.1"}),
                         [](const ::testing::TestParamInfo<IpCase>& info) {
                             std::string name = info.param.in;
                             for (char& ch : name)
                                 if (!std::isalnum(static_cast<unsigned char>(ch)))
                                     ch = '_';
                             return name.empty() ? std::string("Empty") : "In_" + name;
                         });
}
