#include "BBool.h"
#include "BSet.h"
#include "BString.h"
#include "CBText.h"
#include "CDataManager.h"
#include "CMediator.h"
#include "CMessageBoxManager.h"
#include "CProcStartUpdateAgent.h"
#include "CQ17FileSystemWatcher.h"
#include "CScheduledTaskHelper.h"
#include "ComponentManagerFactory.h"
#include "Dialog_EditDiagUserInfo.h"
#include "Dialog_OnLineUpdateConfigurationTestResult.h"
#include "ID.h"
#include "ModalDriver.h"
#include "PControllerFactoryBase.h"
#include "QListViewItem.h"
#include "ScheduledTaskParams.h"
#include "SmartProxy.h"
#include "TaskSchedulerSettings.h"
#include "TempDir.h"
#include "TesselLog_Static.h"
#include "ToolConfigurationCommand.h"
#include "UpdateUpdater.h"
#include "UsersCommand.h"
#include "UsersUpdater.h"
#include "WideString.h"
#include "WorkshopInfoUpdater.h"

#include <gtest/gtest.h>

#include <QApplication>
#include <QEvent>
#include <QLineEdit>
#include <QPushButton>
#include <QTime>
#include <QTimer>

#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

namespace
{
// Literals with an explicit length: GCC 12 warns falsely inside ACE's NUL-terminated string
// constructor when many literals are converted implicitly.
ACE_WString operator""_w(const wchar_t* text, std::size_t length)
{
    return ACE_WString(text, length);
}

const wchar_t* const kFactoryID = L"proc:ProcToolConfiguration?ToolConfigControllersFactory";
const wchar_t* const kUserSetUri = L"data:/Auto/SystemMenu/Users/UserSet";

ACE_WString wide(const std::string& text)
{
    return WideString::fromUtf8(text);
}

std::string utf8(const ACE_WString& text)
{
    return WideString::toUtf8(text);
}

QString qs(const std::string& text)
{
    return QString::fromUtf8(text.c_str());
}

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

const User kAnna{"Anna", "1 Quay Road", "0101"};
const User kBruno{"Bruno", "2 Mill Lane", "0202"};
const User kClara{"Clara", "3 Hill Street", "0303"};
const User kBrunoChanged{"Bruno Braun", "22 Mill Lane", "0222"};
const User kLukasz{"Łukasz Żółć", "ul. Źródlana 5, Kraków", "+48 12 345 67 89"};

// Accepts the configuration test's result dialog as soon as it is shown.
class ResultDialogAccepter : public QObject
{
public:
    ResultDialogAccepter() { qApp->installEventFilter(this); }
    ~ResultDialogAccepter() override { qApp->removeEventFilter(this); }
    int accepted = 0;

protected:
    bool eventFilter(QObject* watched, QEvent* event) override
    {
        if (event->type() != QEvent::Show)
            return false;
        if (auto* result = dynamic_cast<Dialog_OnLineUpdateConfigurationTestResult*>(watched))
        {
            QTimer::singleShot(0, result, [this, result]() {
                ++accepted;
                result->okButton()->click();
            });
        }
        return false;
    }
};

// Types a user into the edit dialog and presses its OK button.
void fillEditDialogWhenShown(const User& user, int* filled)
{
    ModalDriver::whenShown([user, filled](QWidget& modal) {
        auto* dialog = dynamic_cast<Dialog_EditDiagUserInfo*>(&modal);
        if (dialog == nullptr)
        {
            ADD_FAILURE() << "expected the edit dialog, got " << modal.metaObject()->className();
            modal.close();
            return;
        }
        dialog->m_nameEdit->setText(qs(user.name));
        dialog->m_addressEdit->setText(qs(user.address));
        dialog->m_phoneEdit->setText(qs(user.phone));
        dialog->m_okButton->click();
        ++*filled;
    });
}

class EndToEndTest : public ::testing::Test
{
protected:
    void SetUp() override
    {
        m_level = TesselLog_Static::getLevel_static();
        m_manager = ComponentManagerFactory::getComponentManager();
        ASSERT_NE(m_manager, nullptr);
        if (const char* bin = std::getenv("PTC_BIN_DIR"))
            m_manager->setLibraryPath(bin);
        m_manager->destroyAllComponents();
        m_dataManager = CDataManager::registerWith(*m_manager);
        ASSERT_NE(m_dataManager, nullptr);
        CBText* texts = CBText::registerWith(*m_manager);
        ASSERT_NE(texts, nullptr);
        // Brand names are shown through their texts.
        texts->setText(wide("1"), wide("Marque A"));
        texts->setText(wide("2"), wide("Marque B"));
        ASSERT_NE(CQ17FileSystemWatcher::registerWith(*m_manager), nullptr);
        ASSERT_NE(CMessageBoxManager::registerWith(*m_manager), nullptr);
        m_mediator = CMediator::registerWith(*m_manager);
        ASSERT_NE(m_mediator, nullptr);
        CProcStartUpdateAgent* agent = CProcStartUpdateAgent::registerWith(*m_manager);
        ASSERT_NE(agent, nullptr);
        agent->setTestAnswer(0, 0);
        TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks"));
        TaskSchedulerSettings::setServiceState(0);

        m_workshopPath = m_dir.file("Data/User/InformationsGarage.xml");
        m_usersPath = m_dir.file("Data/User/FicheDiagParams.xml");
        m_updatePath = m_dir.file("Data/User/OnLineUpdate/Preparateur.xml");
        setConfig(L"data:/Configuration/MenuBar/WorkshopFile"_w, m_workshopPath);
        setConfig(L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagParamsFileName"_w, m_usersPath);
        setConfig(L"data:/Configuration/MenuBar/PreparateurConfigFile"_w, m_updatePath);
        setConfig(L"data:/Configuration/MenuBar/PreparateurConfigFileTmp"_w,
                  m_dir.file("Data/User/OnLineUpdate/PreparateurTmp.xml"));
        BSet brands(10);
        brands.setString(L"1"_w, L"Marque A"_w);
        brands.setString(L"2"_w, L"Marque B"_w);
        ASSERT_EQ(m_dataManager->createData(ID(L"data:/Configuration/DoC/Config_Accueil/Brands"), brands), 0);
        writeFiles();
    }

    void TearDown() override
    {
        m_users.reset();
        m_tool.reset();
        m_factory.reset();
        m_manager->destroyAllComponents();
        m_manager->release();
        TaskSchedulerSettings::setTasksFolder(std::string());
        TesselLog_Static::setLevel_static(m_level);
    }

    void setConfig(const ACE_WString& uri, const std::string& value)
    {
        ASSERT_EQ(m_dataManager->createData(ID(uri), BString(wide(value))), 0);
    }

    static void save(const BSet& set, const std::string& path)
    {
        TempDir::write(path, "");
        ASSERT_TRUE(set.save(wide(path), false)) << path;
    }

    void writeFiles()
    {
        BSet workshop(10);
        workshop.setString(L"numero_affaire"_w, L"BN-42"_w);
        workshop.setString(L"raison_sociale"_w, L"Garage du Pont"_w);
        workshop.setString(L"nom"_w, L"Garage Ünal"_w);
        workshop.setString(L"rue"_w, L"1 rue Haute"_w);
        workshop.setString(L"ville"_w, L"Lyon"_w);
        workshop.setString(L"codepostal"_w, L"69001"_w);
        workshop.setString(L"telephone"_w, L"0102030405"_w);
        workshop.setString(L"telecopie"_w, L"0607080910"_w);
        save(workshop, m_workshopPath);

        BSet slotSet(10);
        const User users[] = {kAnna, kBruno, kClara};
        for (int i = 0; i < 3; ++i)
        {
            BSet slot(10);
            slot.setString(L"name"_w, wide(users[i].name));
            slot.setString(L"address"_w, wide(users[i].address));
            slot.setString(L"telephone"_w, wide(users[i].phone));
            slotSet.setSet(wide("user" + std::to_string(i + 1)), slot);
        }
        BSet attributes(10);
        attributes.setString(L"dealerId"_w, L"D77"_w);
        BSet app2App(10);
        app2App.setString(L"Port"_w, L"8080"_w);
        app2App.setString(L"IP"_w, L"10.0.0.7"_w);
        app2App.setSet(L"RequestAttributes"_w, attributes);
        BSet content(10);
        content.setString(L"activation"_w, L"1"_w);
        content.setSet(L"users"_w, slotSet);
        content.setSet(L"App2App"_w, app2App);
        save(content, m_usersPath);

        BSet update(10);
        update.setBool(L"OnlineUpdateActivated"_w, false);
        update.setString(L"DeploymentMode"_w, L"LOCAL"_w);
        update.setString(L"DistributionFolderPath"_w, L"/srv/dist"_w);
        update.setString(L"UpdateRetrievalTime"_w, L"07:30:00"_w);
        save(update, m_updatePath);
    }

    // Opens both controllers of the dialog through the plug-in's factory and initialises them.
    void openDialog()
    {
        m_users.reset();
        m_tool.reset();
        m_factory = std::make_unique<SmartProxy<PControllerFactoryBase>>();
        ASSERT_TRUE(m_factory->acquire(ID(kFactoryID)));
        WidgetCommandBase* tool = (*m_factory)->getControllerByName(wide("WC_TOOLCONFIGURATION"));
        m_tool.reset(dynamic_cast<ToolConfigurationCommand*>(tool));
        ASSERT_NE(m_tool, nullptr);
        m_users.reset(dynamic_cast<UsersCommand*>((*m_factory)->getControllerByName(wide("WC_USERSCOMMAND"))));
        ASSERT_NE(m_users, nullptr);
        ASSERT_TRUE(m_tool->init());
        ASSERT_TRUE(m_users->init());
    }

    // Every kind of field, the users list and a configuration test, as a user would.
    void editEverything()
    {
        ToolConfigurationCommand& tool = *m_tool;
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
        EXPECT_EQ(publishedUsers(), (std::vector<User>{kBrunoChanged, kClara, kLukasz}));

        {
            ResultDialogAccepter accepter;
            tool.onConfigurationTestButtonClicked();
            EXPECT_EQ(accepter.accepted, 1);
        }
        // Changed after the test: what is saved must not come from the test's copy.
        tool.onTaskTimeEditChanged(QTime(21, 15, 0));
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
            entry.getString(L"name"_w, name);
            entry.getString(L"address"_w, address);
            entry.getString(L"phone"_w, phone);
            result.push_back({utf8(name), utf8(address), utf8(phone)});
        }
        return result;
    }

