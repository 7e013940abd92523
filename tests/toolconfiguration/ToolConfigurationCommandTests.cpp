#include "ToolConfigurationTestSupport.h"

#include "BBool.h"
#include "BEvent.h"
#include "BInt.h"
#include "BString.h"
#include "CMessageBoxManager.h"
#include "CProcStartUpdateAgent.h"
#include "CQ17FileSystemWatcher.h"
#include "EventRegistry.h"
#include "LogCapture.h"
#include "UpdateUpdater.h"
#include "UsersUpdater.h"
#include "WorkshopInfoUpdater.h"

#include <gtest/gtest.h>

#include <QCoreApplication>
#include <QMetaMethod>
#include <QMetaObject>
#include <QTranslator>

#include <algorithm>
#include <cctype>
#include <filesystem>
#include <functional>
#include <string>
#include <utility>
#include <vector>

namespace
{
using Access = ToolConfigurationCommandTestAccess;

const wchar_t* const kWorkshopUri = L"data:/Configuration/MenuBar/WorkshopFile";
const wchar_t* const kUsersUri = L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagParamsFileName";
const wchar_t* const kUpdateUri = L"data:/Configuration/MenuBar/PreparateurConfigFile";
const wchar_t* const kIniUri = L"data:/Configuration/MarvaneNet/Applet/ConfHF";
const wchar_t* const kBrandsUri = L"data:/Configuration/DoC/Config_Accueil/Brands";
const wchar_t* const kActiveUri = L"data:/Auto/SystemMenu/ActivePreparateur";
const char* const kDefaultUpdatePath = "../../Data/User/OnLineUpdate/Preparateur.xml";

std::vector<std::string> keysOf(const BSet& set)
{
    std::vector<std::string> keys;
    for (int i = 0; i < set.size(); ++i)
        keys.push_back(utf8(set.keyAt(i)));
    return keys;
}

enum class SettingsFile
{
    eWorkshop,
    eUsers,
    eUpdate
};

class ToolConfigurationTest : public ComponentFixture
{
protected:
    const std::string& pathOf(SettingsFile file) const
    {
        switch (file)
        {
        case SettingsFile::eWorkshop:
            return m_workshopPath;
        case SettingsFile::eUsers:
            return m_usersPath;
        case SettingsFile::eUpdate:
            break;
        }
        return m_updatePath;
    }

    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_workshopPath = m_dir.file("User/InformationsGarage.xml");
        m_usersPath = m_dir.file("User/FicheDiagParams.xml");
        m_updatePath = m_dir.file("User/OnLineUpdate/Preparateur.xml");
        setConfig(kWorkshopUri, m_workshopPath);
        setConfig(kUsersUri, m_usersPath);
        setConfig(kUpdateUri, m_updatePath);
        writeWorkshop("Garage Ünal");
        writeUsers("8080");
        writeUpdate(m_updatePath, "/srv/dist");
    }

