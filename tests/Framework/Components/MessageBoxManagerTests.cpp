#include "CMessageBoxManager.h"
#include "ComponentFixture.h"
#include "ModalDriver.h"
#include "PMessageBoxManager.h"
#include "SmartProxy.h"

#include <QMessageBox>
#include <QTimer>

#include <gtest/gtest.h>

#include <thread>

namespace
{
class MessageBoxManagerTest : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_boxes = CMessageBoxManager::registerWith(*m_manager);
        ASSERT_NE(m_boxes, nullptr);
        ASSERT_TRUE(m_proxy.acquire(ID(CMessageBoxManager::componentID)));
    }
    void TearDown() override
    {
        m_proxy.giveBack();
        ComponentFixture::TearDown();
    }

    CMessageBoxManager* m_boxes = nullptr;
    SmartProxy<PMessageBoxManager> m_proxy;
};

struct BoxCase
{
    const char* button1;  // null: no such button
    const char* button2;
    const char* button3;
    const char* clicked;
    int answer;
};

QString textOrNull(const char* text)
{
    return text == nullptr ? QString() : QString::fromUtf8(text);
}

class MessageBoxAnswer : public MessageBoxManagerTest, public ::testing::WithParamInterface<BoxCase>
{
};

TEST_P(MessageBoxAnswer, AnswersTheNumberOfTheButtonPressed)
{
    const BoxCase& c = GetParam();
    QStringList shownButtons;
    ModalDriver::whenShown([&](QWidget& modal) {
        for (QAbstractButton* button : modal.findChildren<QAbstractButton*>())
            shownButtons.append(button->text());
        ModalDriver::clickButtonIn(modal, QString::fromUtf8(c.clicked));
    });
    EXPECT_EQ(m_proxy->showMessageBox(QStringLiteral("Properties"), QStringLiteral("Text"), 1, textOrNull(c.button1),
                                      textOrNull(c.button2), textOrNull(c.button3)),
              c.answer);
    // Only the given buttons are shown.
    QStringList expected;
    for (const char* text : {c.button1, c.button2, c.button3})
        if (text != nullptr)
            expected.append(QString::fromUtf8(text));
    if (expected.isEmpty())
        expected.append(QStringLiteral("OK"));
    shownButtons.sort();
    expected.sort();
    EXPECT_EQ(shownButtons, expected);
}

INSTANTIATE_TEST_SUITE_P(Cases, MessageBoxAnswer,
                         ::testing::Values(BoxCase{"YES", "NO", nullptr, "YES", 1},
                                           BoxCase{"YES", "NO", nullptr, "NO", 2},
                                           BoxCase{"Save", "Discard", "Cancel", "Cancel", 3},
                                           BoxCase{"OK", nullptr, nullptr, "OK", 1},
                                           // A box with a gap keeps the numbers of the buttons given.
                                           BoxCase{nullptr, "Second", "Third", "Third", 3},
                                           BoxCase{nullptr, nullptr, nullptr, "OK", 1}));

TEST_F(MessageBoxManagerTest, ShowsTitleTextAndIconOfTheKind)
{
    const struct
    {
        int kind;
        QMessageBox::Icon icon;
    } kinds[] = {{1, QMessageBox::Question}, {2, QMessageBox::Information}, {3, QMessageBox::Warning},
                 {4, QMessageBox::Critical}, {0, QMessageBox::NoIcon}};
    for (const auto& k : kinds)
    {
        QString title;
        QString text;
        QMessageBox::Icon icon = QMessageBox::NoIcon;
        ModalDriver::whenShown([&](QWidget& modal) {
            auto* box = qobject_cast<QMessageBox*>(&modal);
            if (box != nullptr)
            {
                title = box->windowTitle();
                text = box->text();
                icon = box->icon();
            }
            ModalDriver::clickButtonIn(modal, QStringLiteral("OK"));
        });
        EXPECT_EQ(m_proxy->showMessageBox(QStringLiteral("Properties"),
                                          QStringLiteral("Do you really want to remove the user? Łukasz?"), k.kind,
                                          QStringLiteral("OK"), QString(), QString()),
                  1);
        EXPECT_EQ(title, QStringLiteral("Properties"));
        EXPECT_EQ(text, QStringLiteral("Do you really want to remove the user? Łukasz?"));
        EXPECT_EQ(icon, k.icon);
    }
    EXPECT_EQ(m_boxes->shownCount(), 5);
}

TEST_F(MessageBoxManagerTest, BoxClosedWithoutAButtonAnswersZero)
{
    ModalDriver::whenShown([](QWidget& modal) { static_cast<QDialog&>(modal).done(0); });
    EXPECT_EQ(m_proxy->showMessageBox(QStringLiteral("T"), QStringLiteral("Text"), 1, QStringLiteral("YES"),
                                      QStringLiteral("NO"), QString()),
              0);
}

TEST_F(MessageBoxManagerTest, HookSeesTheBoxBeforeItRuns)
{
    m_boxes->setShownHook([](QMessageBox& box) {
        // Answer at once, from inside the event loop of exec().
        QTimer::singleShot(0, &box, [&box]() { ModalDriver::clickButtonIn(box, QStringLiteral("NO")); });
    });
    EXPECT_EQ(m_proxy->showMessageBox(QStringLiteral("T"), QStringLiteral("Text"), 1, QStringLiteral("YES"),
                                      QStringLiteral("NO"), QString()),
              2);
}

TEST_F(MessageBoxManagerTest, NoBoxOffTheGuiThreadOrWithoutTheComponent)
{
    int answer = -1;
    std::thread worker([&]() {
        answer = m_proxy->showMessageBox(QStringLiteral("T"), QStringLiteral("Text"), 1, QStringLiteral("OK"),
                                         QString(), QString());
    });
    worker.join();
    EXPECT_EQ(answer, 0);
    EXPECT_EQ(m_boxes->shownCount(), 0);

    ASSERT_EQ(destroyComponent(ID(CMessageBoxManager::componentID)), 0);
    m_boxes = nullptr;
    EXPECT_EQ(m_proxy->showMessageBox(QStringLiteral("T"), QStringLiteral("Text"), 1, QStringLiteral("OK"), QString(),
                                      QString()),
              0);
}
}
