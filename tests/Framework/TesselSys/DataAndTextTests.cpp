#include "BInt.h"
#include "BString.h"
#include "ComponentFixture.h"
#include "LogCapture.h"
#include "PBText.h"
#include "PDataManager.h"
#include "SmartProxy.h"
#include "TempDir.h"

#include <gtest/gtest.h>

#include <atomic>
#include <thread>

namespace
{
class DataManagerTest : public ComponentFixture
{
protected:
    void publish(const char* uri, const BData& value)
    {
        ASSERT_EQ(m_dataManager->createData(ID(uri), value), 0) << uri;
    }
    std::string stringAt(const char* uri, ACE_WString value = L"absent"_w)
    {
        return m_dataManager->getString(ID(uri), value), utf8(value);
    }
};

TEST_F(DataManagerTest, FailedAccessGivesItsCodeAndLeavesThePresetOutputAlsoThroughADeadProxy)
{
    publish("data:/Name", BString(L"Garage"_w));
    publish("data:/Set", BSet());
    SmartProxy<PDataManager> dm;
    ASSERT_TRUE(dm.acquire(ID(CDataManager::componentID)));
    ACE_WString text(L"preset"_w);
    bool flag = false;
    BSet set;
    set.setInt(L"preset"_w, 1);
    EXPECT_EQ(m_dataManager->getString(ID("data:/Nothing"), text), CDataManager::eNO_SUCH_DATA);
    EXPECT_EQ(m_dataManager->getData(ID("data:/Name/below"), set), CDataManager::eNO_SUCH_DATA);
    EXPECT_EQ(m_dataManager->getString(ID("data:/Set"), text), CDataManager::eWRONG_TYPE);
    EXPECT_EQ(m_dataManager->getData(ID("data:/Name"), set), CDataManager::eWRONG_TYPE);
    EXPECT_EQ(m_dataManager->getBool(ID("data:/Name"), flag), CDataManager::eWRONG_TYPE);
    EXPECT_EQ(m_dataManager->getString(ID("tessel:DM?DataManager"), text), CDataManager::eNOT_A_DATA_URI);
    LogCapture log;
    for (const char* uri : {"tessel:DM?DataManager", "data:/"})
        EXPECT_EQ(m_dataManager->createData(ID(uri), BString(L"v"_w)) +
                      m_dataManager->setData(ID(uri), BString(L"v"_w)) + m_dataManager->removeData(ID(uri)),
                  3 * CDataManager::eNOT_A_DATA_URI)
            << uri;
    EXPECT_TRUE(log.containsSubstring("'tessel:DM?DataManager' is not a data URI", TesselLog_Static::eERROR));

    // The proxy forwards until the component is destroyed.
    EXPECT_EQ(dm->createData(ID("data:/Set"), BSet()) + dm->setBool(ID("data:/Flag"), true) +
                  dm->setString(ID("data:/Path"), L"a"_w) + dm->setData(ID("data:/Path"), BString(L"b"_w)),
              0);
    EXPECT_EQ(stringAt("data:/Path"), "b");
    ASSERT_EQ(destroyDataManager(), 0);
    EXPECT_EQ(dm->getString(ID("data:/Path"), text) + dm->getBool(ID("data:/Flag"), flag) +
                  dm->getData(ID("data:/Set"), set) + dm->createData(ID("data:/Path"), BString(L"x"_w)),
              4 * CDataManager::eNO_SUCH_DATA);
    EXPECT_TRUE(text == L"preset"_w && !flag && set.contains(L"preset"_w));
}

// Visiting reads the values of one set in place, in order; nested sets are not values. The
// nested visit reads the values one level down and counts every entry of the set.
TEST_F(DataManagerTest, VisitingASetSeesItsValuesInOrderAndFailsLikeAReadOtherwise)
{
    BSet inner;
    inner.setString(L"name"_w, L"In"_w);
    inner.setSet(L"deeper"_w, BSet());
    inner.setInt(L"n"_w, 2);
    BSet brands;
    brands.setString(L"7"_w, L"Seven"_w);
    brands.setSet(L"inner"_w, inner);
    brands.setInt(L"1"_w, 1);
    publish("data:/Brands", brands);
    SmartProxy<PDataManager> dm;
    ASSERT_TRUE(dm.acquire(ID(CDataManager::componentID)));
    const auto visited = [&dm](const char* uri, std::string& seen) {
        return dm->visitValues(ID(uri), [&seen](const ACE_WString& key, const BData& value) {
            seen += utf8(key) +
                    (value.type() == BData::eSTRING ? "=" + utf8(static_cast<const BString&>(value).value())
                                                    : std::string("#")) +
                    " ";
        });
    };
    std::string seen;
    EXPECT_EQ(visited("data:/Brands", seen), 0);
    EXPECT_EQ(seen, "7=Seven 1# ");
    seen.clear();
    int entries = -1;
    EXPECT_EQ(dm->visitNestedValues(ID("data:/Brands"), entries,
                                    [&seen](const ACE_WString& setKey, const ACE_WString& key, const BData& value) {
                                        seen += utf8(setKey) + "/" + utf8(key) +
                                                (value.type() == BData::eSTRING ? "$ " : "# ");
                                    }),
              0);
    EXPECT_EQ(seen, "inner/name$ inner/n# ");
    EXPECT_EQ(entries, 3);
    EXPECT_EQ(dm->visitNestedValues(ID("data:/Brands/7"), entries, [](auto&, auto&, auto&) {}),
              CDataManager::eWRONG_TYPE);
    EXPECT_EQ(entries, 0);
    seen.clear();
    EXPECT_EQ(visited("data:/Brands/7", seen), CDataManager::eWRONG_TYPE);
    EXPECT_EQ(visited("data:/Nothing", seen), CDataManager::eNO_SUCH_DATA);
    EXPECT_EQ(visited("tessel:DM?DataManager", seen), CDataManager::eNOT_A_DATA_URI);
    EXPECT_EQ(seen, "");
    ASSERT_EQ(destroyDataManager(), 0);
    EXPECT_EQ(visited("data:/Brands", seen), CDataManager::eNO_SUCH_DATA);
}

TEST_F(DataManagerTest, WritesAndPreloadReplaceAndInnerNodesReadAsTheSetBelowThem)
{
    EXPECT_EQ(m_dataManager->setData(ID("data:/Auto/Menu/Name"), BString(L"x"_w)), CDataManager::eNO_SUCH_DATA);
    BSet read;
    EXPECT_EQ(m_dataManager->getData(ID("data:/Auto"), read), CDataManager::eNO_SUCH_DATA) << "setData creates nothing";
    BSet record;
    record.setInt(L"state"_w, 3);
    publish("data:/Auto/Menu/Name", record);
    publish("data:/Auto/Menu/Town", BString(L"Lyon"_w));
    publish("data:/Auto/Menu/Name/state", BInt(19));
    read.setString(L"stale"_w, L"replaced by the read"_w);
    ASSERT_EQ(m_dataManager->getData(ID("data:/Auto/Menu"), read), 0);
    BSet expected; // keys keep the order of first publication
    record.setInt(L"state"_w, 19);
    expected.setSet(L"Name"_w, record);
    expected.setString(L"Town"_w, L"Lyon"_w);
    EXPECT_TRUE(read.equals(expected));

    ASSERT_EQ(m_dataManager->setData(ID("data:/Auto/Menu/Town"), BString(L"Nice"_w)), 0);
    EXPECT_EQ(stringAt("data:/Auto/Menu/Town"), "Nice");
    EXPECT_EQ(m_dataManager->setData(ID("data:/Auto/Menu/Town/deeper"), BString(L"x"_w)), CDataManager::eNO_SUCH_DATA);
    ASSERT_EQ(m_dataManager->setBool(ID("data:/Auto/Menu/Town"), true), 0); // another kind replaces too
    bool flag = false;
    EXPECT_TRUE(m_dataManager->getBool(ID("data:/Auto/Menu/Town"), flag) == 0 && flag);
    publish("data:/Auto/Menu/Town/zip", BString(L"69000"_w)); // a value on the way turns into a set
    EXPECT_EQ(m_dataManager->getBool(ID("data:/Auto/Menu/Town"), flag), CDataManager::eWRONG_TYPE);
    EXPECT_EQ(stringAt("data:/Auto/Menu/Town/zip"), "69000");

    // Preload merges a file under a root; listeners hear every change, outside the lock.
    std::vector<std::string> heard;
    const int handle = m_dataManager->addListener([this, &heard](const ID& uri) {
        BSet whole;
        m_dataManager->getData(ID("data:/"), whole);
        heard.push_back(utf8(uri.getString()) + "=" + std::to_string(whole.size()));
    });
    TempDir dir;
    const std::string path = dir.file("config.xml");
    // Where a value was, a set from the file replaces it.
    TempDir::write(path, "<BSet><Set key=\"Paths\"><String key=\"Workshop\">new</String></Set><Set key=\"Ports\">"
                         "<String key=\"Workshop\">new</String></Set><Bool key=\"Enabled\">true</Bool></BSet>");
    publish("data:/Config/Paths/Workshop", BString(L"old"_w));
    publish("data:/Config/Paths/Other", BString(L"kept"_w));
    publish("data:/Config/Enabled", BSet());
    m_dataManager->setString(ID("data:/Config/Ports"), L"replaced"_w);
    ASSERT_TRUE(m_dataManager->preload(wide(path), ID("data:/Config")));
    m_dataManager->setData(ID("data:/Absent"), BString(L"x"_w));
    EXPECT_EQ(m_dataManager->removeData(ID("data:/Config/Paths/Other")), 0);
    EXPECT_EQ(m_dataManager->removeData(ID("data:/Config/Paths/Other")), CDataManager::eNO_SUCH_DATA);
    m_dataManager->removeListener(handle);
    publish("data:/After", BString(L"x"_w)); // not heard
    LogCapture log;
    EXPECT_FALSE(m_dataManager->preload(wide(dir.file("missing.xml")), ID("data:/Config")) ||
                 m_dataManager->preload(wide(path), ID("tessel:DM?DataManager")));
    EXPECT_TRUE(log.containsSubstring("missing.xml", TesselLog_Static::eERROR));
    EXPECT_EQ(stringAt("data:/Config/Paths/Workshop") + stringAt("data:/Config/Ports/Workshop") +
                  stringAt("data:/Config/Paths/Other"),
              "newnewabsent");
    bool enabled = false;
    EXPECT_TRUE(m_dataManager->getBool(ID("data:/Config/Enabled"), enabled) == 0 && enabled);
    EXPECT_EQ(heard, (std::vector<std::string>{"data:/Config/Paths/Workshop=2", "data:/Config/Paths/Other=2",
                                               "data:/Config/Enabled=2", "data:/Config/Ports=2", "data:/Config=2",
                                               "data:/Config/Paths/Other=2"}));
}

// A set moved in reads back as the same set published by copy, and is left empty; a refused
// URI leaves it whole.
TEST_F(DataManagerTest, ASetMovedInReadsBackAsItsCopy)
{
    BSet record;
    record.setInt(L"state"_w, 3);
    record.editSet(L"value"_w).setString(L"0001"_w, L"Alpha"_w);
    record.editSet(L"value"_w).setSet(L"inner"_w, BSet());
    record.setString(L"selected"_w, L"Alpha"_w);
    const BSet copy = record;
    EXPECT_EQ(m_dataManager->createData(ID("tessel:DM?DataManager"), std::move(record)), CDataManager::eNOT_A_DATA_URI);
    EXPECT_TRUE(record.equals(copy));
    ASSERT_EQ(m_dataManager->createData(ID("data:/Moved/Combo"), std::move(record)), 0);
    EXPECT_TRUE(record.isEmpty());
    publish("data:/Copied/Combo", copy);
    BSet moved;
    BSet copied;
    ASSERT_EQ(m_dataManager->getData(ID("data:/Moved/Combo"), moved), 0);
    ASSERT_EQ(m_dataManager->getData(ID("data:/Copied/Combo"), copied), 0);
    EXPECT_TRUE(moved.equals(copy) && copied.equals(copy));
}

TEST_F(DataManagerTest, ReadersOnOtherThreadsNeverSeeAHalfWrittenRecord)
{
    std::atomic<bool> done{false};
    std::atomic<int> torn{0};
    publish("data:/Pair", BSet());
    std::thread reader([&] {
        for (BSet pair; !done;)
        {
            long first = -1;
            long second = -2;
            if (m_dataManager->getData(ID("data:/Pair"), pair) == 0 && !pair.isEmpty() &&
                (pair.getInt(L"first"_w, first) != 0 || pair.getInt(L"second"_w, second) != 0 || first != second))
                ++torn;
        }
    });
    BSet pair;
    for (long i = 0; i < 1000; ++i)
    {
        pair.setInt(L"first"_w, i);
        pair.setInt(L"second"_w, i);
        m_dataManager->createData(ID("data:/Pair"), pair);
    }
    done = true;
    reader.join();
    EXPECT_EQ(torn, 0);
}

TEST_F(ComponentFixture, TextsComeFromTheCatalogueOrAreExactlyTheDefault)
{
    TempDir dir;
    m_text->setText(L"4531"_w, L"Nom"_w);
    EXPECT_FALSE(m_text->loadCatalogue(wide(dir.file("missing.xml"))));
    EXPECT_EQ(utf8(m_text->getText(4531, L""_w)), "Nom") << "an unreadable catalogue keeps the texts there";
    TempDir::write(dir.file("texts.xml"),
                   "<BSet><String key=\"969\">Ajouter</String><String key=\"BRAND_A\">Marque \u00e9"
                   "</String><Int key=\"985\">12</Int></BSet>");
    LogCapture log;
    ASSERT_TRUE(m_text->loadCatalogue(wide(dir.file("texts.xml"))));
    EXPECT_TRUE(log.containsSubstring("'985'", TesselLog_Static::eERROR)) << "a value that is not a text";
    // The catalogue replaced the texts there; the default comes back exactly.
    EXPECT_EQ(utf8(m_text->getText(969, L""_w)) + "|" + utf8(m_text->getText(L"BRAND_A"_w, L""_w)) + "|" +
                  utf8(m_text->getText(985, L" d "_w)) + "|" + utf8(m_text->getText(4531, L""_w)) + "|" +
                  utf8(m_text->getText(L"brand_a"_w, L"d"_w)),
              "Ajouter|Marque \u00e9| d ||d");

    // A number names the text of its decimal form, sign and all.
    for (const int number : {0, 7, -42, 2147483647, -2147483647 - 1})
    {
        m_text->setText(wide(std::to_string(number)), wide("n" + std::to_string(number)));
        EXPECT_EQ(utf8(m_text->getText(number, L"d"_w)), "n" + std::to_string(number));
    }

    SmartProxy<PBText> proxy; // the proxy answers the default once the component is gone
    ASSERT_TRUE(proxy.acquire(ID(CBText::componentID)));
    EXPECT_EQ(utf8(proxy->getText(969, L"d"_w)) + utf8(proxy->getText(L"969"_w, L"d"_w)), "AjouterAjouter");
    ASSERT_EQ(destroyText(), 0);
    EXPECT_EQ(utf8(proxy->getText(969, L"Add"_w)) + utf8(proxy->getText(L"969"_w, L""_w)), "Add");
}
}
