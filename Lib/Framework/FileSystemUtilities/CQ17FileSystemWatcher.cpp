#include "CQ17FileSystemWatcher.h"

#include "BEvent.h"
#include "CustomEvent.h"
#include "IComponentManager.h"
#include "PQ17FileSystemWatcher.h"
#include "TesselLog_Static.h"

#include <QCoreApplication>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QFileSystemWatcher>
#include <QMetaObject>
#include <QThread>
#include <QTimer>

#include <sys/stat.h>

#include <atomic>
#include <functional>
#include <map>
#include <set>
#include <string>

namespace
{
const char* const kComponent = "FileSystemUtilities";
const char* const kFile = "FileSystemUtilities.dll";
const char* const kClass = "CQ17FileSystemWatcher";

// Notifications of one change (an editor's several writes, a replace seen by both the file and
// its folder) arriving within this delay are posted once.
const int kSettleMilliseconds = 50;

// What identifies the content at a path: inode, size and modification time. Empty when missing.
struct FileIdentity
{
    bool exists = false;
    unsigned long long inode = 0;
    long long size = 0;
    long long seconds = 0;
    long long nanoseconds = 0;

    bool operator==(const FileIdentity& other) const
    {
        return exists == other.exists && inode == other.inode && size == other.size && seconds == other.seconds &&
               nanoseconds == other.nanoseconds;
    }
    bool operator!=(const FileIdentity& other) const { return !(*this == other); }
};

FileIdentity identityOf(const QString& path)
{
    FileIdentity identity;
    struct stat status;
    if (::stat(QFile::encodeName(path).constData(), &status) != 0 || !S_ISREG(status.st_mode))
        return identity;
    identity.exists = true;
    identity.inode = static_cast<unsigned long long>(status.st_ino);
    identity.size = static_cast<long long>(status.st_size);
    identity.seconds = static_cast<long long>(status.st_mtim.tv_sec);
    identity.nanoseconds = static_cast<long long>(status.st_mtim.tv_nsec);
    return identity;
}

ACE_WString toWide(const QString& text)
{
    const std::wstring wide = text.toStdWString();
    return ACE_WString(wide.c_str(), wide.size());
}

QString absoluteClean(const QString& path)
{
    return QDir::cleanPath(QFileInfo(path).absoluteFilePath());
}

struct WatchedFile
{
    QStringList registered; // the spellings callers used, each posted back as given
    FileIdentity identity;  // as last seen
};

// Everything about the Qt watcher; touched only on the thread of the application object.
class WatchState : public std::enable_shared_from_this<WatchState>
{
public:
    ~WatchState()
    {
        if (m_watcher == nullptr)
            return;
        if (QThread::currentThread() == m_watcher->thread())
            delete m_watcher;
        else
            m_watcher->deleteLater();
    }

    std::atomic<bool> m_running{false};

    void add(const QString& absolutePath, const QString& registeredPath)
    {
        ensureWatcher();
        WatchedFile& file = m_files[absolutePath];
        if (!file.registered.contains(registeredPath))
            file.registered.append(registeredPath);
        const QString folder = QFileInfo(absolutePath).absolutePath();
        if (!m_watcher->directories().contains(folder))
            m_watcher->addPath(folder);
        file.identity = identityOf(absolutePath);
        if (file.identity.exists && !m_watcher->files().contains(absolutePath))
            m_watcher->addPath(absolutePath);
    }

private:
    void ensureWatcher()
    {
        if (m_watcher != nullptr)
            return;
        m_watcher = new QFileSystemWatcher();
        m_timer = new QTimer(m_watcher);
        m_timer->setSingleShot(true);
        m_timer->setInterval(kSettleMilliseconds);
        std::weak_ptr<WatchState> weak = weak_from_this();
        QObject::connect(m_watcher, &QFileSystemWatcher::fileChanged, m_watcher, [weak](const QString& path) {
            if (auto state = weak.lock())
                state->onFileChanged(path);
        });
        QObject::connect(m_watcher, &QFileSystemWatcher::directoryChanged, m_watcher, [weak](const QString& folder) {
            if (auto state = weak.lock())
                state->onDirectoryChanged(folder);
        });
        QObject::connect(m_timer, &QTimer::timeout, m_watcher, [weak]() {
            if (auto state = weak.lock())
                state->postChanges();
        });
    }

