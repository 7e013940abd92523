#pragma once

#include "CComponent_Thread_NoRef.h"

#include <QString>

#include <memory>

class IComponentManager;

// The file-system watcher component: once running, a change of a watched file is broadcast
// as CustomEvent(668, path as registered) on the GUI thread. A file replaced by an editor or an
// atomic save stays watched, and so does one deleted and created again (its folder is watched
// too); a file that does not exist yet is reported when it appears. Changes seen before run()
// are not posted. Notifications of one change arriving close together are posted once.
//
// The Qt watcher lives on the thread of the application object; addFile from another thread is
// handed over to it. Without an application object nothing can be watched.
class TESSEL_EXPORT CQ17FileSystemWatcher : public CComponent_Thread_NoRef
{
public:
    enum Result
    {
        eOK = 0,
        eEMPTY_PATH = 1,
        eNO_FOLDER = 2,
        eNO_APPLICATION = 3
    };

    static const wchar_t* const componentID;
    static const int eventType = 668;

    CQ17FileSystemWatcher();
    ~CQ17FileSystemWatcher() override;

    static CQ17FileSystemWatcher* registerWith(IComponentManager& manager);

    // 0 when the file is (or will be, once it exists) watched; see Result.
    int addFile(const QString& path);
    int run(const BOStream& stream) override;
    bool isRunning() const;

private:
    struct Impl;
    std::unique_ptr<Impl> m_impl;
};
