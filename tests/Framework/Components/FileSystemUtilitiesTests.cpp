#include "CIniFile.h"
#include "CQ17FileSystemWatcher.h"
#include "ComponentFixture.h"
#include "CustomEvent.h"
#include "Handler.h"
#include "PQ17FileSystemWatcher.h"
#include "SmartProxy.h"
#include "TempDir.h"

#include <QCoreApplication>
#include <QElapsedTimer>

#include <algorithm>
#include <filesystem>
#include <functional>
#include <tuple>
#include <vector>

namespace
{
// Records the path of every file-changed event it receives, and a mark for any other event.
class FileSystemWatcherTest : public ComponentFixture, public Handler<CustomEvent>
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        ASSERT_NE(CQ17FileSystemWatcher::registerWith(*m_manager), nullptr);
        ASSERT_TRUE(m_proxy.acquire(ID(CQ17FileSystemWatcher::componentID)));
        Register(ID("test:Components?ChangeRecorder"));
    }
    void handleEvent(const CustomEvent& e) override
    {
        m_paths.push_back(e.get_type() == CQ17FileSystemWatcher::eventType ? utf8(e.get_data()) : "<other event>");
    }
    size_t countOf(const std::string& path) const { return std::count(m_paths.begin(), m_paths.end(), path); }
    SmartProxy<PQ17FileSystemWatcher> m_proxy;
    std::vector<std::string> m_paths;
    TempDir m_dir;
};

// A file that does not exist yet, registered under another spelling, is followed through an
// atomic creation (a temporary file renamed over it), deletion and re-creation; other files are not.
TEST_F(FileSystemWatcherTest, FollowsAWatchedFileUnderItsRegisteredSpellingOnly)
{
    const std::string real = m_dir.file("Data/InformationsGarage.xml"), other = m_dir.file("Data/other.xml");
    const std::string registered = m_dir.file("Data/../Data/InformationsGarage.xml");
    TempDir::write(other, "o");
    ASSERT_EQ(m_proxy->addFile(qs(registered)), CQ17FileSystemWatcher::eOK);
    ASSERT_EQ(m_proxy->run(BOStream(true)), 0);
    TempDir::write(other, "o3"); // not watched: its event, if any, would come before the watched file's
    const auto rename = [&] {
        TempDir::write(real + ".tmp", "1");
        std::filesystem::rename(real + ".tmp", real);
    };
    const std::function<void()> steps[] = {rename, [&] { TempDir::write(real, "22"); },
                                           [&] { std::filesystem::remove(real); }, [&] { TempDir::write(real, "4"); }};
    for (size_t i = 0; i < std::size(steps); ++i)
    {
        const size_t before = countOf(registered);
        steps[i]();
        QElapsedTimer clock;
        clock.start();
        while (countOf(registered) == before && clock.elapsed() < 10000)
            QCoreApplication::processEvents(QEventLoop::AllEvents, 20);
        ASSERT_GT(countOf(registered), before) << "step " << i;
    }
    EXPECT_EQ(m_paths, std::vector<std::string>(m_paths.size(), registered));
    EXPECT_EQ(m_proxy->addFile(QString()), CQ17FileSystemWatcher::eEMPTY_PATH);
    EXPECT_EQ(m_proxy->addFile(qs(m_dir.file("no/folder/file.xml"))), CQ17FileSystemWatcher::eNO_FOLDER);
    // A proxy whose component is gone answers failure.
    ASSERT_EQ(destroyComponent(ID(CQ17FileSystemWatcher::componentID)), 0);
    EXPECT_EQ(m_proxy->addFile(qs(real)), -1);
    EXPECT_EQ(m_proxy->run(BOStream(true)), -1);
}

// Each opening replaces what was read: the lines of a file with a malformed line stay
// readable, a failed opening leaves nothing readable.
TEST(IniFile, ReadsTheFirstValueOfAKeyInItsSectionOfTheLastOpening)
{
    TempDir dir;
    TempDir::write(dir.file("first.ini"), "[S]\nfirst = 1 \nfirst=2\n");
    TempDir::write(dir.file("broken.ini"), "[A]\nkey=1\nthis line has no equals sign\n[B]\nother=2\n");
    CIniFile ini;
    ACE_WString value;
    EXPECT_EQ(ini.readAttribute(L"S"_w, L"first"_w, value), CIniFile::eFILE_NOT_OPENED);
    const int ok = CIniFile::eOK, none = CIniFile::eNO_SUCH_ATTRIBUTE, closed = CIniFile::eFILE_NOT_OPENED;
    // mode, file, answer of the opening, of the read of S/first, of the read of B/other
    const std::tuple<int, const char*, int, int, int> steps[] = {
        {CIniFile::eREAD, "first.ini", ok, ok, none},
        {CIniFile::eREAD, "broken.ini", CIniFile::ePARSE_ERROR, none, ok},
        {CIniFile::eREAD, "absent.ini", closed, closed, closed},
        {2, "first.ini", CIniFile::eBAD_MODE, closed, closed}};
    for (const auto& [mode, file, opened, first, other] : steps)
    {
        EXPECT_EQ(ini.openIniFile(mode, wide(dir.file(file))), opened) << file;
        EXPECT_EQ(ini.readAttribute(L"S"_w, L"first"_w, value), first) << file;
        EXPECT_EQ(ini.readAttribute(L"B"_w, L"other"_w, value), other) << file;
        EXPECT_TRUE(first != ok || utf8(value) == "1") << utf8(value);
    }
}
}
