#include "CMediator.h"
#include "ComponentFixture.h"
#include "Dialog_ConfigurationTest.h"
#include "Dialog_EditDiagUserInfo.h"
#include "Dialog_OnLineUpdateConfigurationTestResult.h"
#include "ModalDriver.h"
#include "PMediator.h"
#include "QListViewItem.h"
#include "SmartProxy.h"

#include <QDialog>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>

#include <gtest/gtest.h>

#include <memory>

namespace
{
const char* const kMediatorID = "gui:GuiToolConfiguration?MedToolConfiguration#ToolConfiguaration.ui";

class MediatorTest : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_mediator = CMediator::registerWith(*m_manager);
        ASSERT_NE(m_mediator, nullptr);
    }

    CMediator* m_mediator = nullptr;
};

TEST_F(MediatorTest, ClosesTheAttachedDialog)
{
    EXPECT_EQ(std::wstring(CMediator::componentID), std::wstring(L"gui:GuiToolConfiguration?MedToolConfiguration#ToolConfiguaration.ui"));
    SmartProxy<PMediator> mediator;
    ASSERT_TRUE(mediator.acquire(ID(kMediatorID)));
    EXPECT_NE(mediator->closeDialog(), 0);  // nothing attached yet

    QDialog dialog;
    dialog.show();
    m_mediator->setDialog(&dialog);
    EXPECT_EQ(mediator->closeDialog(), 0);
    EXPECT_FALSE(dialog.isVisible());
    EXPECT_EQ(m_mediator->closeCount(), 2);
}

TEST_F(MediatorTest, ForgetsADestroyedDialog)
{
    SmartProxy<PMediator> mediator;
    ASSERT_TRUE(mediator.acquire(ID(kMediatorID)));
    {
        auto dialog = std::make_unique<QDialog>();
        dialog->show();
        m_mediator->setDialog(dialog.get());
    }
    EXPECT_EQ(m_mediator->dialog(), nullptr);
    EXPECT_NE(mediator->closeDialog(), 0);

    ASSERT_EQ(destroyComponent(ID(kMediatorID)), 0);
    m_mediator = nullptr;
    EXPECT_NE(mediator->closeDialog(), 0);
}

TEST(ListViewItem, ColumnsHoldTheirTexts)
{
    QListViewItem item(QStringLiteral("Łukasz Żółć"), QStringLiteral("1 Main Street"), QStringLiteral("0123"));
    EXPECT_EQ(item.text(0), QStringLiteral("Łukasz Żółć"));
    EXPECT_EQ(item.text(1), QStringLiteral("1 Main Street"));
    EXPECT_EQ(item.text(2), QStringLiteral("0123"));
    EXPECT_TRUE(item.text(3).isEmpty());
    EXPECT_TRUE(item.text(-1).isEmpty());
}

class DialogTest : public ComponentFixture
{
};

TEST_F(DialogTest, EditDialogRefusesEmptyAndForbiddenNames)
{
    Dialog_EditDiagUserInfo dialog(QStringList{QStringLiteral("Anna"), QStringLiteral("Bert")});
    ASSERT_TRUE(dialog.init(QStringLiteral("Properties")));
    EXPECT_EQ(dialog.windowTitle(), QStringLiteral("Properties"));

    struct Step
    {
        QString name;
        bool accepted;
    };
    // Each refused name leaves the dialog open with a note; the last one is taken.
    const Step steps[] = {{QString(), false},
                          {QStringLiteral("   "), false},
                          {QStringLiteral("Anna"), false},
                          {QStringLiteral("anna"), true}};
    QStringList notes;
    bool stillOpenAfterRefusals = true;
    ModalDriver::whenShown([&](QWidget&) {
        for (const Step& step : steps)
        {
            dialog.m_nameEdit->setText(step.name);
            dialog.m_addressEdit->setText(QStringLiteral("Rue Haute 3"));
            dialog.m_phoneEdit->setText(QStringLiteral("0456"));
            dialog.m_okButton->click();
            if (!step.accepted)
            {
                notes.append(dialog.note());
                stillOpenAfterRefusals = stillOpenAfterRefusals && dialog.isVisible();
            }
        }
    });
    EXPECT_EQ(dialog.exec(), QDialog::Accepted);
    EXPECT_TRUE(stillOpenAfterRefusals);
    ASSERT_EQ(notes.size(), 3);
    for (const QString& note : notes)
        EXPECT_FALSE(note.isEmpty());
    EXPECT_EQ(dialog.m_nameEdit->text(), QStringLiteral("anna"));
}

