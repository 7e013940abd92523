#include "BBool.h"
#include "BInt.h"
#include "BString.h"
#include "ComponentFixture.h"
#include "LogCapture.h"
#include "PDataManager.h"
#include "SmartProxy.h"
#include "TempDir.h"
#include "WideString.h"

#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

namespace
{
ACE_WString W(const wchar_t* text)
{
    return ACE_WString(text);
}

std::string text(const ACE_WString& value)
{
    return WideString::toUtf8(value);
}

class DataManagerTest : public ComponentFixture
{
protected:
    void publish(const char* uri, const BData& value) { ASSERT_EQ(m_dataManager->createData(ID(uri), value), 0) << uri; }

    // A two-field record like the ones the dialogs show.
    static BSet record(const wchar_t* value, long state = 3)
    {
        BSet set;
        set.setInt(W(L"state"), state);
        set.setString(W(L"value"), W(value));
        return set;
    }
};

TEST_F(DataManagerTest, AbsentUriLeavesThePresetDefault)
{
    publish("data:/Auto/SystemMenu/NameEdit", BString(L"Garage"));
    for (const char* uri : {"data:/Nothing", "data:/Auto/SystemMenu/Missing", "data:/Auto/Other/NameEdit",
                            "data:/Auto/SystemMenu/NameEdit/below"})
    {
        ACE_WString value(L"preset");
        EXPECT_EQ(m_dataManager->getString(ID(uri), value), CDataManager::eNO_SUCH_DATA) << uri;
        EXPECT_EQ(text(value), "preset") << uri;
        bool flag = true;
        EXPECT_EQ(m_dataManager->getBool(ID(uri), flag), CDataManager::eNO_SUCH_DATA) << uri;
        EXPECT_TRUE(flag);
    }
}

TEST_F(DataManagerTest, CreatingAgainReplacesWhateverIsThere)
{
    const ID uri("data:/Auto/SystemMenu/TaskTimeEdit");
    publish("data:/Auto/SystemMenu/TaskTimeEdit", BString(L"10:00"));
    publish("data:/Auto/SystemMenu/TaskTimeEdit", BString(L"22:30"));
    ACE_WString value;
    ASSERT_EQ(m_dataManager->getString(uri, value), 0);
    EXPECT_EQ(text(value), "22:30");

    ASSERT_EQ(m_dataManager->setBool(uri, true), 0);
    bool flag = false;
    EXPECT_EQ(m_dataManager->getBool(uri, flag), 0);
    EXPECT_TRUE(flag);
    EXPECT_EQ(m_dataManager->getString(uri, value), CDataManager::eWRONG_TYPE);

    // A value on the way to a new URI turns into a set.
    publish("data:/Auto/SystemMenu/TaskTimeEdit/hour", BInt(22));
    EXPECT_EQ(m_dataManager->getBool(uri, flag), CDataManager::eWRONG_TYPE);
    BInt hour;
    EXPECT_EQ(m_dataManager->getData(ID("data:/Auto/SystemMenu/TaskTimeEdit/hour"), hour), 0);
    EXPECT_EQ(hour.value(), 22);
}

TEST_F(DataManagerTest, InnerNodeReadsAsTheWholeSetBelowIt)
{
    publish("data:/Auto/SystemMenu/NameEdit", record(L"Garage Martin"));
    publish("data:/Auto/SystemMenu/TownEdit", BString(L"Lyon"));
    publish("data:/Auto/SystemMenu/NameEdit/state", BInt(19));

    BSet menu;
    menu.setString(W(L"stale"), W(L"replaced by the read"));
    ASSERT_EQ(m_dataManager->getData(ID("data:/Auto/SystemMenu"), menu), 0);
    EXPECT_EQ(menu.size(), 2);
    EXPECT_FALSE(menu.contains(W(L"stale")));
    BSet name;
    ASSERT_EQ(menu.getSet(W(L"NameEdit"), name), 0);
    EXPECT_TRUE(name.equals(record(L"Garage Martin", 19)));
    ACE_WString town;
    EXPECT_EQ(menu.getString(W(L"TownEdit"), town), 0);
    EXPECT_EQ(text(town), "Lyon");
    EXPECT_EQ(menu.keyAt(0), W(L"NameEdit")) << "keys keep the order of first publication";

    ACE_WString value;
    EXPECT_EQ(m_dataManager->getString(ID("data:/Auto/SystemMenu/NameEdit/value"), value), 0);
    EXPECT_EQ(text(value), "Garage Martin");
}

TEST_F(DataManagerTest, SetDataOnlyReplacesExistingValues)
{
    EXPECT_EQ(m_dataManager->setData(ID("data:/Auto/SystemMenu/NameEdit"), BString(L"x")), CDataManager::eNO_SUCH_DATA);
    BSet auto_;
    EXPECT_EQ(m_dataManager->getData(ID("data:/Auto"), auto_), CDataManager::eNO_SUCH_DATA) << "nothing was created";

    publish("data:/Auto/SystemMenu/NameEdit", record(L"old"));
    ASSERT_EQ(m_dataManager->setData(ID("data:/Auto/SystemMenu/NameEdit"), record(L"new", 2)), 0);
    BSet read;
    ASSERT_EQ(m_dataManager->getData(ID("data:/Auto/SystemMenu/NameEdit"), read), 0);
    EXPECT_TRUE(read.equals(record(L"new", 2)));
    EXPECT_EQ(m_dataManager->setData(ID("data:/Auto/SystemMenu/NameEdit/value/deeper"), BString(L"x")),
              CDataManager::eNO_SUCH_DATA);
}

TEST_F(DataManagerTest, ReadOfAnotherKindLeavesTheOutputUntouched)
{
    publish("data:/Flag", BBool(true));
    publish("data:/Text", BString(L"text"));
    publish("data:/Set", record(L"v"));

    ACE_WString value(L"preset");
    EXPECT_EQ(m_dataManager->getString(ID("data:/Flag"), value), CDataManager::eWRONG_TYPE);
    EXPECT_EQ(m_dataManager->getString(ID("data:/Set"), value), CDataManager::eWRONG_TYPE);
    EXPECT_EQ(text(value), "preset");

    bool flag = true;
    EXPECT_EQ(m_dataManager->getBool(ID("data:/Text"), flag), CDataManager::eWRONG_TYPE);
    EXPECT_TRUE(flag);

    BSet set;
    set.setString(W(L"kept"), W(L"yes"));
    EXPECT_EQ(m_dataManager->getData(ID("data:/Text"), set), CDataManager::eWRONG_TYPE);
    EXPECT_TRUE(set.contains(W(L"kept")));
    BInt number(5);
    EXPECT_EQ(m_dataManager->getData(ID("data:/Set"), number), CDataManager::eWRONG_TYPE);
    EXPECT_EQ(number.value(), 5);
}

TEST_F(DataManagerTest, IdentifiersOfOtherSchemesAreRefused)
{
    LogCapture log;
    ACE_WString value(L"preset");
    for (const char* uri : {"tessel:DM?DataManager", "datax:/Auto", "", "data:/"})
    {
        EXPECT_EQ(m_dataManager->createData(ID(uri), BString(L"v")), CDataManager::eNOT_A_DATA_URI) << uri;
        EXPECT_EQ(m_dataManager->setString(ID(uri), W(L"v")), CDataManager::eNOT_A_DATA_URI) << uri;
    }
    EXPECT_EQ(m_dataManager->getString(ID("tessel:DM?DataManager"), value), CDataManager::eNOT_A_DATA_URI);
    EXPECT_EQ(text(value), "preset");
    EXPECT_TRUE(log.containsSubstring("'tessel:DM?DataManager' is not a data URI", TesselLog_Static::eERROR));
}

TEST_F(DataManagerTest, RemovedValueIsGone)
{
    publish("data:/Auto/SystemMenu/A", BString(L"a"));
    publish("data:/Auto/SystemMenu/B", BString(L"b"));
    EXPECT_EQ(m_dataManager->removeData(ID("data:/Auto/SystemMenu/A")), 0);
    EXPECT_EQ(m_dataManager->removeData(ID("data:/Auto/SystemMenu/A")), CDataManager::eNO_SUCH_DATA);
    BSet menu;
    ASSERT_EQ(m_dataManager->getData(ID("data:/Auto/SystemMenu"), menu), 0);
    EXPECT_EQ(menu.size(), 1);
    EXPECT_TRUE(menu.contains(W(L"B")));
}

TEST_F(DataManagerTest, PreloadMergesTheFileUnderTheRoot)
{
    TempDir dir;
    BSet paths;
    paths.setString(W(L"Workshop"), W(L"new.xml"));
    paths.setString(W(L"Users"), W(L"users.xml"));
    BSet file;
    file.setSet(W(L"Paths"), paths);
    file.setBool(W(L"Enabled"), true);
    const std::string path = dir.file("config.xml");
    ASSERT_TRUE(file.save(WideString::fromUtf8(path), false));

    publish("data:/Configuration/Paths/Workshop", BString(L"old.xml"));
    publish("data:/Configuration/Paths/Other", BString(L"kept.xml"));
    publish("data:/Configuration/Enabled", record(L"replaced"));
    ASSERT_TRUE(m_dataManager->preload(WideString::fromUtf8(path), ID("data:/Configuration")));

    const std::pair<const char*, const char*> expected[] = {{"data:/Configuration/Paths/Workshop", "new.xml"},
                                                            {"data:/Configuration/Paths/Users", "users.xml"},
                                                            {"data:/Configuration/Paths/Other", "kept.xml"}};
    for (const auto& [uri, want] : expected)
    {
        ACE_WString value;
        EXPECT_EQ(m_dataManager->getString(ID(uri), value), 0) << uri;
        EXPECT_EQ(text(value), want) << uri;
    }
    bool enabled = false;
    EXPECT_EQ(m_dataManager->getBool(ID("data:/Configuration/Enabled"), enabled), 0);
    EXPECT_TRUE(enabled);

    LogCapture log;
    EXPECT_FALSE(m_dataManager->preload(WideString::fromUtf8(dir.file("missing.xml")), ID("data:/Configuration")));
    EXPECT_TRUE(log.containsSubstring("missing.xml", TesselLog_Static::eERROR));
    EXPECT_FALSE(m_dataManager->preload(WideString::fromUtf8(path), ID("tessel:DM?DataManager")));
    ACE_WString value;
    EXPECT_EQ(m_dataManager->getString(ID("data:/Configuration/Paths/Workshop"), value), 0);
    EXPECT_EQ(text(value), "new.xml");
}

TEST_F(DataManagerTest, ListenersHearEveryChangeAndMayReadTheTree)
{
    std::vector<std::string> heard;
    const int handle = m_dataManager->addListener([this, &heard](const ID& uri) {
        // Reading back from the listener only works when it runs outside the lock.
        BSet whole;
        m_dataManager->getData(ID("data:/"), whole);
        heard.push_back(text(uri.getString()) + "=" + std::to_string(whole.size()));
    });
    publish("data:/A", BString(L"a"));
    m_dataManager->setString(ID("data:/B"), W(L"b"));
    m_dataManager->setData(ID("data:/A"), BString(L"a2"));
    m_dataManager->setData(ID("data:/Absent"), BString(L"x"));
    m_dataManager->removeData(ID("data:/B"));
    const std::vector<std::string> expected = {"data:/A=1", "data:/B=2", "data:/A=2", "data:/B=1"};
    EXPECT_EQ(heard, expected);

    m_dataManager->removeListener(handle);
    publish("data:/C", BString(L"c"));
    EXPECT_EQ(heard.size(), expected.size());
}

TEST_F(DataManagerTest, ProxyForwardsUntilTheComponentIsDestroyed)
{
    SmartProxy<PDataManager> dm;
    ASSERT_TRUE(dm.acquire(ID(CDataManager::componentID)));
    EXPECT_EQ(dm->createData(ID("data:/Auto/SystemMenu/Users/UserSet"), BSet()), 0);
    EXPECT_EQ(dm->setString(ID("data:/Path"), W(L"/tmp/a.xml")), 0);
    EXPECT_EQ(dm->setBool(ID("data:/Flag"), true), 0);
    EXPECT_EQ(dm->setData(ID("data:/Path"), BString(L"/tmp/b.xml")), 0);
    ACE_WString value;
    EXPECT_EQ(dm->getString(ID("data:/Path"), value), 0);
    EXPECT_EQ(text(value), "/tmp/b.xml");

    ASSERT_EQ(destroyDataManager(), 0);
    value = W(L"preset");
    bool flag = false;
    BSet set;
    set.setBool(W(L"kept"), true);
    EXPECT_EQ(dm->getString(ID("data:/Path"), value), CDataManager::eNO_SUCH_DATA);
    EXPECT_EQ(dm->getBool(ID("data:/Flag"), flag), CDataManager::eNO_SUCH_DATA);
    EXPECT_EQ(dm->getData(ID("data:/Auto"), set), CDataManager::eNO_SUCH_DATA);
    EXPECT_EQ(dm->createData(ID("data:/Path"), BString(L"x")), CDataManager::eNO_SUCH_DATA);
    EXPECT_EQ(text(value), "preset");
    EXPECT_FALSE(flag);
    EXPECT_TRUE(set.contains(W(L"kept")));
}

TEST_F(DataManagerTest, ReadersOnOtherThreadsNeverSeeAHalfWrittenRecord)
{
    std::atomic<bool> done{false};
    std::atomic<int> torn{0};
    publish("data:/Pair", BSet());
    std::vector<std::thread> readers;
    for (int r = 0; r < 2; ++r)
        readers.emplace_back([&] {
            while (!done)
            {
                BSet pair;
                if (m_dataManager->getData(ID("data:/Pair"), pair) != 0)
                    continue;
                long first = -1;
                long second = -2;
                pair.getInt(W(L"first"), first);
                pair.getInt(W(L"second"), second);
                if (!pair.isEmpty() && first != second)
                    ++torn;
            }
        });
    for (long i = 0; i < 2000; ++i)
    {
        BSet pair;
        pair.setInt(W(L"first"), i);
        pair.setInt(W(L"second"), i);
        m_dataManager->createData(ID("data:/Pair"), pair);
    }
    done = true;
    for (std::thread& reader : readers)
        reader.join();
    EXPECT_EQ(torn, 0);
}
}
