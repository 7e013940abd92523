#include "ToolConfigurationTestSupport.h"

#include "BEvent.h"
#include "CScheduledTaskHelper.h"
#include "EventRegistry.h"
#include "LogCapture.h"
#include "ModalDriver.h"
#include "OnLineUpdateCommand.h"
#include "ScheduledTaskParams.h"

#include <gtest/gtest.h>

#include <QFileDialog>
#include <QTime>

#include <filesystem>
#include <map>
#include <string>
#include <vector>

namespace
{
using Access = ToolConfigurationCommandTestAccess;
using Publication = ToolConfigurationTest;

const char* const kDefaultUpdatePath = "../../Data/User/OnLineUpdate/Preparateur.xml";
const wchar_t* const kIniUri = L"data:/Configuration/MarvaneNet/Applet/ConfHF";
const wchar_t* const kCountry = L"data:/Configuration/DoC/SoftInformation/InstallCountry";
const wchar_t* const kVersion = L"data:/Configuration/DoC/SoftInformation/Version";
const wchar_t* const kFormation = L"data:/Configuration/DoC/SoftInformation/VersionFormation";

TEST_F(Publication, RecordsShowTheFilesTheConfigurationAndTheIniFile)
{
    BSet update;
    update.setBool(L"OnlineUpdateActivated"_w, true);
    update.setString(L"DeploymentMode"_w, L"OTHER"_w);
    update.setString(L"DistributionFolderPath"_w, L"/srv/dist"_w);
    SettingsFiles::save(update, m_updatePath);
    const std::string ini = m_dir.file("Applet/conf_hf.ini");
    TempDir::write(ini, "[TEST]\nFlag_HF=1\nNetWork=192.168.1.4\n[REPROGRAMMATION]\nNom_Browser1=viewer\n");
    m_text->setText(L"3"_w, wide("Three \xF0\x9D\x84\x9E"));
    setConfig(kIniUri, ini);
    setConfig(kVersion, "V#3");
    setConfig(kFormation, "F1");
    setConfig(L"data:/Configuration/MenuBar/ToolConfigData/DiagnosticURL", "http://diag");
    ToolConfigurationCommand& command = makeCommand();
    const std::pair<const char*, const char*> expected[] = {{"ProjectNumberEdit", "3|BN-42"},
                                                            {"CompanyNameEdit", "3|Garage du Pont"},
                                                            {"NameEdit", "3|Garage Ünal"},
                                                            {"StreetEdit", "3|1 rue Haute"},
                                                            {"TownPostCodeEdit", "3|69001|Lyon"},
                                                            {"PhoneNumberEdit", "3|0102030405"},
                                                            {"FaxNumberEdit", "3|0607080910"},
                                                            {"DistributionFolderPath", "3|/srv/dist"},
                                                            {"App2AppPort", "3|8080"},
                                                            {"App2AppIP", "3|10.0.0.7"},
                                                            {"App2AppDealerID", "3|D77"},
                                                            {"BrandCombo", "3|Marque A"},
                                                            {"SerialNo", "19|Three \xF0\x9D\x84\x9E F1"},
                                                            {"HFconnection", "19|1"},
                                                            {"IPaddress", "19|192.168.1.4"},
                                                            {"Navigator1", "19|viewer"},
                                                            {"Navigator2", "19|"},
                                                            {"DiagURL", "19|http://diag"}};
    for (const auto& [name, shownText] : expected)
        EXPECT_EQ(shown(name), shownText) << name;
    EXPECT_TRUE(flag("CheckInternet"));
    EXPECT_FALSE(flag("ASRMChk"));
    EXPECT_EQ(text(Uri::kActivePreparateur), m_updatePath);
    EXPECT_EQ(Access::app2AppIP(command), "10.0.0.7");

    // No version texts: the separator alone; no ini file: empty fields.
    m_dataManager->removeData(ID(kVersion));
    m_dataManager->removeData(ID(kFormation));
    setConfig(kIniUri, m_dir.file("missing.ini"));
    Access::createDMData(command, false);
    EXPECT_EQ(shown("SerialNo"), "19| ");
    EXPECT_EQ(shown("IPaddress"), "19|");
}

TEST_F(Publication, DisplayOnlyTextsNamingATextAreTranslated)
{
    // Value (null: absent), text id and text (null: none), record shown.
    const char* const cases[][4] = {{"abc#12", "12", "Frankreich", "19|Frankreich"},
                                    {"abc#13", nullptr, nullptr, "19|abc"},  // no such text: the part before '#'
                                    {"France", "France", "no", "19|France"}, // no '#': never looked up
                                    {nullptr, nullptr, nullptr, "19|"}};
    for (const auto& c : cases)
    {
        SCOPED_TRACE(c[0] != nullptr ? c[0] : "absent");
        if (c[0] != nullptr)
            setConfig(kCountry, c[0]);
        else
            m_dataManager->removeData(ID(kCountry));
        if (c[1] != nullptr)
            m_text->setText(wide(c[1]), wide(c[2]));
        makeCommand();
        EXPECT_EQ(shown("Country"), c[3]);
    }
}

TEST_F(Publication, WithoutTheTextComponentTextsStayRawAndNoBrandListIsPublished)
{
    setConfig(L"data:/Configuration/DoC/SoftInformation/InstallLanguage", "Deutsch#40");
    makeUnreachable(ID(CBText::componentID));
    makeCommand();
    EXPECT_EQ(shown("Language"), "19|Deutsch#40");
    EXPECT_FALSE(has("BrandCombo"));
}

TEST_F(Publication, BrandItemsArePaddedAndSortedAndTheStoredDefaultIsSelected)
{
    BSet brands;
    for (const char* key : {"2", "10", "1", "0005", "7"})
        brands.setString(wide(key), wide(std::string("label ") + key));
    ASSERT_EQ(m_dataManager->createData(ID(Uri::kBrands), brands), 0);
    m_text->setText(L"1"_w, L"One"_w);
    m_text->setText(L"2"_w, L"Two"_w);
    m_text->setText(L"10"_w, L"Ten"_w);
    ToolConfigurationCommand& command = makeCommand();
    // Labels come from the texts, defaulting to the label under the padded key: only "0005" has one.
    EXPECT_EQ(brandItems(), "0001=One 0002=Two 0005=label 0005 0007= 0010=Ten ");
    EXPECT_EQ(shown("BrandCombo"), "3|One");
    EXPECT_EQ(utf8(Access::workshop(command)->getDefaultBrand()), "One");

    SettingsFiles::writeWorkshop(m_workshopPath, {{"nom", "Garage"}, {"default_brand", "10"}});
    Access::createDMData(command, false);
    EXPECT_EQ(shown("BrandCombo"), "3|Ten");

    ASSERT_EQ(m_dataManager->removeData(ID(Uri::kBrands)), 0);
    Access::createDMData(command, false);
    EXPECT_EQ(brandItems(), "");
    EXPECT_EQ(shown("BrandCombo"), "3|");
}

// A settings file ('w'orkshop, 'u'sers, u'p'date) that is missing or malformed.
struct BrokenFileCase
{
    const char* label;
    char file;
    bool malformed; // else missing; publication stops only at a malformed file
};

class BrokenFile : public ToolConfigurationTest, public ::testing::WithParamInterface<BrokenFileCase>
{};

TEST_P(BrokenFile, PublicationStopsAtAStoreThatIsNotLoadedAndOkNeverOverwritesAMalformedFile)
{
    const BrokenFileCase& c = GetParam();
    const std::string path = c.file == 'w' ? m_workshopPath : c.file == 'u' ? m_usersPath : m_updatePath;
    const std::string broken = "<set><string key=\"nom\">unterminated";
    std::filesystem::remove(path);
    if (c.malformed)
        TempDir::write(path, broken);
    ToolConfigurationCommand& command = makeCommand();

    // Every store is made whatever the others hold; publication stops at one not loaded.
    ASSERT_TRUE(Access::workshop(command) && Access::users(command) && Access::update(command));
    for (const char* name : {"ProjectNumberEdit", "App2AppIP", "BrandCombo", "TaskTimeEdit"})
        EXPECT_EQ(has(name), !c.malformed) << name;
    EXPECT_TRUE(has("ActivePreparateur"));
    const bool workshopMissing = c.file == 'w' && !c.malformed;
    if (workshopMissing)
    {
        EXPECT_EQ(shown("NameEdit"), "3|");
    }
    // The task time reaches the data manager with or without an update store; no time, no text.
    ASSERT_EQ(m_dataManager->createData(ID(Uri::kTaskTime), BString()), 0);
    command.onTaskTimeEditChanged(QTime(7, 5, 0));
    EXPECT_EQ(text(Uri::kTaskTime), "07:05:00");
    if (!c.malformed)
    {
        EXPECT_EQ(utf8(update().getTaskTime()), "07:05:00");
    }
    command.onTaskTimeEditChanged(QTime());
    EXPECT_EQ(text(Uri::kTaskTime), "");

    command.onNameChanged(QStringLiteral("Neu"));
    command.onOKButtonClicked();
    if (c.malformed)
    {
        EXPECT_EQ(TempDir::read(path), broken);
    }
    if (workshopMissing)
    {
        EXPECT_EQ(SettingsFiles::stringAt(SettingsFiles::read(path), "nom"), "Neu");
    }
}

INSTANTIATE_TEST_SUITE_P(Files, BrokenFile,
                         ::testing::Values(BrokenFileCase{"WorkshopMissing", 'w', false},
                                           BrokenFileCase{"WorkshopMalformed", 'w', true},
                                           BrokenFileCase{"UsersMalformed", 'u', true},
                                           BrokenFileCase{"UpdateMalformed", 'p', true}),
                         [](const auto& info) { return std::string(info.param.label); });

TEST_F(Publication, AFailedRebuildKeepsWhatWasPublished)
{
    ToolConfigurationCommand& command = makeCommand();
    TempDir::write(m_workshopPath, "not xml at all");
    Access::createDMData(command, false);
    EXPECT_EQ(shown("NameEdit"), "3|Garage Ünal");
    // The other stores are still made afresh from their files.
    EXPECT_TRUE(Access::users(command)->isLoaded() && Access::update(command)->isLoaded());
    EXPECT_FALSE(Access::workshop(command)->isLoaded());
}

TEST_F(Publication, AResetWithoutAConfiguredSettingsPathMakesTheDefaultOneActive)
{
    ToolConfigurationCommand& command = makeCommand();
    setConfig(Uri::kUpdateFile, "");
    Access::createDMData(command, true);
    EXPECT_EQ(text(Uri::kActivePreparateur), kDefaultUpdatePath);
    EXPECT_FALSE(update().isLoaded());
}

struct InitCase
{
    const char* label;
    const wchar_t* unreachable;
    const char* message; // null: init succeeds
    int reached;         // steps done: registration, message boxes, texts, update agent
};

class Init : public ToolConfigurationTest, public ::testing::WithParamInterface<InitCase>
{};

TEST_P(Init, StopsAtTheFirstMissingPieceAndTheDestructorUnregisters)
{
    const InitCase& c = GetParam();
    if (c.unreachable != nullptr)
        makeUnreachable(ID(c.unreachable));
    ToolConfigurationCommand& command = makeCommand();

    LogCapture log;
    EXPECT_EQ(command.init(), c.message == nullptr);
    EXPECT_TRUE(c.message == nullptr || log.contains(c.message)) << c.message;
    EXPECT_EQ(command.isRegistered(), c.reached >= 1);
    EXPECT_EQ(EventRegistry::instance().isRegistered(typeid(CustomEvent).name(),
                                                     static_cast<Handler<CustomEvent>*>(&command),
                                                     ToolConfigurationCommand::m_ID),
              c.reached >= 1);
    EXPECT_EQ(Access::updateAgentAcquired(command), c.reached == 4);

    m_command.reset();
    EXPECT_EQ(log.contains("[ToolConfigurationCommand::~ToolConfigurationCommand] : Failed to unregister for "
                           "CustomEvent."),
              c.reached == 0);
    EXPECT_EQ(BEvent<CustomEvent>::post(ToolConfigurationCommand::m_ID, CustomEvent(668, wide(m_workshopPath))), 0);
}

INSTANTIATE_TEST_SUITE_P(
    Steps, Init,
    ::testing::Values(InitCase{"AllPresent", nullptr, nullptr, 4},
                      InitCase{"NoWatcher", CQ17FileSystemWatcher::componentID,
                               "[ToolConfigurationCommand::init()] : Failed to get proxy to Q17FilSystemWatcher.", 0},
                      InitCase{"NoMessageBoxManager", CMessageBoxManager::componentID,
                               "[ToolConfigurationCommand::init()] Message Box Manager cannot be initialized.", 1},
                      InitCase{"NoText", CBText::componentID,
                               "[ToolConfigurationCommand::init()] BText cannot be initialized.", 2},
                      InitCase{"NoUpdateAgent", CProcStartUpdateAgent::componentID,
                               "[ToolConfigurationCommand::init()] Cannot get proxy to ProcStartUpdateAgent.", 3}),
    [](const auto& info) { return std::string(info.param.label); });

// File-changed events, named by the path they carry.
struct EventCase
{
    const char* path;
    int type;
    bool rebuilt;
};

class FileEvent : public ToolConfigurationTest, public ::testing::WithParamInterface<EventCase>
{};

TEST_P(FileEvent, RebuildsForTheSettingsFilesAndListsTheUsersAgainForTheUsersFile)
{
    const EventCase& c = GetParam();
    const std::map<std::string, std::string> paths = {{"Workshop", m_workshopPath},
                                                      {"Users", m_usersPath},
                                                      {"DefaultUpdate", kDefaultUpdatePath},
                                                      {"Other", m_dir.file("Data/User/Other.xml")}};
    // The watcher comes from its library, as in the host.
    destroyComponent(ID(CQ17FileSystemWatcher::componentID));
    ToolConfigurationCommand& command = makeCommand();
    // Changed before init, so the watcher never reports them itself.
    SettingsFiles::writeWorkshop(m_workshopPath, {{"nom", "Renamed"}});
    SettingsFiles::App2App app2App;
    app2App.port = "9090";
    SettingsFiles::writeUsers(m_usersPath, {kLukasz}, app2App);
    ASSERT_EQ(m_dataManager->createData(ID(Uri::kUserSet), BSet()), 0);
    ASSERT_TRUE(command.init());
    // The default update path stands in for an empty configured one.
    if (std::string(c.path) == "DefaultUpdate")
        setConfig(Uri::kUpdateFile, "");

    EXPECT_EQ(BEvent<CustomEvent>::post(ToolConfigurationCommand::m_ID, CustomEvent(c.type, wide(paths.at(c.path)))),
              1);
    EXPECT_EQ(shown("NameEdit"), c.rebuilt ? "3|Renamed" : "3|Garage Ünal");
    EXPECT_EQ(shown("App2AppPort"), c.rebuilt ? "3|9090" : "3|8080");
    const bool usersFile = std::string(c.path) == "Users" && c.type == 668;
    EXPECT_EQ(publishedUsers(*m_dataManager), usersFile ? std::vector<User>{kLukasz} : std::vector<User>{});
}

INSTANTIATE_TEST_SUITE_P(Paths, FileEvent,
                         ::testing::Values(EventCase{"Workshop", 668, true}, EventCase{"Users", 668, true},
                                           EventCase{"DefaultUpdate", 668, true}, EventCase{"Other", 668, false},
                                           EventCase{"Users", 667, false}),
                         [](const auto& info) {
                             return std::string(info.param.path) + std::to_string(info.param.type);
                         });

using Command = ToolConfigurationCommand;

const char* const kFolder = "DistributionFolderPath";
const std::string kShare = "\\\\10.0.0.7\\TLD_REPOSITORY";

using UpdateModeTest = ToolConfigurationTest;

TEST_F(UpdateModeTest, ModeOfTheFileAndRadioButtonsSelectTheFolderShown)
{
    using Click = void (Command::*)();
    const Click local = &Command::onLocalRadioButtonClicked;
    const Click a2a = &Command::onA2ARadioButtonClicked;
    const Click other = &Command::onOtherRadioButtonClicked;
    const struct
    {
        const char* fileMode;
        std::vector<Click> clicks;
        const char* radios; // Local, A2A, Other
        std::string folder;
        const char* mode;
        std::string stored;
    } cases[] = {{"LOCAL", {}, "100", "2|/var/local/repo", "LOCAL", "/srv/dist"},
                 {"A2A", {}, "010", "2|" + kShare, "A2A", "/srv/dist"},
                 {"OTHER", {}, "001", "3|/srv/dist", "OTHER", "/srv/dist"},
                 // Unknown modes (letter case counts) keep the buttons from before (LOCAL).
                 {"local", {}, "100", "3|/srv/dist", "local", "/srv/dist"},
                 {"OTHER", {local}, "100", "2|/var/local/repo", "LOCAL", "/srv/dist"},
                 {"OTHER", {a2a}, "010", "2|" + kShare, "A2A", kShare},
                 {"OTHER", {a2a, other}, "001", "3|" + kShare, "OTHER", kShare}};
    for (const auto& c : cases)
    {
        SCOPED_TRACE(std::string(c.fileMode) + " then " + std::to_string(c.clicks.size()) + " clicks to " + c.mode);
        SettingsFiles::writeUpdate(m_updatePath);
        Command& command = makeCommand();
        SettingsFiles::Update update;
        update.mode = c.fileMode;
        SettingsFiles::writeUpdate(m_updatePath, update);
        Access::createDMData(command, false);
        for (const Click click : c.clicks)
            (command.*click)();
        EXPECT_EQ(radios(), c.radios);
        EXPECT_EQ(shown(kFolder), c.folder);
        EXPECT_EQ(utf8(this->update().getDeploymentMode()), c.mode);
        EXPECT_EQ(utf8(this->update().getDistributionFolderPath()), c.stored);
    }
}

TEST_F(UpdateModeTest, ChosenFolderIsPublishedEditableWhateverTheMode)
{
    Command& command = makeCommand();
    bool opened = false;
    ModalDriver::whenShown([&opened](QWidget& modal) {
        opened = qobject_cast<QFileDialog*>(&modal) != nullptr;
        modal.close();
    });
    command.onFolderBrowserButtonClicked();
    EXPECT_TRUE(opened);
    EXPECT_EQ(shown(kFolder), "2|/var/local/repo");

    const std::string chosen = m_dir.file("Repository");
    std::filesystem::create_directories(chosen);
    ModalDriver::whenShown([&](QWidget& modal) {
        auto* dialog = qobject_cast<QFileDialog*>(&modal);
        if (dialog == nullptr)
        {
            modal.close();
            return;
        }
        // Answers as the dialog itself does on accept: the selection, then the result.
        emit dialog->fileSelected(QString::fromStdString(chosen));
        static_cast<QDialog*>(dialog)->done(QDialog::Accepted);
    });
    command.onFolderBrowserButtonClicked();
    EXPECT_EQ(shown(kFolder), "3|" + chosen);
    EXPECT_EQ(utf8(update().getDistributionFolderPath()), chosen);
    EXPECT_EQ(utf8(update().getDeploymentMode()), "LOCAL");
}

TEST_F(UpdateModeTest, WithoutTheDataManagerSlotsChangeNothing)
{
    // No library holds the data manager: once destroyed, it cannot be reached again.
    destroyDataManager();
    Command& command = makeCommand();
    // The stores come from the default paths: an empty workshop, no users or update file.
    WorkshopInfoUpdater* workshop = Access::workshop(command);
    ASSERT_TRUE(workshop->isLoaded());
    EXPECT_FALSE(Access::users(command)->isLoaded());
    EXPECT_FALSE(Access::update(command)->isLoaded());

    ModalDriver::whenShown([](QWidget& modal) { modal.close(); });
    command.onNameChanged(QStringLiteral("Other"));
    command.onTownOrPostCodeChanged(QStringLiteral("1"), QStringLiteral("2"));
    command.onIPAddressChanged(QStringLiteral("1.2.3.4"));
    command.onLocalRadioButtonClicked();
    command.onA2ARadioButtonClicked();
    command.onOtherRadioButtonClicked();
    command.onDistributionFolderPathChanged(QStringLiteral("/typed"));
    command.onCheckInternetChecked(true);
    command.onTaskTimeEditChanged(QTime(7, 5, 0));
    command.onRecordingModeChecked(true);
    command.onFolderBrowserButtonClicked();
    EXPECT_EQ(utf8(workshop->getName() + workshop->getTown()), "");
    EXPECT_EQ(Access::app2AppValue(command, "App2AppIP"), "<missing>");
    EXPECT_FALSE(Access::recordingMode(command));
}

using CommitTest = ToolConfigurationTest;

bool taskExists()
{
    ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    CScheduledTaskHelper helper(params);
    bool exists = false;
    bool denied = false;
    EXPECT_TRUE(helper.checkTaskAvailableForCurrentUser(exists, denied));
    return exists;
}

TEST_F(CommitTest, RecordingModeFollowsTheBoxAndOkSetsTheLogLevelFromIt)
{
    ASSERT_EQ(m_dataManager->createData(control("ASRMChk"), BBool(true)), 0);
    ToolConfigurationCommand& command = makeCommand();
    EXPECT_TRUE(Access::recordingMode(command));
    EXPECT_TRUE(flag("ASRMChk"));
    // A toggle remembers the value from before it; a reset publishes the remembered value.
    command.onRecordingModeChecked(false);
    EXPECT_TRUE(Access::recordingMode(command));
    EXPECT_FALSE(flag("ASRMChk"));
    command.onRecordingModeChecked(true);
    EXPECT_FALSE(Access::recordingMode(command));
    EXPECT_TRUE(flag("ASRMChk"));
    Access::createDMData(command, true);
    EXPECT_FALSE(flag("ASRMChk"));

    // OK takes the box as it is and closes the dialog.
    TesselLog_Static::setLevel_static(0);
    ASSERT_EQ(m_dataManager->setBool(control("ASRMChk"), true), 0);
    command.onOKButtonClicked();
    EXPECT_EQ(TesselLog_Static::getLevel_static(), 10);
    EXPECT_TRUE(Access::recordingMode(command));
    EXPECT_EQ(m_mediator->closeCount(), 1);
}

TEST_F(CommitTest, OkWritesThePublishedUsersInPlaceOfTheOldOnes)
{
    SettingsFiles::writeUsers(m_usersPath,
                              {kAnna, kBruno, kClara, {"Dora", "4 Road", "0404"}, {"Emil", "5 Road", "0505"}});
    ToolConfigurationCommand& command = makeCommand();
    makeUnreachable(ID(CMediator::componentID)); // OK saves without a mediator
    BSet published;
    const User noName{"", "no name", "0000"}; // not written
    const User clara{"Clara", "", ""};
    std::vector<User> users{kLukasz, noName, clara};
    for (int n = 3; n < 12; ++n) // keys of two digits too
        users.push_back({"User " + std::to_string(n), "", ""});
    for (const User& user : users)
    {
        BSet entry;
        entry.setString(L"name"_w, wide(user.name));
        entry.setString(L"address"_w, wide(user.address));
        entry.setString(L"phone"_w, wide(user.phone));
        published.setSet(wide("User#" + std::to_string(published.size())), entry);
    }
    ASSERT_EQ(m_dataManager->createData(ID(Uri::kUserSet), published), 0);
    command.onOKButtonClicked();
    std::vector<User> expected{kLukasz, clara};
    expected.insert(expected.end(), users.begin() + 3, users.end());
    EXPECT_EQ(SettingsFiles::usersIn(m_usersPath), expected);
}

TEST_F(CommitTest, App2AppEditsAreSavedOnOkWithTheAddressNormalisedAndShownAgainWhenChanged)
{
    const struct
    {
        const char* typed;
        const char* saved;
    } cases[] = {{"010.001.002.003", "10.1.2.3"}, {"192.168.1.20", "192.168.1.20"}, {"10.a.0.1", "10.0.0.1"}};
    for (const auto& c : cases)
    {
        SCOPED_TRACE(c.typed);
        ToolConfigurationCommand& command = makeCommand();
        command.onPortChanged(QStringLiteral("9090"));
        command.onIPAddressChanged(QString::fromUtf8(c.typed));
        command.onDealerIDChanged(QString());
        EXPECT_EQ(shown("App2AppPort") + " " + shown("App2AppIP") + " " + shown("App2AppDealerID"),
                  std::string("3|9090 3|") + c.typed + " 3|");
        // Before OK the edits wait in the cache; the share address and the store keep the file's.
        EXPECT_EQ(Access::app2AppValue(command, "App2AppIP"), c.typed);
        EXPECT_EQ(Access::app2AppIP(command) + " " + utf8(Access::users(command)->getApp2AppIP()), "10.0.0.7 10.0.0.7");
        // A marker state: a republication writes the editable state 3 again.
        BSet marked = record("App2AppIP");
        marked.setInt(L"state"_w, 19);
        ASSERT_EQ(m_dataManager->setData(control("App2AppIP"), marked), 0);

        command.onOKButtonClicked();
        EXPECT_EQ(app2AppIn(m_usersPath), std::string("9090 ") + c.saved + " ");
        const bool changed = std::string(c.typed) != c.saved;
        EXPECT_EQ(shown("App2AppIP"), (changed ? "3|" : "19|") + std::string(changed ? c.saved : c.typed));
        EXPECT_EQ(Access::app2AppValue(command, "App2AppIP"), c.typed);
        SettingsFiles::writeUsers(m_usersPath, {kAnna, kBruno, kClara});
    }
}

TEST_F(CommitTest, OkSavesTheOnlineUpdateSettingAndMakesTheTaskFollowIt)
{
    ToolConfigurationCommand& command = makeCommand();
    for (const bool enabled : {true, false})
    {
        SCOPED_TRACE(enabled);
        command.onCheckInternetChecked(enabled);
        EXPECT_EQ(flag("CheckInternet"), enabled);
        command.onOKButtonClicked();
        EXPECT_EQ(taskExists(), enabled);
        bool saved = !enabled;
        SettingsFiles::read(m_updatePath).getBool(L"OnlineUpdateActivated"_w, saved);
        EXPECT_EQ(saved, enabled);
    }
}

TEST_F(CommitTest, AFailedWorkshopSaveStillSavesTheOtherFilesAndCloses)
{
    // The workshop file in a folder of its own, which a file then takes the place of.
    setConfig(Uri::kWorkshopFile, m_dir.file("Garage/InformationsGarage.xml"));
    SettingsFiles::writeWorkshop(m_dir.file("Garage/InformationsGarage.xml"), {{"nom", "Garage"}});
    ToolConfigurationCommand& command = makeCommand();
    std::filesystem::remove_all(m_dir.path() / "Garage");
    TempDir::write(m_dir.file("Garage"), "in the way");
    command.onNameChanged(QStringLiteral("Lost"));
    command.onPortChanged(QStringLiteral("7070"));
    command.onCheckInternetChecked(true);
    LogCapture log;

    command.onOKButtonClicked();
    EXPECT_TRUE(log.contains("[ToolConfigurationCommand::onOKButtonClicked] : Cannot save workshop data!",
                             TesselLog_Static::eWARNING));
    EXPECT_EQ(app2AppIn(m_usersPath), "7070 10.0.0.7 D77");
    EXPECT_TRUE(taskExists());
    EXPECT_EQ(m_mediator->closeCount(), 1);
}

// The users list is published once by Cancel and once by a change of the users file.
TEST_F(Publication, CancelAndAChangedUsersFilePublishTheUsersOnce)
{
    ToolConfigurationCommand& command = makeCommand();
    ASSERT_TRUE(command.init());
    int userSetWrites = 0;
    const int listener =
        m_dataManager->addListener([&userSetWrites](const ID& uri) { userSetWrites += uri == ID(Uri::kUserSet); });
    command.onCancelButtonClicked();
    EXPECT_EQ(userSetWrites, 1);
    EXPECT_EQ(BEvent<CustomEvent>::post(ToolConfigurationCommand::m_ID, CustomEvent(668, wide(m_usersPath))), 1);
    EXPECT_EQ(userSetWrites, 2);
    m_dataManager->removeListener(listener);
    EXPECT_EQ(publishedUsers(*m_dataManager), (std::vector<User>{kAnna, kBruno, kClara}));
}

// The file: 'w'orkshop, 'u'sers or u'p'date.
class OwnSave : public ToolConfigurationTest, public ::testing::WithParamInterface<char>
{};

// The watcher's reports of OK's own save leave the dialog as it is; an outside edit of the same
// file rebuilds it, and so does a later return to the saved content.
TEST_P(OwnSave, ReportOfOwnSaveRebuildsNothingWhileAnOutsideEditDoes)
{
    const char file = GetParam();
    const std::string path = file == 'w' ? m_workshopPath : file == 'u' ? m_usersPath : m_updatePath;
    ToolConfigurationCommand& command = makeCommand();
    ASSERT_TRUE(command.init());
    command.onOKButtonClicked();
    const std::string saved = TempDir::read(path);
    int writes = 0;
    const int listener = m_dataManager->addListener([&writes](const ID&) { ++writes; });
    const auto report = [&] {
        writes = 0;
        EXPECT_EQ(BEvent<CustomEvent>::post(ToolConfigurationCommand::m_ID, CustomEvent(668, wide(path))), 1);
        return writes;
    };
    EXPECT_EQ(report(), 0);
    EXPECT_EQ(report(), 0) << "a second report of the same save";

    if (file == 'w')
        SettingsFiles::writeWorkshop(path, {{"nom", "Renamed"}});
    else if (file == 'u')
        SettingsFiles::writeUsers(path, {kLukasz});
    else
        SettingsFiles::writeUpdate(path, SettingsFiles::Update{true, "OTHER", "/srv/other", "/var/repo", "09:15:00"});
    EXPECT_GT(report(), 0);
    if (file == 'w')
    {
        EXPECT_EQ(shown("NameEdit"), "3|Renamed");
    }
    TempDir::write(path, saved);
    EXPECT_GT(report(), 0) << "back to the saved content, but not by the dialog";
    m_dataManager->removeListener(listener);
}

INSTANTIATE_TEST_SUITE_P(Files, OwnSave, ::testing::Values('w', 'u', 'p'), [](const auto& info) {
    return std::string(info.param == 'w' ? "Workshop" : info.param == 'u' ? "Users" : "Update");
});

// Brand items are keyed by the padded brand key, in its order; a brand without a text shows the
// value under its padded key, and keys that pad alike make one item.
TEST_F(Publication, BrandItemsArePaddedSortedAndMergedWithTheirDefaultLabels)
{
    BSet brands(10);
    brands.setString(L"12"_w, L"Twelve"_w);
    brands.setString(L"7"_w, L"Seven"_w);
    brands.setString(L"0007"_w, L"Zero seven"_w);
    brands.setString(L"2"_w, L"Two"_w);
    ASSERT_EQ(m_dataManager->createData(ID(Uri::kBrands), brands), 0);
    ToolConfigurationCommand& command = makeCommand();
    EXPECT_EQ(brandItems(), "0002=Marque B 0007=Zero seven 0012= ");
    EXPECT_EQ(shown("BrandCombo"), "3|Marque B");
    EXPECT_EQ(utf8(Access::workshop(command)->getDefaultBrandKey()), "2");

    // Without a text, a short key's own value is its text: "12" shows "Douze", not the item's label.
    BSet untexted(10);
    untexted.setString(L"12"_w, L"Douze"_w);
    untexted.setString(L"0012"_w, L"Twelve"_w);
    ASSERT_EQ(m_dataManager->createData(ID(Uri::kBrands), untexted), 0);
    Access::createDMData(command, true);
    EXPECT_EQ(shown("BrandCombo"), "3|Twelve");
    EXPECT_EQ(utf8(Access::workshop(command)->getDefaultBrandKey()), "0012");
}
}
