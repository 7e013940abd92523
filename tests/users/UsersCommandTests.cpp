#include "DialogDrivers.h"
#include "DialogFixture.h"
#include "LogCapture.h"
#include "QListViewItem.h"
#include "UsersCommand.h"

#include <memory>
#include <string>
#include <tuple>
#include <vector>

namespace
{
using Users = std::vector<User>;

// Rejects and counts every dialog run modally while it lives.
struct UnexpectedModals
{
    UnexpectedModals()
    {
        QObject::connect(&timer, &QTimer::timeout, [this]() {
            if (auto* dialog = qobject_cast<QDialog*>(QApplication::activeModalWidget()))
                ++count, dialog->reject();
        });
        timer.start(5);
    }
    int count = 0;
    QTimer timer;
};

std::unique_ptr<QListViewItem> itemOf(const User& user)
{
    return std::make_unique<QListViewItem>(qs(user.name), qs(user.address), qs(user.phone));
}
}

// The fixture's users file holds Anna, Bruno and Clara.
class UsersTest : public DialogFixture
{
protected:
    std::unique_ptr<UsersCommand> open(const Users& users)
    {
        SettingsFiles::writeUsers(m_usersPath, users);
        return std::make_unique<UsersCommand>(QString("WC_USERSCOMMAND"));
    }
    Users published() { return publishedUsers(*m_dataManager); }
};

TEST_F(UsersTest, PublishesTheFileUsersInOrderLeavingTheFileAloneAndAMissingFileAsAnEmptySet)
{
    auto command = open({kAnna, kLukasz, kClara});
    const std::string before = TempDir::read(m_usersPath);
    EXPECT_TRUE(command->init());
    EXPECT_EQ(published(), (Users{kAnna, kLukasz, kClara}));
    command.reset();
    EXPECT_EQ(TempDir::read(m_usersPath), before);

    // The set left from earlier editing is replaced by the missing file's empty list.
    std::filesystem::remove(m_usersPath);
    UsersCommand empty(QString("WC_USERSCOMMAND"));
    EXPECT_TRUE(published().empty());
    SettingsFiles::writeUsers(m_usersPath, {kBruno});
    empty.createDMUsersData();
    EXPECT_EQ(published(), Users{kBruno});
}

// Each accepted add goes under the next key; an empty phone takes the workshop's number, if any.
TEST_F(UsersTest, AcceptedAddsTakeTheWorkshopPhoneOnlyWhenNoneIsTyped)
{
    auto command = open({kAnna});
    const User finn{"Finn", "6 Bay", ""}, dora{"Dora", "4 Bay", ""}, eve{"Eve", "5 Bay", "0555"};
    fillEditDialogWhenShown(finn, nullptr);
    command->onAddClicked();
    BSet value(10);
    value.setString(L"item"_w, L"04 50 60"_w);
    BSet record(10);
    record.setInt(L"state"_w, 3);
    record.setSet(L"value"_w, value);
    m_dataManager->createData(ID(Uri::kWorkshopPhone), record);
    for (const User& user : {dora, eve})
    {
        fillEditDialogWhenShown(user, nullptr);
        command->onAddClicked();
    }
    EXPECT_EQ(published(), (Users{kAnna, finn, {dora.name, dora.address, "04 50 60"}, eve}));
    EXPECT_EQ(SettingsFiles::usersIn(m_usersPath), Users{kAnna})
        << "the file is written by the tool configuration's OK";
}

TEST_F(UsersTest, AddWithTwentyUsersShowsTheNoticeAndNoDialog)
{
    m_text->setText(L"969"_w, L"Eigenschaften"_w);
    const Users twenty(20, kBruno);
    auto command = open(twenty);
    SeenMessageBox box;
    answerMessageBoxWhenShown("OK", &box);
    command->onAddClicked();
    EXPECT_EQ(m_boxes->shownCount(), 1);
    EXPECT_EQ(box.title, "Eigenschaften");
    EXPECT_EQ(box.text, "The maximum number of users has been reached!");
    EXPECT_EQ(published(), twenty);
}

