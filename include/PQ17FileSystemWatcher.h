#pragma once

#include "ProxyComponent.h"

#include <QString>

class CQ17FileSystemWatcher;

// Proxy of the file-system watcher ("util:FileSystemUtilities?CQ17FileSystemWatcher").
class TESSEL_EXPORT PQ17FileSystemWatcher : public ProxyComponent
{
public:
    explicit PQ17FileSystemWatcher(IComponent* component);
    ~PQ17FileSystemWatcher() override;

    void handleEvent(const EventDestroyingComponent& event) override;

    // Adds a file to watch; 0 on success.
    int addFile(const QString& path);
    // Starts posting change events; 0 on success.
    int run(const BOStream& stream) override;

private:
    CQ17FileSystemWatcher* m_pComp;
};
