#include "CMessageBoxManager.h"

#include "IComponentManager.h"
#include "PMessageBoxManager.h"
#include "TesselLog_Static.h"

#include <QApplication>
#include <QMessageBox>
#include <QPushButton>
#include <QThread>

namespace
{
const char* const kComponent = "Navigation";
const char* const kFile = "Navigation.dll";
const char* const kClass = "CMessageBoxManager";

QMessageBox::Icon iconOf(int kind)
{
    switch (kind)
    {
    case 1:
        return QMessageBox::Question;
    case 2:
        return QMessageBox::Information;
    case 3:
        return QMessageBox::Warning;
    case 4:
        return QMessageBox::Critical;
    default:
        return QMessageBox::NoIcon;
    }
}
}

const wchar_t* const CMessageBoxManager::componentID = L"tessel:Navigation?MessageBoxManager";

CMessageBoxManager::CMessageBoxManager() : CComponent_Thread_NoRef(ID(componentID)), m_shownCount(0)
{
}

CMessageBoxManager::~CMessageBoxManager() = default;

CMessageBoxManager* CMessageBoxManager::registerWith(IComponentManager& manager)
{
    auto component = std::make_unique<CMessageBoxManager>();
    CMessageBoxManager* boxes = component.get();
    const int result = manager.registerComponent(
        std::move(component), [](IComponent* registered) { return new PMessageBoxManager(registered); });
    return result == 0 ? boxes : nullptr;
}

int CMessageBoxManager::showMessageBox(const QString& title, const QString& text, int kind, const QString& button1,
                                       const QString& button2, const QString& button3)
{
    if (qobject_cast<QApplication*>(QCoreApplication::instance()) == nullptr ||
        QThread::currentThread() != QCoreApplication::instance()->thread())
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, -1,
                                          "CMessageBoxManager::showMessageBox: no GUI here, box \"%s\" not shown",
                                          title.toUtf8().constData());
        return 0;
    }
    QMessageBox box(iconOf(kind), title, text);
    // Action buttons: the box closes on any of them, and none is picked for Escape on its own.
    const QString* const texts[] = {&button1, &button2, &button3};
    QAbstractButton* buttons[3] = {nullptr, nullptr, nullptr};
    bool any = false;
    for (int i = 0; i < 3; ++i)
    {
        if (texts[i]->isNull())
            continue;
        buttons[i] = box.addButton(*texts[i], QMessageBox::ActionRole);
        any = true;
    }
    if (!any)
        buttons[0] = box.addButton(QStringLiteral("OK"), QMessageBox::ActionRole);
    for (QAbstractButton* button : buttons)
    {
        if (auto* push = qobject_cast<QPushButton*>(button))
        {
            box.setDefaultButton(push);
            break;
        }
    }
    ++m_shownCount;
    if (m_shownHook)
        m_shownHook(box);
    box.exec();
    QAbstractButton* const clicked = box.clickedButton();
    for (int i = 0; i < 3; ++i)
    {
        if (clicked != nullptr && clicked == buttons[i])
            return i + 1;
    }
    return 0;
}

void CMessageBoxManager::setShownHook(ShownHook hook)
{
    m_shownHook = std::move(hook);
}

int CMessageBoxManager::shownCount() const
{
    return m_shownCount;
}
