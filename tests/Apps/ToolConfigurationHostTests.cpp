#include "BEvent.h"
#include "CDataManager.h"
#include "CQ17FileSystemWatcher.h"
#include "CustomEvent.h"
#include "DialogDrivers.h"
#include "HostProblems.h"
#include "LogCapture.h"
#include "SettingsFiles.h"
#include "TempDir.h"
#include "TesselLog_Static.h"
#include "ToolConfigurationDialog.h"
#include "ToolConfigurationHost.h"

#include <gtest/gtest.h>

#include <QCheckBox>
#include <QComboBox>
#include <QEventLoop>
#include <QImage>
#include <QListWidget>
#include <QProcess>
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

// Runs the event loop until `done` holds, for at most 10 s; true when it holds.
bool waitFor(const std::function<bool()>& done)
{
    QEventLoop loop;
    QTimer poll;
    QObject::connect(&poll, &QTimer::timeout, &loop, [&]() {
        if (done())
            loop.quit();
    });
    QTimer::singleShot(10000, &loop, &QEventLoop::quit);
    poll.start(20);
    if (!done())
        loop.exec();
    return done();
}

// Runs the host application on a copy of the demo data.
int runHost(const QStringList& arguments, std::string* output = nullptr, std::string* errors = nullptr)
{
    QProcess host;
    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    for (const char* name : {"DISPLAY", "WAYLAND_DISPLAY", "QT_QPA_PLATFORM"})
        environment.remove(QString::fromLatin1(name));
    host.setProcessEnvironment(environment);
    // The tests' tasks stay in files: no test writes the user's crontab.
    host.start(QCoreApplication::applicationDirPath() + "/ToolConfigurationHost",
               QStringList{QStringLiteral("--scheduler"), QStringLiteral("files")} + arguments);
    EXPECT_TRUE(host.waitForFinished(60000));
    if (output != nullptr)
        *output = host.readAllStandardOutput().toStdString();
    const QByteArray errorOutput = host.readAllStandardError();
    if (errors != nullptr)
        *errors = errorOutput.toStdString();
    const bool explained = errorOutput.contains("ToolConfigurationHost: ");
    EXPECT_TRUE(host.exitCode() == 0 || explained) << arguments.join(' ').toStdString();
    return host.exitCode();
}

class HostTest : public ::testing::Test
{
protected:
    void SetUp() override
    {
        std::filesystem::copy(PTC_DEMO_DIR, m_dir.path(), std::filesystem::copy_options::recursive);
        ASSERT_TRUE(m_host.start(QString::fromStdString(m_dir.path().string()), QString(), language()))
            << m_host.error().toStdString();
        m_dialog = m_host.dialog();
        ASSERT_NE(m_dialog, nullptr);
        m_dialog->show();
        QApplication::processEvents();
    }
    virtual QString language() const { return "en"; }

    template <class W>
    W* widget(const char* name) const
    {
        W* found = m_dialog->findChild<W*>(QLatin1String(name));
        EXPECT_NE(found, nullptr) << name;
        return found;
    }
    std::string text(const char* name) const
    {
        const auto* edit = widget<QLineEdit>(name);
        return edit != nullptr ? edit->text().toStdString() : "<missing>";
    }
    // The summary's line of the users list, as it shows them.
    std::string usersShown() const { return m_dialog->summary().filter("Users (").join("").toStdString(); }
    void set(const char* control, const QString& value)
    {
        QString error;
        EXPECT_TRUE(m_dialog->setFieldValue(QLatin1String(control), value, &error))
            << control << ": " << error.toStdString();
    }
    void selectUser(int row)
    {
        auto* list = widget<QTreeWidget>("UsersList");
        list->setCurrentItem(list->topLevelItem(row));
    }
    std::string path(const char* relative) const { return m_dir.file(relative); }
    // The string at `key` of a settings file, inside its set `inner` when given.
    std::string inFile(const char* file, const char* key, const char* inner = nullptr) const
    {
        BSet set = SettingsFiles::read(path(file));
        BSet innerSet(10);
        if (inner != nullptr && set.getSet(wide(inner), innerSet) == 0)
            set = innerSet;
        return SettingsFiles::stringAt(set, key);
    }
    void publishEdit(const char* control, const std::string& value)
    {
        BSet inner(10);
        inner.setString(L"item"_w, wide(value));
        BSet record(10);
        record.setInt(L"state"_w, 3);
        record.setSet(L"value"_w, inner);
        m_host.dataManager()->setData(ID(wide(std::string("data:/Auto/SystemMenu/") + control)), record);
    }

