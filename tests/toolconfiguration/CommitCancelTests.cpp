#include "ToolConfigurationTestSupport.h"

#include "BBool.h"
#include "BString.h"
#include "CMediator.h"
#include "CScheduledTaskHelper.h"
#include "LogCapture.h"
#include "OnLineUpdateCommand.h"
#include "ScheduledTaskParams.h"
#include "TaskSchedulerSettings.h"
#include "UpdateUpdater.h"
#include "UsersUpdater.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

namespace
{
using Access = ToolConfigurationCommandTestAccess;

const wchar_t* const kWorkshopUri = L"data:/Configuration/MenuBar/WorkshopFile";
const wchar_t* const kUsersUri = L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagParamsFileName";
const wchar_t* const kUpdateUri = L"data:/Configuration/MenuBar/PreparateurConfigFile";
const wchar_t* const kUserSetUri = L"data:/Auto/SystemMenu/Users/UserSet";
const wchar_t* const kEnableUri = L"data:/Configuration/MenuBar/EnableOnlineUpdate";

struct User
{
    std::string name;
    std::string address;
    std::string phone;
    bool operator==(const User& other) const
    {
        return name == other.name && address == other.address && phone == other.phone;
    }
};

void PrintTo(const User& u, std::ostream* os)
{
    *os << "{" << u.name << ", " << u.address << ", " << u.phone << "}";
}

BSet userSetOf(const std::vector<User>& users)
{
    BSet set(10);
    for (size_t i = 0; i < users.size(); ++i)
    {
        BSet entry(10);
        entry.setString(L"name", wide(users[i].name));
        entry.setString(L"address", wide(users[i].address));
        entry.setString(L"phone", wide(users[i].phone));
        set.setSet(wide("User#" + std::to_string(i)), entry);
    }
    return set;
}

class CommitCancelTest : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_level = TesselLog_Static::getLevel_static();
        TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks"));
        TaskSchedulerSettings::setServiceState(0);
        m_mediator = CMediator::registerWith(*m_manager);
        ASSERT_NE(m_mediator, nullptr);

        m_workshopPath = m_dir.file("Garage/InformationsGarage.xml");
        m_usersPath = m_dir.file("User/FicheDiagParams.xml");
        m_updatePath = m_dir.file("User/OnLineUpdate/Preparateur.xml");
        setConfig(kWorkshopUri, m_workshopPath);
        setConfig(kUsersUri, m_usersPath);
        setConfig(kUpdateUri, m_updatePath);

        BSet workshop(10);
        workshop.setString(L"nom", L"Garage Ünal");
        workshop.setString(L"telephone", L"0102030405");
        save(workshop, m_workshopPath);

        BSet slotSet(10);
        for (int i = 1; i <= 5; ++i)
        {
            BSet slot(10);
            slot.setString(L"name", wide("Old " + std::to_string(i)));
            slot.setString(L"address", L"Old street");
            slot.setString(L"telephone", L"0900");
            slotSet.setSet(wide("user" + std::to_string(i)), slot);
        }
        BSet attributes(10);
        attributes.setString(L"dealerId", L"D77");
        BSet app2App(10);
        app2App.setString(L"Port", L"8080");
        app2App.setString(L"IP", L"10.0.0.7");
        app2App.setSet(L"RequestAttributes", attributes);
        BSet users(10);
        users.setString(L"activation", L"1");
        users.setSet(L"users", slotSet);
        users.setSet(L"App2App", app2App);
        save(users, m_usersPath);