    void TearDown() override
    {
        m_command.reset();
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

    void writeWorkshop(const std::string& name, const std::string& defaultBrand = "")
    {
        BSet set(10);
        set.setString(L"numero_affaire", L"BN-42");
        set.setString(L"raison_sociale", L"Garage du Pont");
        set.setString(L"nom", wide(name));
        set.setString(L"rue", L"1 rue Haute");
        set.setString(L"ville", L"Lyon");
        set.setString(L"codepostal", L"69001");
        set.setString(L"telephone", L"0102030405");
        set.setString(L"telecopie", L"0607080910");
        if (!defaultBrand.empty())
            set.setString(L"default_brand", wide(defaultBrand));
        save(set, m_workshopPath);
    }

    void writeUsers(const std::string& port)
    {
        BSet attributes(10);
        attributes.setString(L"dealerId", L"D77");
        BSet app2App(10);
        app2App.setString(L"Port", wide(port));
        app2App.setString(L"IP", L"10.0.0.7");
        app2App.setSet(L"RequestAttributes", attributes);
        BSet set(10);
        set.setString(L"activation", L"1");
        set.setSet(L"App2App", app2App);
        save(set, m_usersPath);
    }

    static void writeUpdate(const std::string& path, const std::string& folder)
    {
        BSet set(10);
        set.setBool(L"OnlineUpdateActivated", false);
        set.setString(L"DeploymentMode", L"OTHER");
        set.setString(L"DistributionFolderPath", wide(folder));
        set.setString(L"UpdateRetrievalTime", L"07:30:00");
        save(set, path);
    }

    // Registers the watcher, message-box manager and update-agent starter; `unreachable` names
    // one (or the text component) that is registered without a proxy instead.
    void registerFrameworkComponents(const wchar_t* unreachable = nullptr)
    {
        const std::wstring blocked = unreachable != nullptr ? unreachable : L"";
        if (blocked == CBText::componentID)
            destroyText();
        if (!blocked.empty())
        {
            ASSERT_EQ(UnreachableComponent::registerWith(*m_manager, unreachable), 0);
        }
        if (blocked != CQ17FileSystemWatcher::componentID)
        {
            m_watcher = CQ17FileSystemWatcher::registerWith(*m_manager);
            ASSERT_NE(m_watcher, nullptr);
        }
        if (blocked != CMessageBoxManager::componentID)
        {
            ASSERT_NE(CMessageBoxManager::registerWith(*m_manager), nullptr);
        }
        if (blocked != CProcStartUpdateAgent::componentID)
        {
            ASSERT_NE(CProcStartUpdateAgent::registerWith(*m_manager), nullptr);
        }
    }

    ToolConfigurationCommand& makeCommand()
    {
        m_command = std::make_unique<ToolConfigurationCommand>(QStringLiteral("WC_TOOLCONFIGURATION"));
        return *m_command;
    }

    static ID controlUri(const std::string& name) { return ID(wide("data:/Auto/SystemMenu/" + name)); }

    bool hasData(const std::string& name) const
    {
        BSet set(10);
        BString text;
        BBool flag;
        return m_dataManager->getData(controlUri(name), set) == 0 ||
               m_dataManager->getData(controlUri(name), text) == 0 ||
               m_dataManager->getData(controlUri(name), flag) == 0;
    }

    BSet record(const std::string& name) const
    {
        BSet set(10);
        EXPECT_EQ(m_dataManager->getData(controlUri(name), set), 0) << name;
        return set;
    }

    long state(const std::string& name) const
    {
        long value = -1;
        record(name).getInt(L"state", value);
        return value;
    }

    // The "item" text of an edit record.
    std::string item(const std::string& name) const
    {
        BSet value(10);
        EXPECT_EQ(record(name).getSet(L"value", value), 0) << name;
        ACE_WString text(L"<missing>");
        value.getString(L"item", text);
        return utf8(text);
    }

    std::string publishedString(const std::string& name) const
    {
        ACE_WString text(L"<missing>");
        m_dataManager->getString(controlUri(name), text);
        return utf8(text);
    }

    bool publishedBool(const std::string& name) const
    {
        bool value = false;
        EXPECT_EQ(m_dataManager->getBool(controlUri(name), value), 0) << name;
        return value;
    }

    TempDir m_dir;
    std::string m_workshopPath;
    std::string m_usersPath;
    std::string m_updatePath;
    CQ17FileSystemWatcher* m_watcher = nullptr;
    std::unique_ptr<ToolConfigurationCommand> m_command;
};

// ---------------------------------------------------------------------------------------------
// Meta-object

TEST(ToolConfigurationMetaObject, SlotTableFollowsTheDialogsOrder)
{
    const std::vector<std::pair<const char*, std::vector<const char*>>> table = {
        {"onProjectNumberChanged(QString)", {"qstrValue"}},
        {"onCompanyNameChanged(QString)", {"qstrValue"}},
        {"onNameChanged(QString)", {"qstrValue"}},
        {"onStreetChanged(QString)", {"qstrValue"}},
        {"onTownOrPostCodeChanged(QString,QString)", {"qstrPostcode", "qstrTown"}},
        {"onPhoneNumberChanged(QString)", {"qstrValue"}},
        {"onFaxNumberChanged(QString)", {"qstrValue"}},
        {"onManufacturerChanged(QString)", {"qstrValue"}},
        {"onRecordingModeChecked(bool)", {"bChecked"}},
        {"onPortChanged(QString)", {"qstrValue"}},
        {"onIPAddressChanged(QString)", {"qstrValue"}},
        {"onDealerIDChanged(QString)", {"qstrValue"}},
        {"onOKButtonClicked()", {}},
        {"onCancelButtonClicked()", {}},
        {"onFolderBrowserButtonClicked()", {}},
        {"onCheckInternetChecked(bool)", {"bChecked"}},
        {"onLocalRadioButtonClicked()", {}},
        {"onA2ARadioButtonClicked()", {}},
        {"onOtherRadioButtonClicked()", {}},
        {"onDistributionFolderPathChanged(QString)", {"qstrValue"}},
        {"onTaskTimeEditChanged(QTime)", {"taksTime"}},
        {"onConfigurationTestButtonClicked()", {}},
        {"onButtonSaveLogsClicked()", {}},
    };
    const QMetaObject& meta = ToolConfigurationCommand::staticMetaObject;
    EXPECT_STREQ(meta.className(), "ToolConfigurationCommand");
    const int offset = meta.methodOffset();
    ASSERT_EQ(meta.methodCount() - offset, static_cast<int>(table.size()));
    for (int i = 0; i < static_cast<int>(table.size()); ++i)
    {
        SCOPED_TRACE(table[i].first);
        const QMetaMethod method = meta.method(offset + i);
        EXPECT_EQ(method.methodSignature().toStdString(), table[i].first);
        EXPECT_EQ(method.methodType(), QMetaMethod::Slot);
        EXPECT_EQ(method.access(), QMetaMethod::Public);
        EXPECT_EQ(meta.indexOfSlot(table[i].first), offset + i);
        std::vector<std::string> names;
        for (const QByteArray& name : method.parameterNames())
            names.push_back(name.toStdString());
        EXPECT_EQ(names, std::vector<std::string>(table[i].second.begin(), table[i].second.end()));
    }
    EXPECT_EQ(meta.propertyCount(), meta.propertyOffset());
}

class ContextTranslator : public QTranslator
{
public:
    QString translate(const char* context, const char* sourceText, const char*, int) const override
    {
        if (QByteArray(context) == "ToolConfigurationCommand" && QByteArray(sourceText) == "Cancel")
            return QStringLiteral("Abbrechen");
        return QString();
    }
    bool isEmpty() const override { return false; }
};

TEST(ToolConfigurationMetaObject, TranslationsUseTheClassContext)
{
    EXPECT_EQ(ToolConfigurationCommand::tr("Cancel"), QStringLiteral("Cancel"));
    EXPECT_EQ(ToolConfigurationCommand::trUtf8("Cancel"), QStringLiteral("Cancel"));
    ContextTranslator translator;
    ASSERT_TRUE(QCoreApplication::installTranslator(&translator));
    EXPECT_EQ(ToolConfigurationCommand::tr("Cancel"), QStringLiteral("Abbrechen"));
    EXPECT_EQ(ToolConfigurationCommand::trUtf8("Cancel", nullptr), QStringLiteral("Abbrechen"));
    EXPECT_EQ(ToolConfigurationCommand::trUtf8("Müller"), QString::fromUtf8("Müller"));
    QCoreApplication::removeTranslator(&translator);
}

TEST_F(ToolConfigurationTest, CastsToItsBases)
{
    ToolConfigurationCommand& command = makeCommand();
    EXPECT_EQ(command.qObject(), static_cast<QObject*>(&command));
    EXPECT_EQ(command.qt_metacast("ToolConfigurationCommand"), static_cast<void*>(&command));
    EXPECT_EQ(command.qt_metacast("Handler<CustomEvent>"),
              static_cast<void*>(static_cast<Handler<CustomEvent>*>(&command)));
    EXPECT_EQ(command.qt_metacast("QObject"), static_cast<void*>(static_cast<QObject*>(&command)));
    EXPECT_EQ(command.qt_metacast("Nothing"), nullptr);
    EXPECT_EQ(command.getCommandID(), QStringLiteral("WC_TOOLCONFIGURATION"));
}

// ---------------------------------------------------------------------------------------------
// Publication

TEST_F(ToolConfigurationTest, PublishesEditRecordsFromTheStores)
{
    writeWorkshop("Müller & Søn \xF0\x9D\x84\x9E");
    ToolConfigurationCommand& command = makeCommand();
    const std::vector<std::pair<std::string, std::string>> table = {
        {"ProjectNumberEdit", "BN-42"},
        {"CompanyNameEdit", "Garage du Pont"},
        {"NameEdit", "Müller & Søn \xF0\x9D\x84\x9E"},
        {"StreetEdit", "1 rue Haute"},
        {"PhoneNumberEdit", "0102030405"},
        {"FaxNumberEdit", "0607080910"},
        {"DistributionFolderPath", "/srv/dist"},
        {"App2AppPort", "8080"},
        {"App2AppIP", "10.0.0.7"},
        {"App2AppDealerID", "D77"},
    };
    for (const auto& [name, text] : table)
    {
        SCOPED_TRACE(name);
        EXPECT_EQ(keysOf(record(name)), (std::vector<std::string>{"state", "value"}));
        EXPECT_EQ(state(name), 3);
        EXPECT_EQ(item(name), text);
    }

    const BSet town = record("TownPostCodeEdit");
    EXPECT_EQ(keysOf(town), (std::vector<std::string>{"state", "edit1", "edit2"}));
    ACE_WString edit1, edit2;
    town.getString(L"edit1", edit1);
    town.getString(L"edit2", edit2);
    EXPECT_EQ(utf8(edit1), "69001");
    EXPECT_EQ(utf8(edit2), "Lyon");

    EXPECT_EQ(publishedString("TaskTimeEdit"), "07:30:00");
    EXPECT_FALSE(publishedBool("CheckInternet"));
    EXPECT_FALSE(publishedBool("ASRMChk"));
    EXPECT_EQ(publishedString("ActivePreparateur"), m_updatePath);

    EXPECT_EQ(Access::app2AppIP(command), "10.0.0.7");
    const BSet& cache = Access::app2AppValues(command);
    EXPECT_EQ(keysOf(cache), (std::vector<std::string>{"App2AppPort", "App2AppIP", "App2AppDealerID"}));
    ACE_WString dealer;
    cache.getString(L"App2AppDealerID", dealer);
    EXPECT_EQ(utf8(dealer), "D77");
}

TEST_F(ToolConfigurationTest, UpdateStoreDefaultsReachTheDialog)
{
    // Mode "OTHER" shows the store's own (defaulted) distribution folder.
    BSet set(10);
    set.setBool(L"OnlineUpdateActivated", true);
    set.setString(L"DeploymentMode", L"OTHER");
    save(set, m_updatePath);
    makeCommand();
    EXPECT_EQ(publishedString("TaskTimeEdit"), "11:00:00");
    EXPECT_EQ(item("DistributionFolderPath"), "");
    EXPECT_TRUE(publishedBool("CheckInternet"));
}

struct ConfigTextCase
{
    const char* label;
    const char* value;   // stored at the configuration URI; null leaves it absent
    const char* textId;  // a text of the text component; null for none
    const char* text;
    const char* expected;
};

void PrintTo(const ConfigTextCase& c, std::ostream* os)
{
    *os << c.label;
}

class StaticConfigTest : public ToolConfigurationTest, public ::testing::WithParamInterface<ConfigTextCase>
{
};

TEST_P(StaticConfigTest, CountryIsShownTranslatedWhenItNamesAText)
{
    const ConfigTextCase& c = GetParam();
    if (c.value != nullptr)
        setConfig(L"data:/Configuration/DoC/SoftInformation/InstallCountry", c.value);
    if (c.textId != nullptr)
        m_text->setText(wide(c.textId), wide(c.text));
    makeCommand();
    EXPECT_EQ(keysOf(record("Country")), (std::vector<std::string>{"state", "value"}));
    EXPECT_EQ(state("Country"), 19);
    EXPECT_EQ(item("Country"), c.expected);
}

INSTANTIATE_TEST_SUITE_P(
    Values, StaticConfigTest,
    ::testing::Values(ConfigTextCase{"Reference", "abc#12", "12", "Frankreich", "Frankreich"},
                      ConfigTextCase{"ReferenceWithoutText", "abc#12", nullptr, nullptr, "abc"},
                      ConfigTextCase{"Plain", "France", "France", "no", "France"},
                      ConfigTextCase{"FirstHashSplits", "a#b#c", "b#c", "BC", "BC"},
                      ConfigTextCase{"EmptyIdentifier", "abc#", "", "from empty id", "from empty id"},
                      ConfigTextCase{"Absent", nullptr, nullptr, nullptr, ""}),
    [](const auto& info) { return std::string(info.param.label); });

TEST_F(ToolConfigurationTest, ConfigTextStaysRawWithoutTheTextComponent)
{
    setConfig(L"data:/Configuration/DoC/SoftInformation/InstallLanguage", "Deutsch#40");
    destroyText();
    makeCommand();
    EXPECT_EQ(item("Language"), "Deutsch#40");
    EXPECT_EQ(state("Language"), 19);
    EXPECT_FALSE(hasData("BrandCombo"));
}

TEST_F(ToolConfigurationTest, SerialNumberJoinsVersionAndFormation)
{
    const struct
    {
        const char* version;
        const char* formation;
        const char* expected;
    } table[] = {{"4.2", "F1", "4.2 F1"}, {nullptr, nullptr, " "}, {"V#3", "F1", "Three F1"}};
    m_text->setText(L"3", L"Three");
    for (const auto& c : table)
    {
        SCOPED_TRACE(c.expected);
        m_dataManager->removeData(ID(L"data:/Configuration/DoC/SoftInformation/Version"));
        m_dataManager->removeData(ID(L"data:/Configuration/DoC/SoftInformation/VersionFormation"));
        if (c.version != nullptr)
            setConfig(L"data:/Configuration/DoC/SoftInformation/Version", c.version);
        if (c.formation != nullptr)
            setConfig(L"data:/Configuration/DoC/SoftInformation/VersionFormation", c.formation);
        makeCommand();
        EXPECT_EQ(item("SerialNo"), c.expected);
        EXPECT_EQ(state("SerialNo"), 19);
    }
}

TEST_F(ToolConfigurationTest, NetworkFieldsComeFromTheIniFileAndTheConfiguration)
{
    const std::string ini = m_dir.file("Applet/conf_hf.ini");
    TempDir::write(ini, "[TEST]\nFlag_HF=1\nNetWork=192.168.1.4\n[REPROGRAMMATION]\nNom_Browser1=viewer\n");
    setConfig(kIniUri, ini);
    setConfig(L"data:/Configuration/MenuBar/ToolConfigData/DiagnosticURL", "http://diag");
    setConfig(L"data:/Configuration/MenuBar/ToolConfigData/TargetURL", "http://target");
    setConfig(L"data:/Configuration/MenuBar/ToolConfigData/OrbisURL", "http://orbis");
    setConfig(L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagServer", "faults.local");
    setConfig(L"data:/Configuration/DoC/FicheDiagnostic/SMTPServer", "smtp.local");
    makeCommand();
    const std::vector<std::pair<std::string, std::string>> table = {
        {"HFconnection", "1"},   {"IPaddress", "192.168.1.4"},  {"Navigator1", "viewer"},
        {"Navigator2", ""},      {"DiagURL", "http://diag"},    {"TargetURL", "http://target"},
        {"OrbisURL", "http://orbis"}, {"FaultServer", "faults.local"}, {"SMTPServer", "smtp.local"},
    };
    for (const auto& [name, text] : table)
    {
        SCOPED_TRACE(name);
        EXPECT_EQ(state(name), 19);
        EXPECT_EQ(item(name), text);
    }
}

TEST_F(ToolConfigurationTest, IniFieldsAreEmptyWithoutTheIniFile)
{
    for (const bool configured : {false, true})
    {
        SCOPED_TRACE(configured ? "path of a missing file" : "no path");
        if (configured)
            setConfig(kIniUri, m_dir.file("missing.ini"));
        makeCommand();
        for (const char* name : {"HFconnection", "IPaddress", "Navigator1", "Navigator2"})
        {
            EXPECT_EQ(state(name), 19) << name;
            EXPECT_EQ(item(name), "") << name;
        }
    }
}

// Which settings file is broken, and what the publication does about it.
struct BrokenFileCase
{
    const char* label;
    SettingsFile file;
    bool malformed;  // false: missing
    bool published;
    bool usersBuilt;
    bool updateBuilt;
};

void PrintTo(const BrokenFileCase& c, std::ostream* os)
{
    *os << c.label;
}

class BrokenFileTest : public ToolConfigurationTest, public ::testing::WithParamInterface<BrokenFileCase>
{
};

TEST_P(BrokenFileTest, PublicationStopsOnlyAtAStoreThatIsNotLoaded)
{
    const BrokenFileCase& c = GetParam();
    const std::string path = pathOf(c.file);
    std::filesystem::remove(path);
    if (c.malformed)
        TempDir::write(path, "<set><string key=\"nom\">unterminated");
    ToolConfigurationCommand& command = makeCommand();

    ASSERT_NE(Access::workshop(command), nullptr);
    EXPECT_EQ(Access::users(command) != nullptr, c.usersBuilt);
    EXPECT_EQ(Access::update(command) != nullptr, c.updateBuilt);
    EXPECT_EQ(hasData("ProjectNumberEdit"), c.published);
    EXPECT_EQ(hasData("App2AppIP"), c.published);
    EXPECT_EQ(hasData("BrandCombo"), c.published);
    EXPECT_EQ(hasData("TaskTimeEdit"), c.published);
    EXPECT_EQ(hasData("ActivePreparateur"), c.updateBuilt);
    if (c.malformed)
    {
        EXPECT_EQ(TempDir::read(path), "<set><string key=\"nom\">unterminated");
    }
}

INSTANTIATE_TEST_SUITE_P(
    Files, BrokenFileTest,
    ::testing::Values(
        BrokenFileCase{"WorkshopMissing", SettingsFile::eWorkshop, false, true, true, true},
        BrokenFileCase{"WorkshopMalformed", SettingsFile::eWorkshop, true, false, false, false},
        BrokenFileCase{"UsersMissing", SettingsFile::eUsers, false, false, true, false},
        BrokenFileCase{"UsersMalformed", SettingsFile::eUsers, true, false, true, false},
        BrokenFileCase{"UpdateMissing", SettingsFile::eUpdate, false, false, true, true},
        BrokenFileCase{"UpdateMalformed", SettingsFile::eUpdate, true, false, true, true}),
    [](const auto& info) { return std::string(info.param.label); });

TEST_F(ToolConfigurationTest, MissingWorkshopFilePublishesEmptyFieldsAndTheFirstSaveCreatesIt)
{
    std::filesystem::remove(m_workshopPath);
    ToolConfigurationCommand& command = makeCommand();
    for (const char* name : {"ProjectNumberEdit", "CompanyNameEdit", "NameEdit", "StreetEdit", "PhoneNumberEdit"})
    {
        EXPECT_EQ(state(name), 3) << name;
        EXPECT_EQ(item(name), "") << name;
    }
    EXPECT_EQ(item("App2AppPort"), "8080");
    WorkshopInfoUpdater* workshop = Access::workshop(command);
    ASSERT_NE(workshop, nullptr);
    EXPECT_TRUE(workshop->isLoaded());
    command.onNameChanged(QStringLiteral("Neu"));
    EXPECT_TRUE(workshop->save());
    EXPECT_TRUE(std::filesystem::exists(m_workshopPath));
}

TEST_F(ToolConfigurationTest, AFailedRebuildKeepsTheRecordsPublishedBefore)
{
    ToolConfigurationCommand& command = makeCommand();
    UsersUpdater* usersBefore = Access::users(command);
    TempDir::write(m_workshopPath, "not xml at all");
    Access::createDMData(command, false);
    EXPECT_EQ(item("NameEdit"), "Garage Ünal");
    EXPECT_EQ(Access::users(command), usersBefore);
    EXPECT_FALSE(Access::workshop(command)->isLoaded());
}

TEST_F(ToolConfigurationTest, WithoutDataManagerTheStoresAreBuiltFromTheDefaultPaths)
{
    destroyDataManager();
    LogCapture log;
    ToolConfigurationCommand& command = makeCommand();
    ASSERT_NE(Access::workshop(command), nullptr);
    EXPECT_TRUE(log.contains("WorkshopInfoUpdater::load: file '../../Data/User/InformationsGarage.xml' does not "
                             "exist, setting state to empty BSet",
                             TesselLog_Static::eWARNING));
    ASSERT_NE(Access::users(command), nullptr);
    EXPECT_FALSE(Access::users(command)->isLoaded());
    EXPECT_EQ(Access::update(command), nullptr);
}

TEST_F(ToolConfigurationTest, ActivePathIsKeptWithoutResetAndPointedBackWithReset)
{
    const std::string temporary = m_dir.file("User/OnLineUpdate/PreparateurTmp.xml");
    writeUpdate(temporary, "/srv/temporary");
    setConfig(kActiveUri, temporary);

    ToolConfigurationCommand& command = makeCommand();
    EXPECT_EQ(item("DistributionFolderPath"), "/srv/temporary");
    EXPECT_EQ(publishedString("ActivePreparateur"), temporary);

    Access::createDMData(command, true);
    EXPECT_EQ(item("DistributionFolderPath"), "/srv/dist");
    EXPECT_EQ(publishedString("ActivePreparateur"), m_updatePath);

    setConfig(kActiveUri, temporary);
    m_dataManager->removeData(ID(kUpdateUri));
    Access::createDMData(command, true);
    EXPECT_EQ(publishedString("ActivePreparateur"), kDefaultUpdatePath);
}

TEST_F(ToolConfigurationTest, EmptyConfiguredSettingsPathFallsBackOnTheDefault)
{
    setConfig(kUpdateUri, "");
    ToolConfigurationCommand& command = makeCommand();
    EXPECT_EQ(publishedString("ActivePreparateur"), kDefaultUpdatePath);
    ASSERT_NE(Access::update(command), nullptr);
    EXPECT_FALSE(Access::update(command)->isLoaded());
}

TEST_F(ToolConfigurationTest, RecordingModeFollowsThePublishedValueUnlessReset)
{
    ASSERT_EQ(m_dataManager->createData(controlUri("ASRMChk"), BBool(true)), 0);
    ToolConfigurationCommand& command = makeCommand();
    EXPECT_TRUE(Access::recordingMode(command));
    EXPECT_TRUE(publishedBool("ASRMChk"));

    Access::setRecordingMode(command, false);
    Access::createDMData(command, true);
    EXPECT_FALSE(publishedBool("ASRMChk"));
    EXPECT_FALSE(Access::recordingMode(command));

    ASSERT_EQ(m_dataManager->setData(controlUri("ASRMChk"), BBool(true)), 0);
    Access::createDMData(command, true);
    EXPECT_FALSE(publishedBool("ASRMChk"));
}

// ---------------------------------------------------------------------------------------------
// Brand list

class BrandComboTest : public ToolConfigurationTest
{
protected:
    void publishBrands()
    {
        BSet brands(10);
        brands.setString(L"2", L"b2");
        brands.setString(L"10", L"b10");
        brands.setString(L"1", L"b1");
        brands.setString(L"0005", L"Five");
        brands.setString(L"7", L"Seven");
        ASSERT_EQ(m_dataManager->createData(ID(kBrandsUri), brands), 0);
        m_text->setText(L"1", L"One");
        m_text->setText(L"2", L"Two");
        m_text->setText(L"10", L"Ten");
    }

    std::string selected() const
    {
        ACE_WString text(L"<missing>");
        record("BrandCombo").getString(L"selected", text);
        return utf8(text);
    }

    std::vector<std::pair<std::string, std::string>> items() const
    {
        BSet value(10);
        EXPECT_EQ(record("BrandCombo").getSet(L"value", value), 0);
        std::vector<std::pair<std::string, std::string>> result;
        for (int i = 0; i < value.size(); ++i)
        {
            ACE_WString label;
            value.getString(value.keyAt(i), label);
            result.emplace_back(utf8(value.keyAt(i)), utf8(label));
        }
        return result;
    }
};

TEST_F(BrandComboTest, ItemsArePaddedSortedAndLabelledUnderThePaddedKeys)
{
    publishBrands();
    ToolConfigurationCommand& command = makeCommand();
    EXPECT_EQ(keysOf(record("BrandCombo")), (std::vector<std::string>{"state", "value", "selected"}));
    EXPECT_EQ(state("BrandCombo"), 3);
    // Short keys find no default label under their padded form; "0005" does.
    const std::vector<std::pair<std::string, std::string>> expected = {
        {"0001", "One"}, {"0002", "Two"}, {"0005", "Five"}, {"0007", ""}, {"0010", "Ten"}};
    EXPECT_EQ(items(), expected);
    EXPECT_EQ(selected(), "One");
    EXPECT_EQ(utf8(Access::workshop(command)->getDefaultBrand()), "One");
}

TEST_F(BrandComboTest, StoredDefaultBrandIsSelected)
{
    publishBrands();
    writeWorkshop("Garage", "10");
    ToolConfigurationCommand& command = makeCommand();
    EXPECT_EQ(selected(), "Ten");
    EXPECT_EQ(utf8(Access::workshop(command)->getDefaultBrand()), "Ten");
}

TEST_F(BrandComboTest, EmptyBrandSetGivesAnEmptyCombo)
{
    makeCommand();
    EXPECT_TRUE(items().empty());
    EXPECT_EQ(selected(), "");
}

// ---------------------------------------------------------------------------------------------
// init

struct InitCase
{
    const char* label;
    const wchar_t* unreachable;  // component that hands out no proxy
    bool refuseRegistration;
    bool result;
    const char* message;
    int level;
    bool registered;
    bool messageBox;
    bool text;
    bool updateAgent;
};

void PrintTo(const InitCase& c, std::ostream* os)
{
    *os << c.label;
}

// Registration is refused by the events library when the handler is already there.
class RefusedRegistrationCommand : public ToolConfigurationCommand
{
public:
    using ToolConfigurationCommand::ToolConfigurationCommand;
    int Register(const ID&) override { return EventRegistry::eALREADY_REGISTERED; }
};

class InitTest : public ToolConfigurationTest, public ::testing::WithParamInterface<InitCase>
{
};

TEST_P(InitTest, StopsAtTheFirstMissingPiece)
{
    const InitCase& c = GetParam();
    registerFrameworkComponents(c.unreachable);
    if (c.refuseRegistration)
        m_command = std::make_unique<RefusedRegistrationCommand>(QStringLiteral("WC_TOOLCONFIGURATION"));
    else
        makeCommand();
    ToolConfigurationCommand& command = *m_command;

    LogCapture log;
    EXPECT_EQ(command.init(), c.result);
    EXPECT_TRUE(log.contains("[ToolConfigurationCommand::init] : Method started", TesselLog_Static::eTRACE));
    if (c.message != nullptr)
    {
        EXPECT_TRUE(log.contains(c.message, c.level)) << c.message;
    }
    EXPECT_EQ(command.isRegistered(), c.registered);
    EXPECT_EQ(EventRegistry::instance().isRegistered(typeid(CustomEvent).name(),
                                                     static_cast<Handler<CustomEvent>*>(&command),
                                                     ToolConfigurationCommand::m_ID),
              c.registered);
    EXPECT_EQ(Access::messageBoxAcquired(command), c.messageBox);
    EXPECT_EQ(Access::textAcquired(command), c.text);
    EXPECT_EQ(Access::updateAgentAcquired(command), c.updateAgent);
    if (m_watcher != nullptr)
    {
        EXPECT_EQ(m_watcher->isRunning(), c.result);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Steps, InitTest,
    ::testing::Values(
        InitCase{"AllPresent", nullptr, false, true, nullptr, 0, true, true, true, true},
        InitCase{"NoWatcher", CQ17FileSystemWatcher::componentID, false, false,
                 "[ToolConfigurationCommand::init()] : Failed to get proxy to Q17FilSystemWatcher.",
                 TesselLog_Static::eWARNING, false, false, false, false},
        InitCase{"RegistrationRefused", nullptr, true, false,
                 "[ToolConfigurationCommand::init()] : Failed to register for CustomEvent.",
                 TesselLog_Static::eWARNING, false, false, false, false},
        InitCase{"NoMessageBoxManager", L"tessel:Navigation?MessageBoxManager", false, false,
                 "[ToolConfigurationCommand::init()] Message Box Manager cannot be initialized.",
                 TesselLog_Static::eTRACE, true, false, false, false},
        InitCase{"NoText", L"tessel:BText?BText", false, false,
                 "[ToolConfigurationCommand::init()] BText cannot be initialized.", TesselLog_Static::eTRACE,
                 true, true, false, false},
        InitCase{"NoUpdateAgent", L"proc:ProcStartUpdateAgent?ProcStartUpdateAgent", false, false,
                 "[ToolConfigurationCommand::init()] Cannot get proxy to ProcStartUpdateAgent.",
                 TesselLog_Static::eTRACE, true, true, true, false}),
    [](const auto& info) { return std::string(info.param.label); });

// ---------------------------------------------------------------------------------------------
// File-changed events

enum class PathSpelling
{
    eAsConfigured,
    eUpperCase,
    eDoubledSeparator,
    eUnrelated
};

struct EventCase
{
    const char* label;
    int type;
    SettingsFile file;
    PathSpelling spelling;
    bool rebuilt;
};

void PrintTo(const EventCase& c, std::ostream* os)
{
    *os << c.label;
}

class FileEventTest : public ToolConfigurationTest, public ::testing::WithParamInterface<EventCase>
{
protected:
    std::string eventPath(const EventCase& c) const
    {
        std::string path = pathOf(c.file);
        switch (c.spelling)
        {
        case PathSpelling::eAsConfigured:
            break;
        case PathSpelling::eUpperCase:
            for (char& ch : path)
                ch = static_cast<char>(std::toupper(static_cast<unsigned char>(ch)));
            break;
        case PathSpelling::eDoubledSeparator:
            path.insert(path.rfind('/'), "/");
            break;
        case PathSpelling::eUnrelated:
            path = m_dir.file("User/Other.xml");
            break;
        }
        return path;
    }
};

TEST_P(FileEventTest, RebuildsOnlyForTheSettingsFiles)
{
    const EventCase& c = GetParam();
    registerFrameworkComponents();
    ToolConfigurationCommand& command = makeCommand();
    ASSERT_TRUE(command.init());
    writeWorkshop("Renamed");
    writeUsers("9090");

    LogCapture log;
    EXPECT_EQ(BEvent<CustomEvent>::post(ToolConfigurationCommand::m_ID, CustomEvent(c.type, wide(eventPath(c)))), 1);
    EXPECT_TRUE(log.contains("[ToolConfigurationCommand::handleEvent(CustomEvent)]: Method started.",
                             TesselLog_Static::eTRACE));
    EXPECT_EQ(log.contains("[ToolConfigurationCommand::createDMData] : Method started"), c.rebuilt);
    EXPECT_EQ(item("NameEdit"), c.rebuilt ? "Renamed" : "Garage Ünal");
    EXPECT_EQ(item("App2AppPort"), c.rebuilt ? "9090" : "8080");
}

INSTANTIATE_TEST_SUITE_P(
    Paths, FileEventTest,
    ::testing::Values(EventCase{"Workshop", 668, SettingsFile::eWorkshop, PathSpelling::eAsConfigured, true},
                      EventCase{"Users", 668, SettingsFile::eUsers, PathSpelling::eAsConfigured, true},
                      EventCase{"Settings", 668, SettingsFile::eUpdate, PathSpelling::eAsConfigured, true},
                      EventCase{"OtherFile", 668, SettingsFile::eWorkshop, PathSpelling::eUnrelated, false},
                      EventCase{"LetterCase", 668, SettingsFile::eWorkshop, PathSpelling::eUpperCase, false},
                      EventCase{"Separators", 668, SettingsFile::eUsers, PathSpelling::eDoubledSeparator, false},
                      EventCase{"OtherType", 667, SettingsFile::eWorkshop, PathSpelling::eAsConfigured, false}),
    [](const auto& info) { return std::string(info.param.label); });

TEST_F(ToolConfigurationTest, EventForTheDefaultSettingsPathWhenTheConfiguredOneIsEmpty)
{
    ToolConfigurationCommand& command = makeCommand();
    writeWorkshop("Renamed");
    setConfig(kUpdateUri, "");
    LogCapture log;
    Access::handleEvent(command, CustomEvent(668, wide("")));
    EXPECT_EQ(item("NameEdit"), "Garage Ünal");
    Access::handleEvent(command, CustomEvent(668, wide(kDefaultUpdatePath)));
    EXPECT_EQ(item("NameEdit"), "Renamed");
}

// ---------------------------------------------------------------------------------------------
// Workshop and App2App field slots

struct FieldSlotCase
{
    const char* slot;
    const char* control;
    std::function<ACE_WString(WorkshopInfoUpdater&)> stored;
};

void PrintTo(const FieldSlotCase& c, std::ostream* os)
{
    *os << c.slot;
}

class WorkshopSlotTest : public ToolConfigurationTest, public ::testing::WithParamInterface<FieldSlotCase>
{
};

TEST_P(WorkshopSlotTest, RepublishesEditableAndWritesTheStore)
{
    const FieldSlotCase& c = GetParam();
    ToolConfigurationCommand& command = makeCommand();
    for (const QString& value : {QString::fromUtf8("Ça \xF0\x9D\x84\x9E va"), QString()})
    {
        SCOPED_TRACE(value.toStdString());
        LogCapture log;
        ASSERT_TRUE(QMetaObject::invokeMethod(&command, c.slot, Q_ARG(QString, value)));
        EXPECT_TRUE(log.contains(std::string("[ToolConfigurationCommand::") + c.slot + "] : Method started",
                                 TesselLog_Static::eTRACE));
        EXPECT_EQ(state(c.control), 3);
        EXPECT_EQ(item(c.control), value.toStdString());
        EXPECT_EQ(utf8(c.stored(*Access::workshop(command))), value.toStdString());
    }
}

INSTANTIATE_TEST_SUITE_P(
    Slots, WorkshopSlotTest,
    ::testing::Values(
        FieldSlotCase{"onProjectNumberChanged", "ProjectNumberEdit", [](WorkshopInfoUpdater& s) { return s.getBusinessNumber(); }},
        FieldSlotCase{"onCompanyNameChanged", "CompanyNameEdit", [](WorkshopInfoUpdater& s) { return s.getCorporateName(); }},
        FieldSlotCase{"onNameChanged", "NameEdit", [](WorkshopInfoUpdater& s) { return s.getName(); }},
        FieldSlotCase{"onStreetChanged", "StreetEdit", [](WorkshopInfoUpdater& s) { return s.getRoad(); }},
        FieldSlotCase{"onPhoneNumberChanged", "PhoneNumberEdit", [](WorkshopInfoUpdater& s) { return s.getTelephone(); }},
        FieldSlotCase{"onFaxNumberChanged", "FaxNumberEdit", [](WorkshopInfoUpdater& s) { return s.getFax(); }}),
    [](const auto& info) { return std::string(info.param.control); });

TEST_F(ToolConfigurationTest, TownAndPostCodeGoToEdit1AndEdit2AndTheStore)
{
    ToolConfigurationCommand& command = makeCommand();
    command.onTownOrPostCodeChanged(QStringLiteral("75002"), QStringLiteral("Paris"));
    const BSet town = record("TownPostCodeEdit");
    EXPECT_EQ(keysOf(town), (std::vector<std::string>{"state", "edit1", "edit2"}));
    long stateValue = 0;
    ACE_WString edit1, edit2;
    town.getInt(L"state", stateValue);
    town.getString(L"edit1", edit1);
    town.getString(L"edit2", edit2);
    EXPECT_EQ(stateValue, 3);
    EXPECT_EQ(utf8(edit1), "75002");
    EXPECT_EQ(utf8(edit2), "Paris");
    EXPECT_EQ(utf8(Access::workshop(command)->getTown()), "Paris");
    EXPECT_EQ(utf8(Access::workshop(command)->getPostalCode()), "75002");
}

TEST_F(ToolConfigurationTest, TownIsWrittenBeforeThePostCode)
{
    TempDir::write(m_workshopPath, "<broken");
    ToolConfigurationCommand& command = makeCommand();
    LogCapture log;
    command.onTownOrPostCodeChanged(QStringLiteral("75002"), QStringLiteral("Paris"));
    std::vector<std::string> errors = log.messages(TesselLog_Static::eERROR);
    errors.erase(std::remove_if(errors.begin(), errors.end(),
                                [](const std::string& m) { return m.find("WorkshopInfoUpdater::set") != 0; }),
                 errors.end());
    EXPECT_EQ(errors, (std::vector<std::string>{"WorkshopInfoUpdater::setTown: not loaded",
                                                "WorkshopInfoUpdater::setPostalCode: not loaded"}));
}

TEST_F(ToolConfigurationTest, ManufacturerSlotOnlyWritesTheDefaultBrand)
{
    BSet brands(10);
    brands.setString(L"1", L"b1");
    brands.setString(L"10", L"b10");
    ASSERT_EQ(m_dataManager->createData(ID(kBrandsUri), brands), 0);
    m_text->setText(L"10", L"Ten");
    ToolConfigurationCommand& command = makeCommand();
    const BSet before = record("BrandCombo");
    command.onManufacturerChanged(QStringLiteral("Ten"));
    EXPECT_EQ(utf8(Access::workshop(command)->getDefaultBrand()), "Ten");
    EXPECT_TRUE(record("BrandCombo").equals(before));
}

TEST_F(ToolConfigurationTest, App2AppSlotsFillTheCacheButNotTheShareAddress)
{
    ToolConfigurationCommand& command = makeCommand();
    const struct
    {
        const char* slot;
        const char* control;
        const char* value;
    } table[] = {{"onPortChanged", "App2AppPort", "9999"},
                 {"onIPAddressChanged", "App2AppIP", "010.001.002.003"},
                 {"onDealerIDChanged", "App2AppDealerID", ""}};
    for (const auto& c : table)
    {
        SCOPED_TRACE(c.slot);
        ASSERT_TRUE(QMetaObject::invokeMethod(&command, c.slot, Q_ARG(QString, QString::fromUtf8(c.value))));
        EXPECT_EQ(state(c.control), 3);
        EXPECT_EQ(item(c.control), c.value);
        ACE_WString cached(L"<missing>");
        Access::app2AppValues(command).getString(wide(c.control), cached);
        EXPECT_EQ(utf8(cached), c.value);
    }
    EXPECT_EQ(Access::app2AppIP(command), "10.0.0.7");
    // The users store is not touched before OK.
    EXPECT_EQ(utf8(Access::users(command)->getApp2AppIP()), "10.0.0.7");
}

TEST_F(ToolConfigurationTest, SlotsNeedTheDataManager)
{
    // Without a data manager the workshop store comes from the default path: empty, loaded.
    destroyDataManager();
    ASSERT_EQ(UnreachableComponent::registerWith(*m_manager, CDataManager::componentID), 0);
    ToolConfigurationCommand& command = makeCommand();
    WorkshopInfoUpdater* workshop = Access::workshop(command);
    ASSERT_NE(workshop, nullptr);
    ASSERT_TRUE(workshop->isLoaded());
    LogCapture log;
    command.onNameChanged(QStringLiteral("Other"));
    command.onTownOrPostCodeChanged(QStringLiteral("1"), QStringLiteral("2"));
    command.onIPAddressChanged(QStringLiteral("1.2.3.4"));
    EXPECT_EQ(utf8(workshop->getName()), "");
    EXPECT_EQ(utf8(workshop->getTown()), "");
    EXPECT_FALSE(Access::app2AppValues(command).contains(L"App2AppIP"));
    EXPECT_TRUE(log.contains("[ToolConfigurationCommand::onIPAddressChanged] : Method started"));
    EXPECT_FALSE(log.containsSubstring("updateData"));
}

// ---------------------------------------------------------------------------------------------
// Destruction

TEST_F(ToolConfigurationTest, DestructionUnregistersAndDeletesTheStores)
{
    registerFrameworkComponents();
    ToolConfigurationCommand& command = makeCommand();
    ASSERT_TRUE(command.init());
    LogCapture log;
    m_command.reset();

    std::vector<std::string> destructors;
    for (const std::string& m : log.messages(TesselLog_Static::eTRACE))
        if (m.find("Destructor started") != std::string::npos)
            destructors.push_back(m);
    EXPECT_EQ(destructors, (std::vector<std::string>{
                               "[ToolConfigurationCommand::~ToolConfigurationCommand] : Destructor started",
                               "[WorkshopInfoUpdater::~WorkshopInfoUpdater()]: Destructor started.",
                               "[UsersUpdater::~UsersUpdater()]: Destructor started.",
                               "[UpdateUpdater::~UpdateUpdater()]: Destructor started."}));
    EXPECT_TRUE(log.messages(TesselLog_Static::eWARNING).empty());
    EXPECT_TRUE(log.messages(TesselLog_Static::eERROR).empty());
    EXPECT_EQ(BEvent<CustomEvent>::post(ToolConfigurationCommand::m_ID, CustomEvent(668, wide(m_workshopPath))), 0);
}

TEST_F(ToolConfigurationTest, DestructionWithoutRegistrationWarnsAndGoesOn)
{
    makeCommand();
    LogCapture log;
    m_command.reset();
    EXPECT_TRUE(log.contains("[ToolConfigurationCommand::~ToolConfigurationCommand] : Failed to unregister for "
                             "CustomEvent.",
                             TesselLog_Static::eWARNING));
    EXPECT_TRUE(log.contains("[UpdateUpdater::~UpdateUpdater()]: Destructor started."));
}
}