    // What the problems area lists, one line per item; empty when the area is hidden.
    std::string problemsShown() const
    {
        const auto* list = widget<QListWidget>("ProblemsList");
        QStringList items;
        for (int i = 0; list != nullptr && !list->isHidden() && i < list->count(); ++i)
            items << list->item(i)->text();
        return items.join('\n').toStdString();
    }
    // What the watcher tells the controllers when a settings file changes on disk.
    static void announceChange(const char* file)
    {
        BEvent<CustomEvent>::broadcast(CustomEvent(CQ17FileSystemWatcher::eventType, wide(file)));
    }

    TempDir m_dir;
    ToolConfigurationHost m_host;
    ToolConfigurationDialog* m_dialog = nullptr;
};

TEST_F(HostTest, FieldsShowTheSettingsFilesAndTheConfiguration)
{
    EXPECT_EQ(
        m_dialog->summary().join('\n').toStdString(),
        "Workshop: Harbour Lane Motors Ltd | Harbour Lane Motors | 14 Harbour Lane | PO1 3AX Portsmouth | tel +44 "
        "23 9200 0104 | fax +44 23 9200 0105 | business number WS-104522 | brand Estrella\n"
        "Online update: on | mode OTHER | folder /srv/updates/repository (editable) | daily at 07:30:00\n"
        "App2App: server 192.168.10.20 port 8080 | dealer D-0457\n"
        "Users (3): Alice Moreau, Ben Okafor, Chloé Dubois\n"
        "Installation: United Kingdom | English | version 4.2.1 F1 | recording mode off");
    EXPECT_EQ(text("Country"), "United Kingdom");
    EXPECT_TRUE(widget<QLineEdit>("Country")->isReadOnly());
    const auto* brands = widget<QComboBox>("BrandCombo");
    ASSERT_EQ(brands->count(), 20);
    EXPECT_EQ(brands->itemText(0).toStdString(), "Aldaris");
    EXPECT_EQ(brands->itemText(5).toStdString(), "Falcourt") << "key 10 sorts after 7";
    EXPECT_EQ(brands->itemText(19).toStdString(), "Tavira");
    EXPECT_TRUE(widget<QPushButton>("FolderBrowserButton")->isEnabled());
    EXPECT_FALSE(widget<QCheckBox>("ASRMChk")->isChecked());
    const QTreeWidgetItem* third = widget<QTreeWidget>("UsersList")->topLevelItem(2);
    EXPECT_EQ(third->text(1).toStdString() + " | " + third->text(2).toStdString(),
              "31 Elm Grove, Southsea | +44 23 9200 0113");
}

class FrenchHostTest : public HostTest
{
protected:
    QString language() const override { return "fr"; }
};

TEST_F(FrenchHostTest, TranslatedValuesComeFromTheFrenchCatalogue)
{
    EXPECT_EQ(text("Country"), "Royaume-Uni");
}

TEST_F(HostTest, EditsMadeThroughTheWidgetsAreWrittenOnOK)
{
    // App2App mode points the folder at the server's repository share.
    set("A2ARadioButton", "1");
    EXPECT_EQ(text("DistributionFolderPath"), "\\\\192.168.10.20\\TLD_REPOSITORY");
    const std::pair<const char*, const char*> edits[] = {{"NameEdit", "Quayside Motors"},
                                                         {"TownPostCodeEdit_PostCode", "SO14 2AA"},
                                                         {"TownPostCodeEdit_Town", "Southampton"},
                                                         {"PhoneNumberEdit", "+44 23 8000 0001"},
                                                         {"BrandCombo", "Garrow"},
                                                         {"App2AppIP", "010.001.002.003"},
                                                         {"App2AppPort", "9090"},
                                                         {"TaskTimeEdit", "06:15:00"},
                                                         {"CheckInternet", "0"},
                                                         {"LocalRadioButton", "1"}};
    for (const auto& [control, value] : edits)
        set(control, value);
    // The local mode fixes the folder: shown read-only, no browsing.
    EXPECT_EQ(text("DistributionFolderPath"), "c:\\TLD_REPOSITORY");
    EXPECT_TRUE(widget<QLineEdit>("DistributionFolderPath")->isReadOnly());
    EXPECT_FALSE(widget<QPushButton>("FolderBrowserButton")->isEnabled());

    ASSERT_TRUE(m_dialog->clickButton("OKButton"));
    QApplication::processEvents();
    EXPECT_FALSE(m_dialog->isVisible()) << "OK closes the window through the mediator";
    EXPECT_EQ(TesselLog_Static::getLevel_static(), 0) << "no recording mode, no detailed log";
    const std::pair<const char*, const char*> workshop[] = {{"nom", "Quayside Motors"},
                                                            {"codepostal", "SO14 2AA"},
                                                            {"ville", "Southampton"},
                                                            {"telephone", "+44 23 8000 0001"},
                                                            {"default_brand", "12"}};
    for (const auto& [key, value] : workshop)
        EXPECT_EQ(inFile(kWorkshopFile, key), value) << key;
    EXPECT_EQ(inFile(kUsersFile, "IP", "App2App"), "10.1.2.3");
    EXPECT_EQ(inFile(kUsersFile, "Port", "App2App"), "9090");
    EXPECT_EQ(text("App2AppIP"), "10.1.2.3") << "the window shows the address as saved";
    EXPECT_EQ(inFile(kUpdateFile, "DeploymentMode"), "LOCAL");
    EXPECT_EQ(inFile(kUpdateFile, "UpdateRetrievalTime"), "06:15:00");
    bool activated = true;
    EXPECT_EQ(SettingsFiles::read(path(kUpdateFile)).getBool(L"OnlineUpdateActivated"_w, activated), 0);
    EXPECT_FALSE(activated);
}