        BSet update(10);
        update.setBool(L"OnlineUpdateActivated", false);
        update.setString(L"DeploymentMode", L"OTHER");
        update.setString(L"DistributionFolderPath", L"/srv/dist");
        update.setString(L"UpdateRetrievalTime", L"07:30:00");
        save(update, m_updatePath);
    }

    void TearDown() override
    {
        m_command.reset();
        TesselLog_Static::setLevel_static(m_level);
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

    ToolConfigurationCommand& open()
    {
        m_command = std::make_unique<ToolConfigurationCommand>(QStringLiteral("WC_TOOLCONFIGURATION"));
        return *m_command;
    }

    static ID controlUri(const std::string& name) { return ID(wide("data:/Auto/SystemMenu/" + name)); }

    BSet record(const std::string& name) const
    {
        BSet set(10);
        EXPECT_EQ(m_dataManager->getData(controlUri(name), set), 0) << name;
        return set;
    }

    std::string itemOf(const std::string& name) const
    {
        BSet value(10);
        record(name).getSet(L"value", value);
        ACE_WString text;
        value.getString(L"item", text);
        return utf8(text);
    }

    long stateOf(const std::string& name) const
    {
        long state = -1;
        record(name).getInt(L"state", state);
        return state;
    }

    // The users of the file's slotSet 1 to 20, free slotSet included as they are written.
    std::vector<User> fileSlots() const
    {
        BSet content(10);
        EXPECT_TRUE(content.load(wide(m_usersPath)));
        BSet slotSet(10);
        content.getSet(L"users", slotSet);
        std::vector<User> result;
        for (int i = 1; i <= 20; ++i)
        {
            BSet slot(10);
            slotSet.getSet(wide("user" + std::to_string(i)), slot);
            ACE_WString name, address, phone;
            slot.getString(L"name", name);
            slot.getString(L"address", address);
            slot.getString(L"telephone", phone);
            result.push_back({utf8(name), utf8(address), utf8(phone)});
        }
        return result;
    }

    std::vector<User> publishedUsers() const
    {
        BSet set(10);
        EXPECT_EQ(m_dataManager->getData(ID(kUserSetUri), set), 0);
        std::vector<User> result;
        for (int i = 0; i < set.size(); ++i)
        {
            BSet entry(10);
            EXPECT_EQ(set.getSet(wide("User#" + std::to_string(i)), entry), 0) << i;
            ACE_WString name, address, phone;
            entry.getString(L"name", name);
            entry.getString(L"address", address);
            entry.getString(L"phone", phone);
            result.push_back({utf8(name), utf8(address), utf8(phone)});
        }
        return result;
    }

    static bool taskExists()
    {
        ScheduledTaskParams params = getScheduledTaskParamsFromDM();
        CScheduledTaskHelper helper(params);
        bool exists = false;
        bool denied = false;
        EXPECT_TRUE(helper.checkTaskAvailableForCurrentUser(exists, denied));
        return exists;
    }

    bool published(const wchar_t* uri) const
    {
        bool value = false;
        EXPECT_EQ(m_dataManager->getBool(ID(uri), value), 0);
        return value;
    }

    TempDir m_dir;
    std::string m_workshopPath;
    std::string m_usersPath;
    std::string m_updatePath;
    CMediator* m_mediator = nullptr;
    std::unique_ptr<ToolConfigurationCommand> m_command;
    int m_level = 0;
};

// ---- Recording mode ----

class RecordingModeTest : public CommitCancelTest, public ::testing::WithParamInterface<bool>
{
};

TEST_P(RecordingModeTest, OkSetsTheLogLevelFromTheCheckBox)
{
    ToolConfigurationCommand& command = open();
    TesselLog_Static::setLevel_static(GetParam() ? 0 : 10);
    ASSERT_EQ(m_dataManager->setBool(controlUri("ASRMChk"), GetParam()), 0);

    command.onOKButtonClicked();

    EXPECT_EQ(TesselLog_Static::getLevel_static(), GetParam() ? 10 : 0);
    EXPECT_EQ(Access::recordingMode(command), GetParam());
    EXPECT_EQ(m_mediator->closeCount(), 1);
}

INSTANTIATE_TEST_SUITE_P(CommitCancel, RecordingModeTest, ::testing::Bool(),
                         [](const ::testing::TestParamInfo<bool>& info) { return info.param ? "On" : "Off"; });

// ---- Users ----

TEST_F(CommitCancelTest, OkWritesTheUserSetToTheSlotsInOrderAndFreesTheRest)
{
    ToolConfigurationCommand& command = open();
    const std::vector<User> typed = {{"Anna", "1 Quay Road", "0101"},
                                     {"Łukasz Żółć", "ul. Źródlana 5", "+48 12"},
                                     {"", "no name", "0000"},
                                     {"Clara", "", ""}};
    ASSERT_EQ(m_dataManager->createData(ID(kUserSetUri), userSetOf(typed)), 0);

    command.onOKButtonClicked();

    std::vector<User> expected(20, User{"0", "0", "0"});
    expected[0] = typed[0];
    expected[1] = typed[1];
    expected[2] = typed[3];
    EXPECT_EQ(fileSlots(), expected);
}

