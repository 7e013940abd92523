#include "BSet.h"
#include "BString.h"
#include "CComponent_Thread_NoRef.h"
#include "CMessageBoxManager.h"
#include "ComponentFixture.h"
#include "Dialog_EditDiagUserInfo.h"
#include "LogCapture.h"
#include "QListViewItem.h"
#include "TempDir.h"
#include "UsersCommand.h"
#include "WideString.h"

#include <gtest/gtest.h>

#include <QAbstractButton>
#include <QApplication>
#include <QDialog>
#include <QLineEdit>
#include <QMessageBox>
#include <QMetaMethod>
#include <QPushButton>
#include <QTimer>

#include <functional>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

namespace
{
const wchar_t* const kUsersFileUri = L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagParamsFileName";
const wchar_t* const kUserSetUri = L"data:/Auto/SystemMenu/Users/UserSet";
const wchar_t* const kWorkshopPhoneUri = L"data:/Auto/SystemMenu/PhoneNumberEdit";

struct User
{
    std::wstring name;
    std::wstring address;
    std::wstring phone;
    bool operator==(const User& other) const
    {
        return name == other.name && address == other.address && phone == other.phone;
    }
};

void PrintTo(const User& user, std::ostream* out)
{
    *out << "{" << WideString::toUtf8(user.name.c_str()) << " | " << WideString::toUtf8(user.address.c_str()) << " | "
         << WideString::toUtf8(user.phone.c_str()) << "}";
}

ACE_WString ace(const std::wstring& text)
{
    return ACE_WString(text.c_str(), text.size());
}

QString qs(const std::wstring& text)
{
    return QString::fromStdWString(text);
}

std::vector<User> people(int count)
{
    std::vector<User> users;
    for (int i = 1; i <= count; ++i)
        users.push_back({L"Person " + std::to_wstring(i), L"Street " + std::to_wstring(i), L"0" + std::to_wstring(i)});
    return users;
}

const User kAnna{L"Anna", L"1 Quay Road", L"0101"};
const User kBruno{L"Bruno", L"2 Mill Lane", L"0202"};
const User kClara{L"Clara", L"3 Hill Street", L"0303"};
const User kLukasz{L"Łukasz Żółć", L"ul. Źródlana 5, Kraków", L"+48 12 345 67 89"};

// Acts on the modal widgets that the slot under test opens, one action per shown widget, in
// order. A widget still shown after its action (a refused OK) gets the next action. A modal
// widget for which no action is left is rejected and counted as unexpected.
class ModalScript
{
public:
    using Action = std::function<void(QWidget&)>;

    explicit ModalScript(std::vector<Action> actions = {}) : m_actions(std::move(actions))
    {
        QObject::connect(&m_timer, &QTimer::timeout, &m_timer, [this]() { tick(); });
        m_timer.start(5);
    }

    bool allUsed() const { return m_next == m_actions.size(); }
    int unexpected() const { return m_unexpected; }

private:
    void tick()
    {
        QWidget* modal = QApplication::activeModalWidget();
        if (modal == nullptr || !modal->isVisible())
            return;
        if (m_next < m_actions.size())
        {
            const Action action = m_actions[m_next++];
            action(*modal);
            return;
        }
        ++m_unexpected;
        if (auto* dialog = qobject_cast<QDialog*>(modal))
            dialog->reject();
        else
            modal->close();
    }

