#include "CMediator.h"
#include "CMessageBoxManager.h"
#include "ComponentFixture.h"
#include "ModalDriver.h"
#include "PMediator.h"
#include "PMessageBoxManager.h"
#include "ProxyComponent.h"
#include "SmartProxy.h"

#include <QDialog>
#include <QMessageBox>

#include <thread>

namespace
{
// Without a registration, the component manager makes each component from the library its
// identifier names, through the library's entry points.
TEST_F(ComponentFixture, EachComponentIsMadeFromItsLibrary)
{
    for (const char* id :
         {"util:FileSystemUtilities?CQ17FileSystemWatcher", "proc:ProcStartUpdateAgent?ProcStartUpdateAgent",
          "tessel:Navigation?MessageBoxManager", "gui:GuiToolConfiguration?MedToolConfiguration#ToolConfiguaration.ui"})
    {
        ProxyComponent* proxy = nullptr;
        ASSERT_EQ(m_manager->getProxy(ID(id), proxy), 0) << id;
        EXPECT_NE(proxy->component(), nullptr);
        EXPECT_EQ(m_manager->releaseProxy(proxy), 0);
    }
    ProxyComponent* proxy = nullptr;
    EXPECT_NE(m_manager->getProxy(ID("tessel:Navigation?NoSuchComponent"), proxy), 0);
    EXPECT_EQ(proxy, nullptr);
}

using GuiToolConfiguration = ComponentFixture;

TEST_F(GuiToolConfiguration, MediatorClosesOnlyALiveAttachedDialog)
{
    CMediator* mediator = CMediator::registerWith(*m_manager);
    SmartProxy<PMediator> proxy;
    ASSERT_TRUE(proxy.acquire(ID(CMediator::componentID)));
    EXPECT_EQ(proxy->closeDialog(), 1); // nothing attached yet
    QDialog dialog;
    dialog.show();
    mediator->setDialog(&dialog);
    EXPECT_EQ(proxy->closeDialog(), 0);
    EXPECT_FALSE(dialog.isVisible());
    mediator->setDialog(new QDialog());
    delete mediator->dialog();
    EXPECT_EQ(proxy->closeDialog(), 1);
    ASSERT_EQ(destroyComponent(ID(CMediator::componentID)), 0);
    EXPECT_EQ(proxy->closeDialog(), -1);
}

using MessageBoxManagerTest = ComponentFixture;

// A null `clicked` closes the box without a button; a null text is no button, and none at all is OK.
TEST_F(MessageBoxManagerTest, ShowsTheKindAndTheButtonsGivenAndAnswersTheNumberPressed)
{
    CMessageBoxManager* boxes = CMessageBoxManager::registerWith(*m_manager);
    SmartProxy<PMessageBoxManager> proxy;
    ASSERT_TRUE(proxy.acquire(ID(CMessageBoxManager::componentID)));
    // Buttons are given as a list of three; a null text is no button.
    const auto show = [&proxy](int kind, const QStringList& b) {
        return proxy->showMessageBox(qs("Properties"), qs("Remove the user Łukasz?"), kind, b[0], b[1], b[2]);
    };
    const QString none;
    const struct
    {
        int kind;
        QMessageBox::Icon icon;
        QStringList buttons;
        const char* clicked;
        int answer;
    } cases[] = {{1, QMessageBox::Question, {qs("YES"), qs("NO"), none}, "NO", 2},
                 {3, QMessageBox::Warning, {qs("Save"), qs("Discard"), qs("Cancel")}, "Cancel", 3},
                 {4, QMessageBox::Critical, {none, qs("Second"), qs("Third")}, "Third", 3},
                 {0, QMessageBox::NoIcon, {none, none, none}, "OK", 1},
                 {5, QMessageBox::NoIcon, {qs("YES"), none, none}, nullptr, 0}};
    for (const auto& c : cases)
    {
        ModalDriver::whenShown([&](QWidget& modal) {
            auto& box = static_cast<QMessageBox&>(modal);
            EXPECT_EQ(box.windowTitle() + "|" + box.text(), qs("Properties|Remove the user Łukasz?"));
            EXPECT_EQ(box.icon(), c.icon) << c.kind;
            EXPECT_EQ(box.buttons().size(), std::max<qsizetype>(1, c.buttons.size() - c.buttons.count(none))) << c.kind;
            if (c.clicked != nullptr)
                ModalDriver::clickButtonIn(box, qs(c.clicked));
            else
                box.done(0);
        });
        EXPECT_EQ(show(c.kind, c.buttons), c.answer) << c.kind;
    }
    // A hook sees the box before it runs; no box off the GUI thread or without the component.
    boxes->setShownHook([](QMessageBox& box) {
        QTimer::singleShot(0, &box, [&box]() { ModalDriver::clickButtonIn(box, qs("YES")); });
    });
    EXPECT_EQ(show(1, {qs("YES"), qs("NO"), QString()}), 1);
    EXPECT_EQ(boxes->shownCount(), 6);
    int answer = -1;
    std::thread([&]() { answer = show(1, {qs("OK"), QString(), QString()}); }).join();
    EXPECT_EQ(answer, 0);
    EXPECT_EQ(boxes->shownCount(), 6);
    ASSERT_EQ(destroyComponent(ID(CMessageBoxManager::componentID)), 0);
    EXPECT_EQ(show(1, {qs("OK"), QString(), QString()}), 0);
}
}