// ---- App2App address ----

struct AddressCase
{
    const char* label;
    const char* typed;
    const char* saved;
    bool republished;
};

void PrintTo(const AddressCase& c, std::ostream* os)
{
    *os << '"' << c.typed << '"';
}

class App2AppAddressTest : public CommitCancelTest, public ::testing::WithParamInterface<AddressCase>
{
};

TEST_P(App2AppAddressTest, OkSavesTheNormalisedAddressAndShowsItWhenChanged)
{
    const AddressCase& c = GetParam();
    ToolConfigurationCommand& command = open();
    command.onPortChanged(QStringLiteral("9090"));
    command.onIPAddressChanged(QString::fromUtf8(c.typed));
    command.onDealerIDChanged(QStringLiteral("D88"));
    // A marker state: a republication writes the editable state 3 again.
    BSet marked = record("App2AppIP");
    marked.setInt(L"state", 19);
    ASSERT_EQ(m_dataManager->setData(controlUri("App2AppIP"), marked), 0);

    command.onOKButtonClicked();

    UsersUpdater file(wide(m_usersPath));
    ASSERT_TRUE(file.load());
    EXPECT_EQ(utf8(file.getApp2AppIP()), c.saved);
    EXPECT_EQ(utf8(file.getApp2AppPort()), "9090");
    EXPECT_EQ(utf8(file.getApp2AppDealerID()), "D88");
    EXPECT_EQ(stateOf("App2AppIP"), c.republished ? 3 : 19);
    EXPECT_EQ(itemOf("App2AppIP"), c.republished ? c.saved : c.typed);
    ACE_WString kept;
    Access::app2AppValues(command).getString(L"App2AppIP", kept);
    EXPECT_EQ(utf8(kept), c.typed);
}

INSTANTIATE_TEST_SUITE_P(CommitCancel, App2AppAddressTest,
                         ::testing::Values(AddressCase{"LeadingZeros", "010.001.002.003", "10.1.2.3", true},
                                           AddressCase{"Normal", "192.168.1.20", "192.168.1.20", false},
                                           AddressCase{"Empty", "", "0", true}),
                         [](const ::testing::TestParamInfo<AddressCase>& info) { return std::string(info.param.label); });

// ---- Online updates and the scheduled task ----

class CheckInternetTest : public CommitCancelTest, public ::testing::WithParamInterface<bool>
{
};

TEST_P(CheckInternetTest, OkSavesTheSettingAndMakesTheTaskFollowIt)
{
    const bool enabled = GetParam();
    ToolConfigurationCommand& command = open();
    if (!enabled)
    {
        // A task left from before must go.
        OnLineUpdateCommand maker(QStringLiteral("WC_TOOLCONFIGURATION"));
        ASSERT_TRUE(maker.CreateScheduledTask());
        ASSERT_TRUE(taskExists());
    }
    ASSERT_TRUE(Access::update(command)->setCheckInternet(enabled));

    command.onOKButtonClicked();

    EXPECT_EQ(taskExists(), enabled);
    EXPECT_EQ(published(kEnableUri), enabled);
    UpdateUpdater file(wide(m_updatePath));
    ASSERT_TRUE(file.load());
    EXPECT_EQ(file.getCheckInternet(), enabled);
}

INSTANTIATE_TEST_SUITE_P(CommitCancel, CheckInternetTest, ::testing::Bool(),
                         [](const ::testing::TestParamInfo<bool>& info) { return info.param ? "On" : "Off"; });