    std::vector<Action> m_actions;
    size_t m_next = 0;
    int m_unexpected = 0;
    QTimer m_timer;
};

// What an edit dialog showed when it came up.
struct DialogSeen
{
    bool shown = false;
    QString title;
    QStringList forbidden;
    QString name;
    QString address;
    QString phone;
    QString style;
};

// What a message box showed.
struct BoxSeen
{
    bool shown = false;
    QString title;
    QString text;
    QStringList buttons;
};

// The edit dialog, or null (with a failure, the widget closed) when another widget came up.
Dialog_EditDiagUserInfo* editDialog(QWidget& modal)
{
    auto* dialog = dynamic_cast<Dialog_EditDiagUserInfo*>(&modal);
    if (dialog == nullptr)
    {
        ADD_FAILURE() << "expected the edit dialog, got " << modal.metaObject()->className();
        modal.close();
    }
    return dialog;
}

// Records the dialog, types the three texts and presses OK.
ModalScript::Action fillAndAccept(const User& typed, DialogSeen* seen = nullptr)
{
    return [typed, seen](QWidget& modal) {
        Dialog_EditDiagUserInfo* found = editDialog(modal);
        if (found == nullptr)
            return;
        Dialog_EditDiagUserInfo& dialog = *found;
        if (seen != nullptr)
        {
            seen->shown = true;
            seen->title = dialog.windowTitle();
            seen->forbidden = dialog.forbiddenNames();
            seen->name = dialog.m_nameEdit->text();
            seen->address = dialog.m_addressEdit->text();
            seen->phone = dialog.m_phoneEdit->text();
            seen->style = dialog.property("decoratorStyle").toString();
        }
        dialog.m_nameEdit->setText(qs(typed.name));
        dialog.m_addressEdit->setText(qs(typed.address));
        dialog.m_phoneEdit->setText(qs(typed.phone));
        dialog.m_okButton->click();
    };
}

ModalScript::Action cancelDialog(DialogSeen* seen = nullptr)
{
    return [seen](QWidget& modal) {
        Dialog_EditDiagUserInfo* dialog = editDialog(modal);
        if (dialog == nullptr)
            return;
        if (seen != nullptr)
        {
            seen->shown = true;
            seen->title = dialog->windowTitle();
        }
        dialog->m_cancelButton->click();
    };
}

ModalScript::Action clickBoxButton(const QString& buttonText, BoxSeen* seen)
{
    return [buttonText, seen](QWidget& modal) {
        auto* box = qobject_cast<QMessageBox*>(&modal);
        if (box == nullptr)
        {
            ADD_FAILURE() << "expected a message box, got " << modal.metaObject()->className();
            modal.close();
            return;
        }
        seen->shown = true;
        seen->title = box->windowTitle();
        seen->text = box->text();
        for (QAbstractButton* button : box->buttons())
            seen->buttons.append(button->text());
        for (QAbstractButton* button : box->buttons())
        {
            if (button->text() == buttonText)
            {
                button->click();
                return;
            }
        }
    };
}

class UsersCommandTest : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_boxes = CMessageBoxManager::registerWith(*m_manager);
        ASSERT_NE(m_boxes, nullptr);
        m_usersFile = m_dir.file("FicheDiagParams.xml");
        m_dataManager->setString(ID(kUsersFileUri), WideString::fromUtf8(m_usersFile));
    }

    void writeUsersFile(const std::vector<User>& users)
    {
        BSet slotSet(10);
        for (size_t i = 0; i < users.size(); ++i)
        {
            BSet slot(10);
            slot.setString(L"name", ace(users[i].name));
            slot.setString(L"address", ace(users[i].address));
            slot.setString(L"telephone", ace(users[i].phone));
            slotSet.setSet(ace(L"user" + std::to_wstring(i + 1)), slot);
        }
        BSet content(10);
        content.setString(L"activation", L"1");
        content.setSet(L"users", slotSet);
        ASSERT_TRUE(content.save(WideString::fromUtf8(m_usersFile), false));
    }

    std::unique_ptr<UsersCommand> open(const std::vector<User>& users)
    {
        writeUsersFile(users);
        return std::make_unique<UsersCommand>(QString("WC_USERSCOMMAND"));
    }

    BSet userSet()
    {
        BSet users(10);
        EXPECT_EQ(m_dataManager->getData(ID(kUserSetUri), users), 0);
        return users;
    }

    // The published users in index order; every index below the set's size must be there.
    std::vector<User> published()
    {
        const BSet users = userSet();
        std::vector<User> result;
        for (int i = 0; i < users.size(); ++i)
        {
            BSet entry(10);
            const std::wstring key = L"User#" + std::to_wstring(i);
            if (users.getSet(ace(key), entry) != 0)
            {
                ADD_FAILURE() << "missing key User#" << i;
                continue;
            }
            ACE_WString name, address, phone;
            entry.getString(L"name", name);
            entry.getString(L"address", address);
            entry.getString(L"phone", phone);
            result.push_back({name.c_str(), address.c_str(), phone.c_str()});
        }
        return result;
    }

    static std::unique_ptr<QListViewItem> itemOf(const User& user)
    {
        return std::make_unique<QListViewItem>(qs(user.name), qs(user.address), qs(user.phone));
    }

    // Puts a component in the place of `id` that hands out no proxy, so it cannot be reached
    // (a destroyed component alone would be loaded again from its library).
    void makeUnreachable(const ID& id)
    {
        destroyComponent(id);
        if (id == ID(CMessageBoxManager::componentID))
            m_boxes = nullptr;
        ASSERT_EQ(m_manager->registerComponent(std::make_unique<CComponent_Thread_NoRef>(id),
                                               [](IComponent*) -> ProxyComponent* { return nullptr; }),
                  0);
    }

    TempDir m_dir;
    std::string m_usersFile;
    CMessageBoxManager* m_boxes = nullptr;
};

