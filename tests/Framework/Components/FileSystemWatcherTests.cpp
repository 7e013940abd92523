#include "CQ17FileSystemWatcher.h"
#include "ComponentFixture.h"
#include "ComponentsTestSupport.h"
#include "CustomEvent.h"
#include "Handler.h"
#include "PQ17FileSystemWatcher.h"
#include "SmartProxy.h"
#include "TempDir.h"
#include "WideString.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <filesystem>
#include <string>
#include <vector>

namespace
{
// Collects the paths of the file-changed events it receives.
class ChangeRecorder : public Handler<CustomEvent>
{
public:
    ChangeRecorder() { Register(ID("test:Components?ChangeRecorder")); }
    ~ChangeRecorder() override { unregister(registeredID()); }

    void handleEvent(const CustomEvent& event) override
    {
        if (event.get_type() == CQ17FileSystemWatcher::eventType)
            m_paths.push_back(WideString::toUtf8(event.get_data()));
        else
            ++m_otherEvents;
    }

    size_t countOf(const std::string& path) const
    {
        size_t count = 0;
        for (const std::string& p : m_paths)
            count += p == path ? 1 : 0;
        return count;
    }

    std::vector<std::string> m_paths;
    int m_otherEvents = 0;
};

// Replaces the file the way an atomic save does: a temporary file beside it, renamed over it.
void replaceAtomically(const std::string& path, const std::string& content)
{
    const std::string temporary = path + ".tmp";
    TempDir::write(temporary, content);
    std::filesystem::rename(temporary, path);
}

class FileSystemWatcherTest : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_watcher = CQ17FileSystemWatcher::registerWith(*m_manager);
        ASSERT_NE(m_watcher, nullptr);
        ASSERT_TRUE(m_proxy.acquire(ID(CQ17FileSystemWatcher::componentID)));
    }
    void TearDown() override
    {
        m_proxy.giveBack();
        ComponentFixture::TearDown();
    }

    // Waits for the n-th event naming `path`.
    bool waitForEvents(const std::string& path, size_t n)
    {
        return processEventsUntil([&]() { return m_recorder.countOf(path) >= n; });
    }

    CQ17FileSystemWatcher* m_watcher = nullptr;
    SmartProxy<PQ17FileSystemWatcher> m_proxy;
    ChangeRecorder m_recorder;
    TempDir m_dir;
};

TEST_F(FileSystemWatcherTest, ModifiedFileIsPostedWithThePathAsRegistered)
{
    const std::string real = m_dir.file("Data/InformationsGarage.xml");
    TempDir::write(real, "<set/>");
    // Spelled with a detour: the event must carry this very spelling.
    const std::string registered = m_dir.file("Data/../Data/InformationsGarage.xml");
    ASSERT_EQ(m_proxy->addFile(QString::fromStdString(registered)), CQ17FileSystemWatcher::eOK);
    ASSERT_EQ(m_proxy->run(BOStream(true)), 0);
    EXPECT_TRUE(m_watcher->isRunning());

    TempDir::write(real, "<set><changed/></set>");
    ASSERT_TRUE(waitForEvents(registered, 1));
    EXPECT_EQ(m_recorder.countOf(real), 0u);
    EXPECT_EQ(m_recorder.m_otherEvents, 0);
}

TEST_F(FileSystemWatcherTest, KeepsWatchingAfterAtomicReplace)
{
    const std::string path = m_dir.file("FicheDiagParams.xml");
    TempDir::write(path, "one");
    ASSERT_EQ(m_watcher->addFile(QString::fromStdString(path)), CQ17FileSystemWatcher::eOK);
    m_watcher->run(BOStream(true));

    replaceAtomically(path, "two");
    ASSERT_TRUE(waitForEvents(path, 1));
    const size_t afterReplace = m_recorder.countOf(path);

    // The new file is watched: a plain write to it is seen, and so is a second replace.
    TempDir::write(path, "three");
    ASSERT_TRUE(waitForEvents(path, afterReplace + 1));
    const size_t afterWrite = m_recorder.countOf(path);
    replaceAtomically(path, "four");
    ASSERT_TRUE(waitForEvents(path, afterWrite + 1));
}