TEST_F(HostTest, CancelDropsTheEditsAndShowsTheFilesAgain)
{
    const std::string workshopBefore = TempDir::read(path(kWorkshopFile));
    set("NameEdit", "Never saved");

    ASSERT_TRUE(m_dialog->clickButton("CancelButton"));
    QApplication::processEvents();
    EXPECT_FALSE(m_dialog->isVisible());
    EXPECT_EQ(text("NameEdit"), "Harbour Lane Motors");
    EXPECT_EQ(TempDir::read(path(kWorkshopFile)), workshopBefore);
}

TEST_F(HostTest, UsersButtonsEditTheListThroughTheUserDialogAndOKSavesIt)
{
    const User dana{"Dana Reyes", "5 Dock Road", "+44 23 9200 0114"};
    const User benjamin{"Benjamin Okafor", "7 Mill Road, Fareham", "+44 23 9200 0112"};
    fillEditDialogWhenShown(dana, nullptr);
    ASSERT_TRUE(m_dialog->clickButton("UsersAddButton"));
    EXPECT_EQ(usersShown(), "Users (4): Alice Moreau, Ben Okafor, Chloé Dubois, Dana Reyes");

    // Modify and delete act on the selected row.
    selectUser(1);
    fillEditDialogWhenShown(benjamin, nullptr);
    ASSERT_TRUE(m_dialog->clickButton("UsersModifyButton"));
    selectUser(0);
    ModalDriver::clickButton("YES");
    ASSERT_TRUE(m_dialog->clickButton("UsersDeleteButton"));
    EXPECT_EQ(usersShown(), "Users (3): Benjamin Okafor, Chloé Dubois, Dana Reyes");

    ASSERT_TRUE(m_dialog->clickButton("OKButton"));
    EXPECT_EQ(SettingsFiles::usersIn(path(kUsersFile)),
              (std::vector<User>{benjamin, {"Chloé Dubois", "31 Elm Grove, Southsea", "+44 23 9200 0113"}, dana}));
}

TEST_F(HostTest, FilesChangedOnDiskWhileTheWindowIsOpenShowUpInTheWidgets)
{
    SettingsFiles::writeWorkshop(path(kWorkshopFile), {{"nom", "Renamed on disk"}});
    EXPECT_TRUE(waitFor([this]() { return text("NameEdit") == "Renamed on disk"; })) << text("NameEdit");

    SettingsFiles::writeUsers(path(kUsersFile), {{"Alicia Moreau", "2 Quay Street", "0111"}},
                              {"8080", "192.168.10.99", "D-0457"});
    EXPECT_TRUE(waitFor([this]() { return text("App2AppIP") == "192.168.10.99"; })) << text("App2AppIP");
    EXPECT_TRUE(waitFor([this]() { return usersShown() == "Users (1): Alicia Moreau"; })) << usersShown();
}