TEST_F(UsersCommandTest, PublishesTheFileUsersInOrderAndLeavesTheFileAlone)
{
    writeUsersFile({kAnna, kLukasz, kClara});
    const std::string before = TempDir::read(m_usersFile);
    LogCapture log;
    {
        UsersCommand command(QString("WC_USERSCOMMAND"));
        EXPECT_TRUE(command.init());
        EXPECT_EQ(published(), (std::vector<User>{kAnna, kLukasz, kClara}));

        BSet entry(10);
        ASSERT_EQ(userSet().getSet(L"User#1", entry), 0);
        ASSERT_EQ(entry.size(), 3);
        EXPECT_EQ(std::wstring(entry.keyAt(0).c_str()), L"name");
        EXPECT_EQ(std::wstring(entry.keyAt(1).c_str()), L"phone");
        EXPECT_EQ(std::wstring(entry.keyAt(2).c_str()), L"address");
    }
    EXPECT_EQ(TempDir::read(m_usersFile), before);

    std::vector<std::string> traces;
    for (const auto& record : log.records())
        if (record.className == "UsersCommand" && record.level == TesselLog_Static::eTRACE)
            traces.push_back(WideString::toUtf8(record.message));
    const std::vector<std::string> expected = {"[UsersCommand::UsersCommand] : Constructor started.",
                                               "[UsersCommand::createDMUsersData] : Method started.",
                                               "[UsersCommand::~UsersCommand] : Destructor started."};
    EXPECT_EQ(traces, expected);
}

TEST_F(UsersCommandTest, MissingFilePublishesAnEmptySetAndRepublishingRestoresTheFile)
{
    // A set left from earlier editing is replaced by the (missing) file's empty list.
    BSet stale(10);
    BSet entry(10);
    entry.setString(L"name", L"Stale");
    stale.setSet(L"User#0", entry);
    m_dataManager->createData(ID(kUserSetUri), stale);

    UsersCommand command(QString("WC_USERSCOMMAND"));
    EXPECT_EQ(userSet().size(), 0);

    writeUsersFile({kBruno});
    command.createDMUsersData();
    EXPECT_EQ(published(), std::vector<User>{kBruno});
}

TEST_F(UsersCommandTest, SlotsAreTheMetaObjectsThreeSlotsInOrder)
{
    UsersCommand command(QString("WC_USERSCOMMAND"));
    const QMetaObject* meta = command.metaObject();
    EXPECT_STREQ(meta->className(), "UsersCommand");
    ASSERT_EQ(meta->methodCount() - meta->methodOffset(), 3);
    const char* const expected[] = {"onModifyClicked(const QListViewItem*)", "onAddClicked()",
                                    "onDeleteClicked(const QListViewItem*)"};
    for (int i = 0; i < 3; ++i)
    {
        const QMetaMethod method = meta->method(meta->methodOffset() + i);
        EXPECT_EQ(method.methodType(), QMetaMethod::Slot);
        EXPECT_EQ(method.access(), QMetaMethod::Public);
        EXPECT_EQ(method.methodSignature(), QByteArray(expected[i]));
    }
}

struct AddCase
{
    const char* label;
    int existing;
    User typed;
    const wchar_t* workshopPhone; // null: no telephone record published
    User stored;
};

void PrintTo(const AddCase& c, std::ostream* out)
{
    *out << c.label;
}

class UsersAddTest : public UsersCommandTest, public ::testing::WithParamInterface<AddCase>
{
};

TEST_P(UsersAddTest, AcceptedDialogAddsTheUserUnderTheNextKey)
{
    const AddCase& c = GetParam();
    const std::vector<User> existing = people(c.existing);
    auto command = open(existing);
    const std::string fileBefore = TempDir::read(m_usersFile);
    if (c.workshopPhone != nullptr)
    {
        BSet value(10);
        value.setString(L"item", c.workshopPhone);
        BSet record(10);
        record.setInt(L"state", 3);
        record.setSet(L"value", value);
        m_dataManager->createData(ID(kWorkshopPhoneUri), record);
    }

    DialogSeen seen;
    ModalScript script({fillAndAccept(c.typed, &seen)});
    command->onAddClicked();

    EXPECT_TRUE(script.allUsed());
    EXPECT_EQ(script.unexpected(), 0);
    ASSERT_TRUE(seen.shown);
    EXPECT_EQ(seen.title, QString("Properties"));
    EXPECT_EQ(seen.style, QString("Style85"));
    QStringList names;
    for (const User& user : existing)
        names.append(qs(user.name));
    EXPECT_EQ(seen.forbidden, names);

    std::vector<User> expected = existing;
    expected.push_back(c.stored);
    EXPECT_EQ(published(), expected);
    EXPECT_EQ(TempDir::read(m_usersFile), fileBefore);
}

