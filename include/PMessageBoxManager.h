#pragma once

#include "ProxyComponent.h"

#include <QString>

class CMessageBoxManager;

// Proxy of the message-box manager ("tessel:Navigation?MessageBoxManager").
class TESSEL_EXPORT PMessageBoxManager : public ProxyComponent
{
public:
    explicit PMessageBoxManager(IComponent* component);
    ~PMessageBoxManager() override;

    void handleEvent(const EventDestroyingComponent& event) override;

    // Shows a modal box with up to three buttons (a null QString leaves a button out) and
    // returns the number of the button pressed, 1 for the first; 0 when no box could be shown.
    int showMessageBox(const QString& title, const QString& text, int kind, const QString& button1,
                       const QString& button2, const QString& button3);

private:
    CMessageBoxManager* m_pComp;
};
