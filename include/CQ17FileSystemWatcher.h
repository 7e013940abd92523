#pragma once

#include "CComponent_Thread_NoRef.h"

#include <QString>

#include <memory>

class IComponentManager;

// The file-system watcher component: once running, a change of a watched file is broadcast
// as CustomEvent(668, path as registered) on the GUI thread. A file replaced by an editor or an
// atomic save stays watched.
class TESSEL_EXPORT CQ17FileSystemWatcher : public CComponent_Thread_NoRef
{
public:
    static const wchar_t* const componentID;
    static const int eventType = 668;

    CQ17FileSystemWatcher();
    ~CQ17FileSystemWatcher() override;

    static CQ17FileSystemWatcher* registerWith(IComponentManager& manager);

    int addFile(const QString& path);
    int run(const BOStream& stream) override;
    bool isRunning() const;

private:
    struct Impl;
    std::unique_ptr<Impl> m_impl;
};