INSTANTIATE_TEST_SUITE_P(
    Cases, UsersAddTest,
    ::testing::Values(
        AddCase{"NineteenUsers", 19, {L"Zoe", L"20 Long Road", L"0999"}, nullptr, {L"Zoe", L"20 Long Road", L"0999"}},
        AddCase{"UnicodeKeptWhole", 0, kLukasz, nullptr, kLukasz},
        AddCase{"EmptyPhoneTakesWorkshopNumber", 2, {L"Dora", L"4 Bay", L""}, L"04 50 60 70 80",
                {L"Dora", L"4 Bay", L"04 50 60 70 80"}},
        AddCase{"GivenPhoneBeatsWorkshopNumber", 1, {L"Eve", L"5 Bay", L"0555"}, L"04 50 60 70 80",
                {L"Eve", L"5 Bay", L"0555"}},
        AddCase{"EmptyPhoneWithoutWorkshopRecord", 1, {L"Finn", L"6 Bay", L""}, nullptr, {L"Finn", L"6 Bay", L""}}),
    [](const ::testing::TestParamInfo<AddCase>& info) { return std::string(info.param.label); });

TEST_F(UsersCommandTest, AddWithTwentyUsersShowsTheNoticeAndNoDialog)
{
    const std::vector<User> full = people(20);
    auto command = open(full);

    BoxSeen box;
    ModalScript script({clickBoxButton("OK", &box)});
    command->onAddClicked();

    EXPECT_TRUE(script.allUsed());
    EXPECT_EQ(script.unexpected(), 0);
    EXPECT_EQ(m_boxes->shownCount(), 1);
    EXPECT_EQ(box.title, QString("Properties"));
    EXPECT_EQ(box.text, QString("The maximum number of users has been reached!"));
    EXPECT_EQ(box.buttons, QStringList{"OK"});
    EXPECT_EQ(published(), full);
}

TEST_F(UsersCommandTest, CancelledAddChangesNothingAndUsesTheTranslatedTitle)
{
    m_text->setText(L"969", L"Eigenschaften");
    auto command = open({kAnna});

    DialogSeen seen;
    ModalScript script({cancelDialog(&seen)});
    command->onAddClicked();

    EXPECT_TRUE(script.allUsed());
    EXPECT_EQ(seen.title, QString("Eigenschaften"));
    EXPECT_EQ(published(), std::vector<User>{kAnna});
}

TEST_F(UsersCommandTest, ModifyingTheSecondOfThreeKeepsItsKeyAndRefusesAnotherUsersName)
{
    auto command = open({kAnna, kBruno, kClara});
    const User renamed{L"Bernard", L"22 Mill Lane", L"0222"};

    DialogSeen seen;
    // First an OK with Anna's name, which the dialog refuses; then the real edit.
    ModalScript script({fillAndAccept({kAnna.name, L"x", L"y"}, &seen), fillAndAccept(renamed)});
    const auto item = itemOf(kBruno);
    command->onModifyClicked(item.get());

    EXPECT_TRUE(script.allUsed());
    EXPECT_EQ(script.unexpected(), 0);
    EXPECT_EQ(seen.title, QString("Properties"));
    EXPECT_EQ(seen.forbidden, (QStringList{qs(kAnna.name), qs(kClara.name)}));
    EXPECT_EQ(seen.name, qs(kBruno.name));
    EXPECT_EQ(seen.address, qs(kBruno.address));
    EXPECT_EQ(seen.phone, qs(kBruno.phone));
    EXPECT_EQ(seen.style, QString("Style85"));
    EXPECT_EQ(published(), (std::vector<User>{kAnna, renamed, kClara}));
}

TEST_F(UsersCommandTest, ModifyingAUnicodeUserKeepsItsNameWhole)
{
    auto command = open({kAnna, kLukasz});
    const User moved{kLukasz.name, L"pl. Wolności 7, Łódź", L"+48 42 000 11 22"};

    const auto item = itemOf(kLukasz);
    {
        ModalScript script({fillAndAccept(moved)});
        command->onModifyClicked(item.get());
        EXPECT_TRUE(script.allUsed());
    }
    EXPECT_EQ(published(), (std::vector<User>{kAnna, moved}));

    ModalScript cancel({cancelDialog()});
    command->onModifyClicked(item.get());
    EXPECT_TRUE(cancel.allUsed());
    EXPECT_EQ(published(), (std::vector<User>{kAnna, moved}));
}