TEST_F(CommitCancelTest, FailingWorkshopSaveStillSavesTheOthersAndCloses)
{
    ToolConfigurationCommand& command = open();
    // A file where the workshop file's folder should be.
    std::filesystem::remove_all(m_dir.path() / "Garage");
    TempDir::write(m_dir.file("Garage"), "in the way");
    command.onNameChanged(QStringLiteral("Lost"));
    command.onPortChanged(QStringLiteral("7070"));
    ASSERT_TRUE(Access::update(command)->setCheckInternet(true));
    LogCapture log;

    command.onOKButtonClicked();

    EXPECT_TRUE(log.contains("[ToolConfigurationCommand::onOKButtonClicked] : Cannot save workshop data!",
                             TesselLog_Static::eWARNING));
    EXPECT_FALSE(log.containsSubstring("Cannot save users data!"));
    EXPECT_FALSE(log.containsSubstring("Cannot save Preparateur data!"));
    UsersUpdater users(wide(m_usersPath));
    ASSERT_TRUE(users.load());
    EXPECT_EQ(utf8(users.getApp2AppPort()), "7070");
    UpdateUpdater update(wide(m_updatePath));
    ASSERT_TRUE(update.load());
    EXPECT_TRUE(update.getCheckInternet());
    EXPECT_TRUE(taskExists());
    EXPECT_EQ(m_mediator->closeCount(), 1);
}

TEST_F(CommitCancelTest, WithoutMediatorOkStillSaves)
{
    ToolConfigurationCommand& command = open();
    ASSERT_EQ(destroyComponent(ID(CMediator::componentID)), 0);
    ASSERT_EQ(UnreachableComponent::registerWith(*m_manager, CMediator::componentID), 0);
    command.onPortChanged(QStringLiteral("6060"));

    command.onOKButtonClicked();

    UsersUpdater users(wide(m_usersPath));
    ASSERT_TRUE(users.load());
    EXPECT_EQ(utf8(users.getApp2AppPort()), "6060");
}

TEST_F(CommitCancelTest, OkPointsTheActivePathBackAtTheSavedFile)
{
    ToolConfigurationCommand& command = open();
    // Where a configuration test leaves it.
    ASSERT_EQ(m_dataManager->setString(controlUri("ActivePreparateur"), wide(m_dir.file("Tmp.xml"))), 0);

    command.onOKButtonClicked();

    ACE_WString active;
    EXPECT_EQ(m_dataManager->getString(controlUri("ActivePreparateur"), active), 0);
    EXPECT_EQ(utf8(active), m_updatePath);
}

// ---- Cancel ----

TEST_F(CommitCancelTest, CancelBringsEveryControlAndTheUsersBackFromTheFiles)
{
    ToolConfigurationCommand& command = open();
    const std::string workshopBefore = TempDir::read(m_workshopPath);
    const std::string usersBefore = TempDir::read(m_usersPath);
    const std::string updateBefore = TempDir::read(m_updatePath);

    command.onNameChanged(QStringLiteral("Changed"));
    command.onPhoneNumberChanged(QStringLiteral("999"));
    command.onPortChanged(QStringLiteral("1"));
    command.onIPAddressChanged(QStringLiteral("010.001.002.003"));
    ASSERT_TRUE(Access::update(command)->setCheckInternet(true));
    ASSERT_EQ(m_dataManager->createData(ID(kUserSetUri), userSetOf({{"Anna", "1 Quay Road", "0101"}})), 0);

    command.onCancelButtonClicked();

    EXPECT_EQ(m_mediator->closeCount(), 1);
    EXPECT_EQ(itemOf("NameEdit"), "Garage Ünal");
    EXPECT_EQ(itemOf("PhoneNumberEdit"), "0102030405");
    EXPECT_EQ(itemOf("App2AppPort"), "8080");
    EXPECT_EQ(itemOf("App2AppIP"), "10.0.0.7");
    bool checked = true;
    EXPECT_EQ(m_dataManager->getBool(controlUri("CheckInternet"), checked), 0);
    EXPECT_FALSE(checked);
    std::vector<User> fileUsers;
    for (int i = 1; i <= 5; ++i)
        fileUsers.push_back({"Old " + std::to_string(i), "Old street", "0900"});
    EXPECT_EQ(publishedUsers(), fileUsers);
    EXPECT_EQ(TempDir::read(m_workshopPath), workshopBefore);
    EXPECT_EQ(TempDir::read(m_usersPath), usersBefore);
    EXPECT_EQ(TempDir::read(m_updatePath), updateBefore);

    // What OK then saves is the files' content, not the cancelled edits.
    command.onOKButtonClicked();
    UsersUpdater users(wide(m_usersPath));
    ASSERT_TRUE(users.load());
    EXPECT_EQ(utf8(users.getApp2AppPort()), "8080");
    EXPECT_EQ(users.getUserCount(), 5u);
}
}