TEST_F(UsersTest, ModifyKeepsTheKeyRefusesAnotherUsersNameAndCancelChangesNothing)
{
    auto command = open({kAnna, kLukasz, kClara});
    const User renamed{"Łucja Żak", "pl. Wolności 7, Łódź", "+48 42 000 11 22"};
    ModalDriver::whenShown([&](QWidget& modal) {
        auto& dialog = dynamic_cast<Dialog_EditDiagUserInfo&>(modal);
        EXPECT_EQ(dialog.forbiddenNames(), (QStringList{qs(kAnna.name), qs(kClara.name)}));
        EXPECT_EQ(dialog.m_nameEdit->text(), qs(kLukasz.name));
        dialog.m_nameEdit->setText(qs(kAnna.name));
        dialog.m_okButton->click();
        EXPECT_TRUE(dialog.isVisible()) << "another user's name is refused";
        dialog.m_nameEdit->setText(qs(renamed.name));
        dialog.m_addressEdit->setText(qs(renamed.address));
        dialog.m_phoneEdit->setText(qs(renamed.phone));
        dialog.m_okButton->click();
    });
    command->onModifyClicked(itemOf(kLukasz).get());
    EXPECT_EQ(published(), (Users{kAnna, renamed, kClara}));

    // Cancelled, an add or a modify changes nothing.
    int filled = 0;
    fillEditDialogWhenShown(kBruno, &filled, false);
    command->onAddClicked();
    fillEditDialogWhenShown(kBruno, &filled, false);
    command->onModifyClicked(itemOf(kAnna).get());
    EXPECT_EQ(filled, 2);
    EXPECT_EQ(published(), (Users{kAnna, renamed, kClara}));
}

// Delete asks, removes only on YES and closes the gap; an unknown name removes nobody.
TEST_F(UsersTest, DeleteAsksThenRemovesOnlyOnYesAndClosesTheGap)
{
    auto command = open({kAnna, kBruno, kClara});
    const std::tuple<User, const char*, Users> steps[] = {{kBruno, "NO", {kAnna, kBruno, kClara}},
                                                          {{"bruno", "", ""}, "YES", {kAnna, kBruno, kClara}},
                                                          {kBruno, "YES", {kAnna, kClara}},
                                                          {kAnna, "YES", {kClara}},
                                                          {kClara, "YES", {}}};
    for (const auto& [item, answer, after] : steps)
    {
        SeenMessageBox box;
        answerMessageBoxWhenShown(answer, &box);
        command->onDeleteClicked(itemOf(item).get());
        EXPECT_EQ(box.text, "Do you really want to remove the user? " + qs(item.name) + "?");
        EXPECT_EQ(published(), after) << item.name;
    }
}

// Without a text component, an item or a data manager, nothing is shown or changed; without a
// message box manager, delete goes ahead unasked.
TEST_F(UsersTest, MissingComponentsOrItemShowNothing)
{
    auto command = open({kAnna, kBruno, kClara});
    UnexpectedModals modals;
    command->onModifyClicked(nullptr);
    command->onDeleteClicked(nullptr);
    makeUnreachable(ID(CBText::componentID));
    command->onAddClicked();
    command->onModifyClicked(itemOf(kBruno).get());
    command->onDeleteClicked(itemOf(kBruno).get());
    EXPECT_EQ(published(), (Users{kAnna, kBruno, kClara}));
    makeUnreachable(ID(CMessageBoxManager::componentID));
    command->onDeleteClicked(itemOf(kBruno).get());
    EXPECT_EQ(published(), (Users{kAnna, kClara}));

    makeUnreachable(ID(CDataManager::componentID));
    UsersCommand orphan(QString("WC_USERSCOMMAND"));
    LogCapture log;
    orphan.onModifyClicked(itemOf(kAnna).get());
    orphan.onAddClicked();
    EXPECT_TRUE(
        log.contains("[UsersCommand::onModifyClicked] : Cannot get proxy to DataManager.", TesselLog_Static::eWARNING));
    EXPECT_EQ(modals.count, 0);
}