TEST_F(HostTest, ProblemsAreListedInTheWindowUntilTheNextActionResolvesThem)
{
    EXPECT_EQ(problemsShown(), "");
    const std::string workshop = TempDir::read(path(kWorkshopFile));
    TempDir::write(path(kWorkshopFile), "<BSet><Str");
    announceChange(kWorkshopFile);
    EXPECT_NE(problemsShown().find(kWorkshopFile), std::string::npos) << "the unreadable file is named";
    EXPECT_EQ(m_host.problems().problems().size(), 1u);

    TempDir::write(path(kWorkshopFile), workshop);
    announceChange(kWorkshopFile);
    EXPECT_EQ(problemsShown(), "");
    EXPECT_EQ(text("NameEdit"), "Harbour Lane Motors");

    // A save that fails on OK is listed too.
    std::filesystem::remove_all(path("User/OnLineUpdate"));
    TempDir::write(path("User/OnLineUpdate"), "a file where the folder was");
    ASSERT_TRUE(m_dialog->clickButton("OKButton"));
    EXPECT_NE(problemsShown().find("Cannot save Preparateur data!"), std::string::npos) << problemsShown();
}

// Records reach the widgets through the event loop, also from another thread, without calling the
// controller; typing does call it, and a change a person could not make is refused.
TEST_F(HostTest, RecordsReachTheWidgetsOnTheGuiThreadAndOnlyTypingCallsTheController)
{
    LogCapture log;
    std::thread writer([this]() { publishEdit("FaxNumberEdit", "+44 0000 0000"); });
    writer.join();
    EXPECT_EQ(text("FaxNumberEdit"), "+44 23 9200 0105") << "the widget is not touched off the GUI thread";
    QApplication::processEvents();
    EXPECT_EQ(text("FaxNumberEdit"), "+44 0000 0000");
    const std::string slotEntry = "[ToolConfigurationCommand::onNameChanged] : Method started";
    publishEdit("NameEdit", "Published elsewhere");
    EXPECT_EQ(text("NameEdit"), "Published elsewhere");
    EXPECT_FALSE(log.contains(slotEntry));
    set("NameEdit", "Typed");
    EXPECT_TRUE(log.contains(slotEntry));
    QString error;
    EXPECT_FALSE(m_dialog->setFieldValue("TaskTimeEdit", "25:99", &error));
    EXPECT_FALSE(error.isEmpty());
}

TEST(HostApplicationTest, RunsWithoutADisplayAndRefusesBadArguments)
{
    TempDir dir;
    std::filesystem::copy(PTC_DEMO_DIR, dir.path(), std::filesystem::copy_options::recursive);
    const QString data = QString::fromStdString(dir.path().string());
    const QString screenshot = QString::fromStdString(dir.file("window.png"));
    std::string output;
    EXPECT_EQ(runHost({"--data", data, "--screenshot", screenshot, "--set", "NameEdit=Scripted Name", "--press", "ok"},
                      &output),
              0);
    EXPECT_NE(output.find("Screenshot: " + screenshot.toStdString()), std::string::npos) << output;
    EXPECT_NE(output.find("Scripted Name"), std::string::npos) << "the summary shows the change";
    EXPECT_EQ(SettingsFiles::stringAt(SettingsFiles::read(dir.file(kWorkshopFile)), "nom"), "Scripted Name");

    EXPECT_GT(QImage(screenshot).width(), 600);

    // A save that fails makes OK exit with its own code and say what failed.
    std::filesystem::remove_all(dir.file("User/OnLineUpdate"));
    TempDir::write(dir.file("User/OnLineUpdate"), "a file where the folder was");
    std::string errors;
    EXPECT_EQ(runHost({"--data", data, "--press", "ok"}, &output, &errors), 3);
    EXPECT_NE(errors.find("Cannot save Preparateur data!"), std::string::npos) << errors;

    EXPECT_EQ(runHost({"--data", data, "--list-controls"}, &output), 0);
    EXPECT_NE(output.find("NameEdit: text\n"), std::string::npos) << output;
    EXPECT_EQ(output.find("Country"), std::string::npos) << "display-only fields cannot be set";
    EXPECT_EQ(runHost({"--help"}, &output), 0);
    EXPECT_NE(output.find("Exit codes:"), std::string::npos);
    // Bad arguments and a missing data folder are refused.
    for (const QStringList& bad : {QStringList{"--press", "later"}, QStringList{"--no-such-option"}})
        EXPECT_EQ(runHost(bad), 2) << bad.join(' ').toStdString();
    EXPECT_EQ(runHost({"--data", "/nonexistent/folder"}), 1);
}
}