TEST_F(DialogTest, EditDialogKeepsUnicodeAndCancels)
{
    Dialog_EditDiagUserInfo dialog(QStringList{});
    dialog.init(QStringLiteral("Properties"));
    ModalDriver::whenShown([&](QWidget&) {
        dialog.m_nameEdit->setText(QStringLiteral("Łukasz Żółć"));
        dialog.m_cancelButton->click();
    });
    EXPECT_EQ(dialog.exec(), QDialog::Rejected);
    EXPECT_EQ(dialog.m_nameEdit->text(), QStringLiteral("Łukasz Żółć"));
}

TEST_F(DialogTest, WaitDialogHasItsCancelButton)
{
    Dialog_ConfigurationTest dialog;
    ASSERT_TRUE(dialog.init());
    ASSERT_NE(dialog.cancelButton(), nullptr);
    EXPECT_EQ(dialog.cancelButton(), dialog.m_cancelButton);
    EXPECT_EQ(dialog.cancelButton()->text(), QStringLiteral("Cancel"));
    EXPECT_FALSE(dialog.messageLabel()->text().isEmpty());
    bool clicked = false;
    QObject::connect(dialog.m_cancelButton, &QPushButton::clicked, [&clicked]() { clicked = true; });
    dialog.setModal(true);
    dialog.show();
    dialog.m_cancelButton->click();
    EXPECT_TRUE(clicked);
}

TEST_F(DialogTest, ResultDialogShowsBothAnswersInWords)
{
    // Every known answer has its own words.
    QStringList preparerTexts;
    for (int answer = 0; answer >= -14; --answer)
    {
        Dialog_OnLineUpdateConfigurationTestResult dialog;
        EXPECT_TRUE(dialog.init(answer, 1));
        EXPECT_EQ(dialog.preparerText(), Dialog_OnLineUpdateConfigurationTestResult::defaultPreparerText(answer));
        EXPECT_FALSE(preparerTexts.contains(dialog.preparerText()));
        preparerTexts.append(dialog.preparerText());
    }
    QStringList taskTexts;
    for (int answer = 1; answer <= 5; ++answer)
    {
        Dialog_OnLineUpdateConfigurationTestResult dialog;
        EXPECT_TRUE(dialog.init(0, answer));
        EXPECT_FALSE(taskTexts.contains(dialog.taskText()));
        taskTexts.append(dialog.taskText());
    }
    // Unknown answers are shown as numbers and reported.
    Dialog_OnLineUpdateConfigurationTestResult odd;
    EXPECT_FALSE(odd.init(5, 9));
    EXPECT_TRUE(odd.preparerText().contains(QStringLiteral("5")));
    EXPECT_TRUE(odd.taskText().contains(QStringLiteral("9")));
}

TEST_F(DialogTest, ResultDialogTakesTranslatedTexts)
{
    m_text->setText(L"ConfigurationTest/Preparer/-3", L"Fichier de configuration invalide.");
    Dialog_OnLineUpdateConfigurationTestResult dialog;
    dialog.init(-3, 2);
    EXPECT_EQ(dialog.preparerText(), QStringLiteral("Fichier de configuration invalide."));
    EXPECT_EQ(dialog.taskText(), Dialog_OnLineUpdateConfigurationTestResult::defaultTaskText(2));
    ModalDriver::whenShown([&](QWidget&) { dialog.okButton()->click(); });
    EXPECT_EQ(dialog.exec(), QDialog::Accepted);
}
}
