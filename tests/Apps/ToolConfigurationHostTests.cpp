#include "BSet.h"
#include "BString.h"
#include "CDataManager.h"
#include "Dialog_EditDiagUserInfo.h"
#include "ID.h"
#include "LogCapture.h"
#include "ModalDriver.h"
#include "TempDir.h"
#include "ToolConfigurationDialog.h"
#include "ToolConfigurationHost.h"
#include "WideString.h"

#include <gtest/gtest.h>

#include <QApplication>
#include <QCheckBox>
#include <QComboBox>
#include <QEventLoop>
#include <QImage>
#include <QLineEdit>
#include <QProcess>
#include <QPushButton>
#include <QRadioButton>
#include <QSet>
#include <QTimeEdit>
#include <QTimer>
#include <QTreeWidget>

#include <filesystem>
#include <functional>
#include <string>
#include <thread>
#include <vector>

namespace
{
const char* const kWorkshopFile = "User/InformationsGarage.xml";
const char* const kUsersFile = "User/FicheDiagParams.xml";
const char* const kUpdateFile = "User/OnLineUpdate/Preparateur.xml";

std::string utf8(const QString& text)
{
    return text.toStdString();
}

ACE_WString wide(const std::string& text)
{
    return WideString::fromUtf8(text);
}

// Runs the event loop until `done` holds or `timeoutMs` passes; true when it holds.
bool waitFor(const std::function<bool()>& done, int timeoutMs = 10000)
{
    QEventLoop loop;
    QTimer poll;
    QTimer timeout;
    QObject::connect(&poll, &QTimer::timeout, &loop, [&]() {
        if (done())
            loop.quit();
    });
    QObject::connect(&timeout, &QTimer::timeout, &loop, &QEventLoop::quit);
    poll.start(20);
    timeout.setSingleShot(true);
    timeout.start(timeoutMs);
    if (!done())
        loop.exec();
    return done();
}

// Distinct colours among the image's pixels (every pixel of a reduced copy).
int distinctColours(const QImage& image)
{
    const QImage small = image.scaled(image.width() / 2, image.height() / 2).convertToFormat(QImage::Format_RGB32);
    QSet<QRgb> colours;
    for (int y = 0; y < small.height(); ++y)
        for (int x = 0; x < small.width(); ++x)
            colours.insert(small.pixel(x, y));
    return colours.size();
}

class HostTest : public ::testing::Test
{
protected:
    void SetUp() override
    {
        std::filesystem::copy(PTC_DEMO_DIR, m_dir.path(), std::filesystem::copy_options::recursive);
        ASSERT_TRUE(m_host.start(QString::fromStdString(m_dir.path().string()), QString(), language()))
            << utf8(m_host.error());
        m_dialog = m_host.dialog();
        ASSERT_NE(m_dialog, nullptr);
        m_dialog->show();
        QApplication::processEvents();
    }

    virtual QString language() const { return QStringLiteral("en"); }

    template <class W>
    W* widget(const char* name) const
    {
        W* found = m_dialog->findChild<W*>(QLatin1String(name));
        EXPECT_NE(found, nullptr) << name;
        return found;
    }
    QString text(const char* name) const
    {
        const auto* edit = widget<QLineEdit>(name);
        return edit != nullptr ? edit->text() : QStringLiteral("<missing>");
    }
    QTreeWidget* usersList() const { return widget<QTreeWidget>("UsersList"); }
    QStringList userNames() const
    {
        QStringList names;
        for (int i = 0; i < usersList()->topLevelItemCount(); ++i)
            names << usersList()->topLevelItem(i)->text(0);
        return names;
    }
    void set(const char* control, const QString& value)
    {
        QString error;
        EXPECT_TRUE(m_dialog->setFieldValue(QLatin1String(control), value, &error)) << control << ": " << utf8(error);
    }