    static ID controlUri(const std::string& name) { return ID(wide("data:/Auto/SystemMenu/" + name)); }

    BSet record(const std::string& name) const
    {
        BSet set(10);
        EXPECT_EQ(m_dataManager->getData(controlUri(name), set), 0) << name;
        return set;
    }

    std::string item(const std::string& name) const
    {
        BSet value(10);
        record(name).getSet(L"value"_w, value);
        ACE_WString text;
        value.getString(L"item"_w, text);
        return utf8(text);
    }

    std::string field(const std::string& name, const ACE_WString& key) const
    {
        ACE_WString text;
        record(name).getString(key, text);
        return utf8(text);
    }

    bool flag(const std::string& name) const
    {
        bool value = false;
        EXPECT_EQ(m_dataManager->getBool(controlUri(name), value), 0) << name;
        return value;
    }

    std::string text(const std::string& name) const
    {
        ACE_WString value;
        EXPECT_EQ(m_dataManager->getString(controlUri(name), value), 0) << name;
        return utf8(value);
    }

    TempDir m_dir;
    std::string m_workshopPath;
    std::string m_usersPath;
    std::string m_updatePath;
    IComponentManager* m_manager = nullptr;
    CDataManager* m_dataManager = nullptr;
    CMediator* m_mediator = nullptr;
    std::unique_ptr<SmartProxy<PControllerFactoryBase>> m_factory;
    std::unique_ptr<ToolConfigurationCommand> m_tool;
    std::unique_ptr<UsersCommand> m_users;
    int m_level = 0;
};

TEST_F(EndToEndTest, EditsThenOkWriteTheFilesAndTheTaskAndAReopenedDialogShowsThem)
{
    openDialog();
    editEverything();
    m_tool->onOKButtonClicked();
    EXPECT_EQ(m_mediator->closeCount(), 1);
    EXPECT_EQ(TesselLog_Static::getLevel_static(), 10);

    WorkshopInfoUpdater workshop(wide(m_workshopPath));
    ASSERT_TRUE(workshop.load());
    EXPECT_EQ(utf8(workshop.getBusinessNumber()), "BN-99");
    EXPECT_EQ(utf8(workshop.getCorporateName()), "Garage de la Gare");
    EXPECT_EQ(utf8(workshop.getName()), "Żaneta Nowak");
    EXPECT_EQ(utf8(workshop.getRoad()), "5 avenue Foch");
    EXPECT_EQ(utf8(workshop.getPostalCode()), "75016");
    EXPECT_EQ(utf8(workshop.getTown()), "Paris");
    EXPECT_EQ(utf8(workshop.getTelephone()), "0111111111");
    EXPECT_EQ(utf8(workshop.getFax()), "0122222222");
    EXPECT_EQ(utf8(workshop.getDefaultBrand()), "Marque B");
    EXPECT_NE(TempDir::read(m_workshopPath).find("<String key=\"default_brand\">2</String>"), std::string::npos);

    UsersUpdater users(wide(m_usersPath));
    ASSERT_TRUE(users.load());
    std::vector<User> saved;
    for (unsigned int i = 0; i < users.getUserCount(); ++i)
        saved.push_back({utf8(users.getUserName(i)), utf8(users.getUserAddress(i)), utf8(users.getUserPhone(i))});
    EXPECT_EQ(saved, (std::vector<User>{kBrunoChanged, kClara, kLukasz}));
    EXPECT_EQ(utf8(users.getApp2AppPort()), "9090");
    EXPECT_EQ(utf8(users.getApp2AppIP()), "10.0.0.42");
    EXPECT_EQ(utf8(users.getApp2AppDealerID()), "D88");

    UpdateUpdater update(wide(m_updatePath));
    ASSERT_TRUE(update.load());
    EXPECT_TRUE(update.getCheckInternet());
    EXPECT_EQ(utf8(update.getDeploymentMode()), "OTHER");
    EXPECT_EQ(utf8(update.getDistributionFolderPath()), "/srv/new");
    EXPECT_EQ(utf8(update.getTaskTime()), "21:15:00");

    ScheduledTaskParams expectedTask(L"VEXAPreparerTask", L"C:/VEXA_Q17/Lib/Application/UpdaterAgent.exe",
                                     L"preparer", L"21", L"15");
    CScheduledTaskHelper helper(expectedTask);
    EXPECT_EQ(helper.checkScheduledTask(), OnlineUpdateCommand_NS::eOK);

    // A second dialog, its records rebuilt from nothing but the files.
    m_users.reset();
    m_tool.reset();
    ASSERT_EQ(m_dataManager->removeData(ID(L"data:/Auto/SystemMenu")), 0);
    openDialog();
    EXPECT_EQ(item("ProjectNumberEdit"), "BN-99");
    EXPECT_EQ(item("CompanyNameEdit"), "Garage de la Gare");
    EXPECT_EQ(item("NameEdit"), "Żaneta Nowak");
    EXPECT_EQ(item("StreetEdit"), "5 avenue Foch");
    EXPECT_EQ(field("TownPostCodeEdit", L"edit1"_w), "75016");
    EXPECT_EQ(field("TownPostCodeEdit", L"edit2"_w), "Paris");
    EXPECT_EQ(item("PhoneNumberEdit"), "0111111111");
    EXPECT_EQ(item("FaxNumberEdit"), "0122222222");
    EXPECT_EQ(field("BrandCombo", L"selected"_w), "Marque B");
    EXPECT_EQ(item("App2AppPort"), "9090");
    EXPECT_EQ(item("App2AppIP"), "10.0.0.42");
    EXPECT_EQ(item("App2AppDealerID"), "D88");
    EXPECT_TRUE(flag("CheckInternet"));
    EXPECT_FALSE(flag("LocalRadioButton"));
    EXPECT_FALSE(flag("A2ARadioButton"));
    EXPECT_TRUE(flag("OtherRadioButton"));
    EXPECT_EQ(item("DistributionFolderPath"), "/srv/new");
    EXPECT_EQ(text("TaskTimeEdit"), "21:15:00");
    EXPECT_EQ(publishedUsers(), (std::vector<User>{kBrunoChanged, kClara, kLukasz}));
}

TEST_F(EndToEndTest, EditsThenCancelLeaveTheFilesUnchangedAndShowThemAgain)
{
    const std::string workshopBefore = TempDir::read(m_workshopPath);
    const std::string usersBefore = TempDir::read(m_usersPath);
    const std::string updateBefore = TempDir::read(m_updatePath);

    openDialog();
    editEverything();
    m_tool->onCancelButtonClicked();

    EXPECT_EQ(m_mediator->closeCount(), 1);
    EXPECT_EQ(TempDir::read(m_workshopPath), workshopBefore);
    EXPECT_EQ(TempDir::read(m_usersPath), usersBefore);
    EXPECT_EQ(TempDir::read(m_updatePath), updateBefore);
    EXPECT_EQ(item("NameEdit"), "Garage Ünal");
    EXPECT_EQ(item("App2AppIP"), "10.0.0.7");
    EXPECT_FALSE(flag("CheckInternet"));
    EXPECT_TRUE(flag("LocalRadioButton"));
    EXPECT_EQ(text("TaskTimeEdit"), "07:30:00");
    EXPECT_EQ(publishedUsers(), (std::vector<User>{kAnna, kBruno, kClara}));
}
}