TEST_F(FileSystemWatcherTest, FileDeletedAndCreatedAgainIsFollowed)
{
    const std::string path = m_dir.file("Preparateur.xml");
    TempDir::write(path, "one");
    ASSERT_EQ(m_watcher->addFile(QString::fromStdString(path)), CQ17FileSystemWatcher::eOK);
    m_watcher->run(BOStream(true));

    std::filesystem::remove(path);
    ASSERT_TRUE(waitForEvents(path, 1));
    const size_t afterRemove = m_recorder.countOf(path);
    TempDir::write(path, "back");
    ASSERT_TRUE(waitForEvents(path, afterRemove + 1));
    const size_t afterCreate = m_recorder.countOf(path);
    TempDir::write(path, "changed again");
    ASSERT_TRUE(waitForEvents(path, afterCreate + 1));
}

TEST_F(FileSystemWatcherTest, FileThatDoesNotExistYetIsReportedWhenCreated)
{
    const std::string path = m_dir.file("InformationsGarage.xml");
    ASSERT_EQ(m_watcher->addFile(QString::fromStdString(path)), CQ17FileSystemWatcher::eOK);
    m_watcher->run(BOStream(true));
    replaceAtomically(path, "first save");
    ASSERT_TRUE(waitForEvents(path, 1));
}

TEST_F(FileSystemWatcherTest, OtherFilesOfTheFolderPostNothing)
{
    const std::string watched = m_dir.file("watched.xml");
    const std::string other = m_dir.file("other.xml");
    TempDir::write(watched, "w");
    ASSERT_EQ(m_watcher->addFile(QString::fromStdString(watched)), CQ17FileSystemWatcher::eOK);
    m_watcher->run(BOStream(true));

    TempDir::write(other, "o");
    replaceAtomically(other, "o2");
    // A later change of the watched file marks the end: everything before it has been handled.
    TempDir::write(watched, "w2");
    ASSERT_TRUE(waitForEvents(watched, 1));
    EXPECT_EQ(m_recorder.countOf(other), 0u);
    EXPECT_EQ(m_recorder.m_paths.size(), m_recorder.countOf(watched));
}

TEST_F(FileSystemWatcherTest, ChangesBeforeRunAreNotPosted)
{
    const std::string path = m_dir.file("watched.xml");
    TempDir::write(path, "one");
    ASSERT_EQ(m_watcher->addFile(QString::fromStdString(path)), CQ17FileSystemWatcher::eOK);
    EXPECT_FALSE(m_watcher->isRunning());

    TempDir::write(path, "two");
    // Long enough for the change to be noticed and settled.
    processEventsUntil([]() { return false; }, 400);
    EXPECT_TRUE(m_recorder.m_paths.empty());

    m_watcher->run(BOStream(true));
    TempDir::write(path, "three");
    ASSERT_TRUE(waitForEvents(path, 1));
}

TEST_F(FileSystemWatcherTest, BadPathsAreRefused)
{
    EXPECT_EQ(m_proxy->addFile(QString()), CQ17FileSystemWatcher::eEMPTY_PATH);
    EXPECT_EQ(m_proxy->addFile(QString::fromStdString(m_dir.file("no/such/folder/file.xml"))),
              CQ17FileSystemWatcher::eNO_FOLDER);
}

TEST_F(FileSystemWatcherTest, ProxyAnswersFailureOnceTheComponentIsGone)
{
    ASSERT_EQ(destroyComponent(ID(CQ17FileSystemWatcher::componentID)), 0);
    m_watcher = nullptr;
    EXPECT_NE(m_proxy->addFile(QString::fromStdString(m_dir.file("x.xml"))), 0);
    EXPECT_NE(m_proxy->run(BOStream(true)), 0);
}
}