struct DeleteCase
{
    const char* label;
    std::vector<User> before;
    User item;
    const char* answer;
    std::vector<User> after;
};

void PrintTo(const DeleteCase& c, std::ostream* out)
{
    *out << c.label;
}

class UsersDeleteTest : public UsersCommandTest, public ::testing::WithParamInterface<DeleteCase>
{
};

TEST_P(UsersDeleteTest, AsksThenRemovesTheUserAndClosesTheGap)
{
    const DeleteCase& c = GetParam();
    auto command = open(c.before);

    BoxSeen box;
    ModalScript script({clickBoxButton(c.answer, &box)});
    const auto item = itemOf(c.item);
    command->onDeleteClicked(item.get());

    EXPECT_TRUE(script.allUsed());
    EXPECT_EQ(script.unexpected(), 0);
    EXPECT_EQ(box.title, QString("Properties"));
    EXPECT_EQ(box.text, QString("Do you really want to remove the user? ") + qs(c.item.name) + QString("?"));
    EXPECT_EQ(box.buttons, (QStringList{"YES", "NO"}));
    EXPECT_EQ(published(), c.after);
}

INSTANTIATE_TEST_SUITE_P(
    Cases, UsersDeleteTest,
    ::testing::Values(DeleteCase{"SecondOfThree", {kAnna, kBruno, kClara}, kBruno, "YES", {kAnna, kClara}},
                      DeleteCase{"FirstOfThree", {kAnna, kBruno, kClara}, kAnna, "YES", {kBruno, kClara}},
                      DeleteCase{"LastOfThree", {kAnna, kBruno, kClara}, kClara, "YES", {kAnna, kBruno}},
                      DeleteCase{"OnlyOne", {kLukasz}, kLukasz, "YES", {}},
                      DeleteCase{"AnsweredNo", {kAnna, kBruno, kClara}, kBruno, "NO", {kAnna, kBruno, kClara}},
                      DeleteCase{"UnknownNameAmongThree", {kAnna, kBruno, kClara}, {L"bruno", L"", L""}, "YES",
                                 {kAnna, kBruno, kClara}},
                      DeleteCase{"UnknownNameBesideTheOnlyOne", {kAnna}, kBruno, "YES", {kAnna}}),
    [](const ::testing::TestParamInfo<DeleteCase>& info) { return std::string(info.param.label); });

TEST_F(UsersCommandTest, WithoutMessageBoxManagerDeleteGoesAheadUnasked)
{
    auto command = open({kAnna, kBruno, kClara});
    makeUnreachable(ID(CMessageBoxManager::componentID));

    ModalScript script;
    const auto item = itemOf(kBruno);
    command->onDeleteClicked(item.get());
    EXPECT_EQ(script.unexpected(), 0);
    EXPECT_EQ(published(), (std::vector<User>{kAnna, kClara}));
}

TEST_F(UsersCommandTest, WithoutTextComponentNothingIsShownOrChanged)
{
    auto command = open({kAnna, kBruno});
    makeUnreachable(ID(CBText::componentID));

    ModalScript script;
    const auto item = itemOf(kBruno);
    command->onAddClicked();
    command->onModifyClicked(item.get());
    command->onDeleteClicked(item.get());
    EXPECT_EQ(script.unexpected(), 0);
    EXPECT_EQ(m_boxes->shownCount(), 0);
    EXPECT_EQ(published(), (std::vector<User>{kAnna, kBruno}));
}

TEST_F(UsersCommandTest, WithoutDataManagerModifyWarnsAndShowsNothing)
{
    writeUsersFile({kAnna});
    makeUnreachable(ID(CDataManager::componentID));
    UsersCommand command(QString("WC_USERSCOMMAND"));

    LogCapture log;
    ModalScript script;
    const auto item = itemOf(kAnna);
    command.onModifyClicked(item.get());
    command.onAddClicked();
    EXPECT_TRUE(log.contains("[UsersCommand::onModifyClicked] : Cannot get proxy to DataManager.",
                             TesselLog_Static::eWARNING));
    EXPECT_EQ(script.unexpected(), 0);
}

TEST_F(UsersCommandTest, NullItemsAreIgnored)
{
    auto command = open({kAnna, kBruno});
    ModalScript script;
    command->onModifyClicked(nullptr);
    command->onDeleteClicked(nullptr);
    EXPECT_EQ(script.unexpected(), 0);
    EXPECT_EQ(m_boxes->shownCount(), 0);
    EXPECT_EQ(published(), (std::vector<User>{kAnna, kBruno}));
}
}