    // A file that was replaced (rename over it, delete and re-create) is another inode: watch
    // the new one. The folder watch catches a file that is re-created later.
    void rearm(const QString& path, WatchedFile& file)
    {
        const FileIdentity now = identityOf(path);
        const bool watched = m_watcher->files().contains(path);
        if (watched && (!now.exists || now.inode != file.identity.inode))
            m_watcher->removePath(path);
        if (now.exists && !m_watcher->files().contains(path))
            m_watcher->addPath(path);
        file.identity = now;
    }

    void onFileChanged(const QString& path)
    {
        const auto found = m_files.find(path);
        if (found == m_files.end())
            return;
        rearm(path, found->second);
        markChanged(path);
    }

    void onDirectoryChanged(const QString& folder)
    {
        for (auto& entry : m_files)
        {
            if (QFileInfo(entry.first).absolutePath() != folder)
                continue;
            if (identityOf(entry.first) == entry.second.identity)
                continue;
            rearm(entry.first, entry.second);
            markChanged(entry.first);
        }
    }

    void markChanged(const QString& path)
    {
        m_changed.insert(path);
        m_timer->start();
    }

    void postChanges()
    {
        std::set<QString> changed;
        changed.swap(m_changed);
        if (!m_running.load())
            return;
        for (const QString& path : changed)
        {
            const auto found = m_files.find(path);
            if (found == m_files.end())
                continue;
            // A copy: a handler may add files while we post.
            const QStringList registered = found->second.registered;
            for (const QString& name : registered)
            {
                TesselLog_Static::logTrace_static(
                    kComponent, kFile, kClass,
                    (L"[CQ17FileSystemWatcher] file changed: " + name.toStdWString()).c_str());
                BEvent<CustomEvent>::broadcast(CustomEvent(CQ17FileSystemWatcher::eventType, toWide(name)));
            }
        }
    }

    QFileSystemWatcher* m_watcher = nullptr;
    QTimer* m_timer = nullptr;
    std::map<QString, WatchedFile> m_files;
    std::set<QString> m_changed;
};

// Runs `work` on the application object's thread: at once when called there, queued otherwise.
bool runOnGuiThread(std::function<void()> work)
{
    QCoreApplication* application = QCoreApplication::instance();
    if (application == nullptr)
        return false;
    if (QThread::currentThread() == application->thread())
        work();
    else
        QMetaObject::invokeMethod(application, std::move(work), Qt::QueuedConnection);
    return true;
}
}

const wchar_t* const CQ17FileSystemWatcher::componentID = L"util:FileSystemUtilities?CQ17FileSystemWatcher";

struct CQ17FileSystemWatcher::Impl
{
    std::shared_ptr<WatchState> state = std::make_shared<WatchState>();
};

CQ17FileSystemWatcher::CQ17FileSystemWatcher() : CComponent_Thread_NoRef(ID(componentID)), m_impl(new Impl)
{
}

CQ17FileSystemWatcher::~CQ17FileSystemWatcher()
{
    m_impl->state->m_running = false;
}

CQ17FileSystemWatcher* CQ17FileSystemWatcher::registerWith(IComponentManager& manager)
{
    auto component = std::make_unique<CQ17FileSystemWatcher>();
    CQ17FileSystemWatcher* watcher = component.get();
    const int result = manager.registerComponent(
        std::move(component), [](IComponent* registered) { return new PQ17FileSystemWatcher(registered); });
    return result == 0 ? watcher : nullptr;
}

int CQ17FileSystemWatcher::addFile(const QString& path)
{
    if (path.isEmpty())
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, eEMPTY_PATH,
                                          "CQ17FileSystemWatcher::addFile: empty path");
        return eEMPTY_PATH;
    }
    const QString absolutePath = absoluteClean(path);
    const QString folder = QFileInfo(absolutePath).absolutePath();
    if (!QFileInfo(folder).isDir())
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, eNO_FOLDER,
                                          "CQ17FileSystemWatcher::addFile: no folder %s for %s",
                                          folder.toUtf8().constData(), path.toUtf8().constData());
        return eNO_FOLDER;
    }
    std::shared_ptr<WatchState> state = m_impl->state;
    if (!runOnGuiThread([state, absolutePath, path]() { state->add(absolutePath, path); }))
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, eNO_APPLICATION,
                                          "CQ17FileSystemWatcher::addFile: no application object, cannot watch %s",
                                          path.toUtf8().constData());
        return eNO_APPLICATION;
    }
    return eOK;
}

int CQ17FileSystemWatcher::run(const BOStream& /*stream*/)
{
    m_impl->state->m_running = true;
    return eOK;
}

bool CQ17FileSystemWatcher::isRunning() const
{
    return m_impl->state->m_running.load();
}