    std::string path(const char* relative) const { return m_dir.file(relative); }
    // The string at the key path (keys separated by '/') of a settings file; "<none>" when absent.
    std::string fileValue(const char* file, const std::string& keyPath) const
    {
        BSet set;
        if (!set.load(wide(path(file))))
            return "<unreadable>";
        std::string rest = keyPath;
        for (size_t slash = rest.find('/'); slash != std::string::npos; slash = rest.find('/'))
        {
            BSet inner;
            if (set.getSet(wide(rest.substr(0, slash)), inner) != 0)
                return "<none>";
            set = inner;
            rest = rest.substr(slash + 1);
        }
        ACE_WString value;
        if (set.getString(wide(rest), value) == 0)
            return WideString::toUtf8(value);
        bool flag = false;
        if (set.getBool(wide(rest), flag) == 0)
            return flag ? "true" : "false";
        return "<none>";
    }
    void publishEdit(const char* control, const std::string& value)
    {
        BSet record;
        record.setInt(L"state", 3);
        BSet inner;
        inner.setString(L"item", wide(value));
        record.setSet(L"value", inner);
        m_host.dataManager()->setData(ID(wide(std::string("data:/Auto/SystemMenu/") + control)), record);
    }

    TempDir m_dir;
    ToolConfigurationHost m_host;
    ToolConfigurationDialog* m_dialog = nullptr;
};

class FrenchHostTest : public HostTest
{
protected:
    QString language() const override { return QStringLiteral("fr"); }
};

struct FieldCase
{
    const char* control;
    const char* text;
    bool readOnly;
};

TEST_F(HostTest, FieldsShowTheSettingsFilesAndTheConfiguration)
{
    const FieldCase cases[] = {
        {"ProjectNumberEdit", "WS-104522", false},
        {"CompanyNameEdit", "Harbour Lane Motors Ltd", false},
        {"NameEdit", "Harbour Lane Motors", false},
        {"StreetEdit", "14 Harbour Lane", false},
        {"TownPostCodeEdit_PostCode", "PO1 3AX", false},
        {"TownPostCodeEdit_Town", "Portsmouth", false},
        {"PhoneNumberEdit", "+44 23 9200 0104", false},
        {"FaxNumberEdit", "+44 23 9200 0105", false},
        {"App2AppIP", "192.168.10.20", false},
        {"App2AppPort", "8080", false},
        {"App2AppDealerID", "D-0457", false},
        {"DistributionFolderPath", "/srv/updates/repository", false},
        {"Country", "United Kingdom", true},
        {"Language", "English", true},
        {"SerialNo", "4.2.1 F1", true},
        {"HFconnection", "1", true},
        {"IPaddress", "192.168.10.0/24", true},
        {"Navigator2", "System browser", true},
        {"DiagURL", "https://diagnostic.example.net/portal", true},
        {"SMTPServer", "smtp.example.net", true},
    };
    for (const FieldCase& field : cases)
    {
        SCOPED_TRACE(field.control);
        const auto* edit = widget<QLineEdit>(field.control);
        ASSERT_NE(edit, nullptr);
        EXPECT_EQ(utf8(edit->text()), field.text);
        EXPECT_EQ(edit->isReadOnly(), field.readOnly);
    }

    const auto* brands = widget<QComboBox>("BrandCombo");
    ASSERT_EQ(brands->count(), 20);
    EXPECT_EQ(utf8(brands->itemText(0)), "Aldaris");
    EXPECT_EQ(utf8(brands->itemText(5)), "Falcourt") << "key 10 sorts after 7";
    EXPECT_EQ(utf8(brands->itemText(19)), "Tavira");
    EXPECT_EQ(utf8(brands->currentText()), "Estrella");

    EXPECT_FALSE(widget<QRadioButton>("LocalRadioButton")->isChecked());
    EXPECT_FALSE(widget<QRadioButton>("A2ARadioButton")->isChecked());
    EXPECT_TRUE(widget<QRadioButton>("OtherRadioButton")->isChecked());
    EXPECT_TRUE(widget<QPushButton>("FolderBrowserButton")->isEnabled());
    EXPECT_TRUE(widget<QCheckBox>("CheckInternet")->isChecked());
    EXPECT_FALSE(widget<QCheckBox>("ASRMChk")->isChecked());
    EXPECT_EQ(utf8(widget<QTimeEdit>("TaskTimeEdit")->time().toString(QStringLiteral("HH:mm:ss"))), "07:30:00");

    ASSERT_EQ(usersList()->topLevelItemCount(), 3);
    const QTreeWidgetItem* third = usersList()->topLevelItem(2);
    EXPECT_EQ(utf8(third->text(0)), "Chloé Dubois");
    EXPECT_EQ(utf8(third->text(1)), "31 Elm Grove, Southsea");
    EXPECT_EQ(utf8(third->text(2)), "+44 23 9200 0113");
}

TEST_F(FrenchHostTest, LabelsAndTranslatedValuesComeFromTheFrenchCatalogue)
{
    EXPECT_EQ(utf8(m_dialog->windowTitle()), "Configuration de l'outil");
    EXPECT_EQ(utf8(widget<QPushButton>("CancelButton")->text()), "Annuler");
    EXPECT_EQ(utf8(text("Country")), "Royaume-Uni");
    EXPECT_EQ(utf8(text("Language")), "Anglais");
}

TEST_F(HostTest, EditsMadeThroughTheWidgetsAreWrittenOnOK)
{
    set("NameEdit", QStringLiteral("Quayside Motors"));
    set("TownPostCodeEdit_PostCode", QStringLiteral("SO14 2AA"));
    set("TownPostCodeEdit_Town", QStringLiteral("Southampton"));
    set("PhoneNumberEdit", QStringLiteral("+44 23 8000 0001"));
    set("BrandCombo", QStringLiteral("Garrow"));
    set("App2AppIP", QStringLiteral("010.001.002.003"));
    set("App2AppPort", QStringLiteral("9090"));
    set("TaskTimeEdit", QStringLiteral("06:15:00"));
    set("CheckInternet", QStringLiteral("0"));
    set("LocalRadioButton", QStringLiteral("1"));

    // The local mode fixes the folder: shown read-only, no browsing.
    EXPECT_EQ(utf8(text("DistributionFolderPath")), "c:\\TLD_REPOSITORY");
    EXPECT_TRUE(widget<QLineEdit>("DistributionFolderPath")->isReadOnly());
    EXPECT_FALSE(widget<QPushButton>("FolderBrowserButton")->isEnabled());

    ASSERT_TRUE(m_dialog->clickButton(QStringLiteral("OKButton")));
    QApplication::processEvents();

    EXPECT_FALSE(m_dialog->isVisible()) << "OK closes the window through the mediator";
    EXPECT_EQ(fileValue(kWorkshopFile, "nom"), "Quayside Motors");
    EXPECT_EQ(fileValue(kWorkshopFile, "codepostal"), "SO14 2AA");
    EXPECT_EQ(fileValue(kWorkshopFile, "ville"), "Southampton");
    EXPECT_EQ(fileValue(kWorkshopFile, "telephone"), "+44 23 8000 0001");
    EXPECT_EQ(fileValue(kWorkshopFile, "default_brand"), "12");
    EXPECT_EQ(fileValue(kUsersFile, "App2App/IP"), "10.1.2.3");
    EXPECT_EQ(fileValue(kUsersFile, "App2App/Port"), "9090");
    EXPECT_EQ(utf8(text("App2AppIP")), "10.1.2.3") << "the window shows the address as saved";
    EXPECT_EQ(fileValue(kUpdateFile, "DeploymentMode"), "LOCAL");
    EXPECT_EQ(fileValue(kUpdateFile, "UpdateRetrievalTime"), "06:15:00");
    EXPECT_EQ(fileValue(kUpdateFile, "OnlineUpdateActivated"), "false");
}

TEST_F(HostTest, CancelDropsTheEditsAndShowsTheFilesAgain)
{
    const std::string workshopBefore = TempDir::read(path(kWorkshopFile));
    set("NameEdit", QStringLiteral("Never saved"));
    set("StreetEdit", QStringLiteral("Nowhere"));
    ASSERT_EQ(utf8(text("NameEdit")), "Never saved");

    ASSERT_TRUE(m_dialog->clickButton(QStringLiteral("CancelButton")));
    QApplication::processEvents();

    EXPECT_FALSE(m_dialog->isVisible());
    EXPECT_EQ(utf8(text("NameEdit")), "Harbour Lane Motors");
    EXPECT_EQ(utf8(text("StreetEdit")), "14 Harbour Lane");
    EXPECT_EQ(TempDir::read(path(kWorkshopFile)), workshopBefore);
}

TEST_F(HostTest, UsersButtonsEditTheListThroughTheUserDialogAndOKSavesIt)
{
    // Add: the edit dialog opens empty; the new user goes to the end.
    ModalDriver::whenShown([](QWidget& modal) {
        auto* dialog = dynamic_cast<Dialog_EditDiagUserInfo*>(&modal);
        ASSERT_NE(dialog, nullptr);
        EXPECT_TRUE(dialog->m_nameEdit->text().isEmpty());
        dialog->m_nameEdit->setText(QStringLiteral("Dana Reyes"));
        dialog->m_addressEdit->setText(QStringLiteral("5 Dock Road"));
        dialog->m_phoneEdit->setText(QStringLiteral("+44 23 9200 0114"));
        dialog->m_okButton->click();
    });
    ASSERT_TRUE(m_dialog->clickButton(QStringLiteral("UsersAddButton")));
    EXPECT_EQ(userNames(), (QStringList{"Alice Moreau", "Ben Okafor", "Chloé Dubois", "Dana Reyes"}));

    // Modify: the dialog comes filled from the selected row.
    usersList()->setCurrentItem(usersList()->topLevelItem(1));
    QString shownName;
    ModalDriver::whenShown([&shownName](QWidget& modal) {
        auto* dialog = dynamic_cast<Dialog_EditDiagUserInfo*>(&modal);
        ASSERT_NE(dialog, nullptr);
        shownName = dialog->m_nameEdit->text();
        dialog->m_nameEdit->setText(QStringLiteral("Benjamin Okafor"));
        dialog->m_okButton->click();
    });
    ASSERT_TRUE(m_dialog->clickButton(QStringLiteral("UsersModifyButton")));
    EXPECT_EQ(utf8(shownName), "Ben Okafor");
    EXPECT_EQ(userNames(), (QStringList{"Alice Moreau", "Benjamin Okafor", "Chloé Dubois", "Dana Reyes"}));

    // Delete: answered with the first button of the question.
    usersList()->setCurrentItem(usersList()->topLevelItem(0));
    ModalDriver::clickButton(QStringLiteral("YES"));
    ASSERT_TRUE(m_dialog->clickButton(QStringLiteral("UsersDeleteButton")));
    EXPECT_EQ(userNames(), (QStringList{"Benjamin Okafor", "Chloé Dubois", "Dana Reyes"}));

    ASSERT_TRUE(m_dialog->clickButton(QStringLiteral("OKButton")));
    EXPECT_EQ(fileValue(kUsersFile, "users/user1/name"), "Benjamin Okafor");
    EXPECT_EQ(fileValue(kUsersFile, "users/user3/name"), "Dana Reyes");
    EXPECT_EQ(fileValue(kUsersFile, "users/user3/telephone"), "+44 23 9200 0114");
    EXPECT_EQ(fileValue(kUsersFile, "users/user4/name"), "0");
}

TEST_F(HostTest, FilesChangedOnDiskWhileTheWindowIsOpenShowUpInTheWidgets)
{
    BSet workshop;
    ASSERT_TRUE(workshop.load(wide(path(kWorkshopFile))));
    workshop.setString(L"nom", L"Renamed on disk");
    ASSERT_TRUE(workshop.save(wide(path(kWorkshopFile)), false));
    EXPECT_TRUE(waitFor([this]() { return text("NameEdit") == QStringLiteral("Renamed on disk"); }))
        << "shown: " << utf8(text("NameEdit"));

    BSet users;
    ASSERT_TRUE(users.load(wide(path(kUsersFile))));
    BSet list;
    ASSERT_EQ(users.getSet(L"users", list), 0);
    BSet first;
    ASSERT_EQ(list.getSet(L"user1", first), 0);
    first.setString(L"name", L"Alicia Moreau");
    list.setSet(L"user1", first);
    users.setSet(L"users", list);
    BSet app2App;
    ASSERT_EQ(users.getSet(L"App2App", app2App), 0);
    app2App.setString(L"IP", L"192.168.10.99");
    users.setSet(L"App2App", app2App);
    ASSERT_TRUE(users.save(wide(path(kUsersFile)), false));
    EXPECT_TRUE(waitFor([this]() { return text("App2AppIP") == QStringLiteral("192.168.10.99"); }))
        << "shown: " << utf8(text("App2AppIP"));
    EXPECT_TRUE(waitFor([this]() { return !userNames().isEmpty() && userNames().first() == "Alicia Moreau"; }))
        << "shown: " << utf8(userNames().join(", "));
}

TEST_F(HostTest, RecordsPublishedOnAnotherThreadReachTheWidgetsThroughTheEventLoop)
{
    std::thread writer([this]() { publishEdit("FaxNumberEdit", "+44 0000 0000"); });
    writer.join();
    EXPECT_EQ(utf8(text("FaxNumberEdit")), "+44 23 9200 0105") << "the widget is not touched off the GUI thread";
    EXPECT_TRUE(waitFor([this]() { return text("FaxNumberEdit") == QStringLiteral("+44 0000 0000"); }));
}

TEST_F(HostTest, ShowingARecordDoesNotCallTheControllerButTypingDoes)
{
    LogCapture log;
    const std::string slotEntry = "[ToolConfigurationCommand::onNameChanged] : Method started";
    publishEdit("NameEdit", "Published elsewhere");
    EXPECT_EQ(utf8(text("NameEdit")), "Published elsewhere");
    EXPECT_FALSE(log.contains(slotEntry));

    set("NameEdit", QStringLiteral("Typed"));
    EXPECT_TRUE(log.contains(slotEntry));
}

struct RefusedCase
{
    const char* control;
    const char* value;
};

TEST_F(HostTest, ScriptedChangesAreRefusedWhereAPersonCouldNotMakeThem)
{
    const RefusedCase cases[] = {
        {"Country", "France"},           // display only
        {"NoSuchControl", "x"},          // unknown
        {"TaskTimeEdit", "25:99"},       // not a time
        {"BrandCombo", "Unknown brand"}, // not in the list
        {"CheckInternet", "maybe"},      // not a boolean
        {"OtherRadioButton", "0"},       // a radio button is only chosen
    };
    for (const RefusedCase& refused : cases)
    {
        QString error;
        EXPECT_FALSE(m_dialog->setFieldValue(QLatin1String(refused.control), QLatin1String(refused.value), &error))
            << refused.control;
        EXPECT_FALSE(error.isEmpty()) << refused.control;
    }
    EXPECT_EQ(utf8(text("Country")), "United Kingdom");
}

TEST(HostApplicationTest, RunsWithoutADisplayWritesAScreenshotAndAppliesScriptedChanges)
{
    TempDir dir;
    std::filesystem::copy(PTC_DEMO_DIR, dir.path(), std::filesystem::copy_options::recursive);
    const QString screenshot = QString::fromStdString(dir.file("window.png"));
    QProcess host;
    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    environment.remove(QStringLiteral("DISPLAY"));
    environment.remove(QStringLiteral("WAYLAND_DISPLAY"));
    environment.remove(QStringLiteral("QT_QPA_PLATFORM"));
    host.setProcessEnvironment(environment);
    host.start(QCoreApplication::applicationDirPath() + QStringLiteral("/ToolConfigurationHost"),
               {QStringLiteral("--data"), QString::fromStdString(dir.path().string()), QStringLiteral("--screenshot"),
                screenshot, QStringLiteral("--set"), QStringLiteral("NameEdit=Scripted Name"), QStringLiteral("--press"),
                QStringLiteral("ok")});
    ASSERT_TRUE(host.waitForFinished(60000));
    const std::string output = host.readAllStandardOutput().toStdString();
    EXPECT_EQ(host.exitCode(), 0) << host.readAllStandardError().toStdString();
    EXPECT_NE(output.find("Screenshot: " + screenshot.toStdString()), std::string::npos) << output;
    EXPECT_NE(output.find("Scripted Name"), std::string::npos) << "the summary shows the change";

    const QImage image(screenshot);
    ASSERT_FALSE(image.isNull());
    EXPECT_GT(image.width(), 600);
    EXPECT_GT(image.height(), 400);
    EXPECT_GT(distinctColours(image), 16) << "a blank or single-colour picture";

    BSet workshop;
    ASSERT_TRUE(workshop.load(wide(dir.file(kWorkshopFile))));
    ACE_WString name;
    workshop.getString(L"nom", name);
    EXPECT_EQ(WideString::toUtf8(name), "Scripted Name");
}

TEST(HostApplicationTest, RefusesAnUnknownLanguageAndAMissingDataFolder)
{
    const QStringList arguments[] = {
        {QStringLiteral("--language"), QStringLiteral("de")},
        {QStringLiteral("--data"), QStringLiteral("/nonexistent/folder")},
    };
    for (const QStringList& args : arguments)
    {
        QProcess host;
        QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
        environment.insert(QStringLiteral("QT_QPA_PLATFORM"), QStringLiteral("offscreen"));
        host.setProcessEnvironment(environment);
        host.start(QCoreApplication::applicationDirPath() + QStringLiteral("/ToolConfigurationHost"), args);
        ASSERT_TRUE(host.waitForFinished(60000));
        EXPECT_NE(host.exitCode(), 0) << utf8(args.join(' '));
        EXPECT_FALSE(host.readAllStandardError().isEmpty()) << utf8(args.join(' '));
    }
}
}
