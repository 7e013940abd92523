#include "UpdateUpdater.h"
#include "UsersUpdater.h"
#include "WorkshopInfoUpdater.h"

#include "ComponentFixture.h"
#include "StoreTestSupport.h"
#include "Uris.h"

#include <filesystem>
#include <functional>
#include <tuple>

using namespace StoreTest;

namespace
{
using WorkshopInfoUpdaterTest = StoreFixture<WorkshopInfoUpdater>;
using Getter = const ACE_WString (WorkshopInfoUpdater::*)();
using Setter = bool (WorkshopInfoUpdater::*)(const ACE_WString&);

// Key, method name without "get" or "set", getter, setter.
const std::tuple<const char*, const char*, Getter, Setter> kFields[] = {
    {"numero_affaire", "BusinessNumber", &WorkshopInfoUpdater::getBusinessNumber,
     &WorkshopInfoUpdater::setBusinessNumber},
    {"raison_sociale", "CorporateName", &WorkshopInfoUpdater::getCorporateName, &WorkshopInfoUpdater::setCorporateName},
    {"nom", "Name", &WorkshopInfoUpdater::getName, &WorkshopInfoUpdater::setName},
    {"rue", "Road", &WorkshopInfoUpdater::getRoad, &WorkshopInfoUpdater::setRoad},
    {"ville", "Town", &WorkshopInfoUpdater::getTown, &WorkshopInfoUpdater::setTown},
    {"codepostal", "PostalCode", &WorkshopInfoUpdater::getPostalCode, &WorkshopInfoUpdater::setPostalCode},
    {"telephone", "Telephone", &WorkshopInfoUpdater::getTelephone, &WorkshopInfoUpdater::setTelephone},
    {"telecopie", "Fax", &WorkshopInfoUpdater::getFax, &WorkshopInfoUpdater::setFax},
    {"default_brand", "DefaultBrand", &WorkshopInfoUpdater::getDefaultBrand, &WorkshopInfoUpdater::setDefaultBrand},
};

// On a file that does not parse, every call of the three stores is refused with its safe answer,
// logs one "not loaded" line, and nothing is written.
TEST(NotLoadedStores, RefuseEveryCallAndKeepTheFile)
{
    TempDir dir;
    LogCapture log;
    const std::string path = dir.file("settings.xml"), malformed = "<BSet><String key=\"nom\">A2A</String>";
    TempDir::write(path, malformed);
    UpdateUpdater u(wide(path));
    UsersUpdater s(wide(path));
    WorkshopInfoUpdater w(wide(path));
    EXPECT_FALSE(u.load() || s.load() || w.load() || w.isLoaded() || s.isLoaded());
    BSet infos(10);
    const auto none = [](const ACE_WString& text) { return text.length() == 0; };
#define R(expression) [&] { return expression; }
    std::vector<std::function<bool()>> calls = {R(u.getCheckInternet()),
                                                R(!u.setCheckInternet(true)),
                                                R(none(u.getDeploymentMode())),
                                                R(!u.setDeploymentMode(L"x"_w)),
                                                R(none(u.getDistributionFolderPath())),
                                                R(!u.setDistributionFolderPath(L"x"_w)),
                                                R(none(u.getLocalDistributionFolderPath())),
                                                R(!u.setLocalDistributionFolderPath(L"x"_w)),
                                                R(none(u.getTaskTime())),
                                                R(!u.setTaskTime(L"x"_w)),
                                                R(none(u.getUpdateRetrievalTime())),
                                                R(none(u.getFeedbackFolderPath())),
                                                R(u.getErrorCounter() == 0),
                                                R(u.getMaxLogsNumber() == 0),
                                                R(!u.getLogDebug()),
                                                R(!u.save(wide(path))),
                                                R(!s.save()),
                                                R(s.getUserCount() == 0),
                                                R(none(s.getUserName(25))),
                                                R(none(s.getUserAddress(0))),
                                                R(none(s.getUserPhone(0))),
                                                R(!s.addUser(L""_w, L"a"_w, L"p"_w)),
                                                R(!s.removeAllUsers()),
                                                R(!s.doesUserExist(L""_w)),
                                                R(!s.isActivated()),
                                                R(!s.activate(true)),
                                                R(!s.setApp2AppParams(L"1"_w, L"2"_w, L"3"_w)),
                                                R(none(s.getApp2AppPort())),
                                                R(none(s.getApp2AppIP())),
                                                R(none(s.getApp2AppDealerID())),
                                                R(s.getApp2AppNumRetries() == -1),
                                                R(s.getApp2AppTimeout() == -1.0),
                                                R(!w.getNewDocuviaMode()),
                                                R(!w.setNewDocuviaMode(true)),
                                                R(!w.getMarvaneIDPInfos(infos)),
                                                R(!w.setMarvaneIDPInfos(infos)),
                                                R(!w.save())};
#undef R
    for (const auto& field : kFields)
        calls.insert(calls.end(), {[&, get = std::get<2>(field)] { return none((w.*get)()); },
                                   [&, set = std::get<3>(field)] { return !(w.*set)(L"x"_w); }});
    for (size_t i = 0; i < calls.size(); ++i)
    {
        log.clear();
        EXPECT_TRUE(calls[i]() && log.messages(kWarning).size() + log.messages(kError).size() == 1 &&
                    log.containsSubstring("not loaded"))
            << i;
    }
    EXPECT_TRUE(s.getMaxUserCount() == 20u && s.getApp2AppReqAttrs().isEmpty()); // no App2App defaults either
    EXPECT_EQ(TempDir::read(path), malformed);
}

// A missing file, or a folder in its place, gives an empty loaded store; save makes the folder,
// and refuses while a file is in its way.
TEST_F(WorkshopInfoUpdaterTest, MissingFileGivesEmptyLoadedStoreThatSaveCreates)
{
    std::filesystem::create_directories(path());
    WorkshopInfoUpdater onFolder(wide(path()));
    EXPECT_FALSE(onFolder.load());
    EXPECT_TRUE(onFolder.isLoaded() &&
                m_log.containsSubstring("does not exist, setting state to empty BSet", kWarning));
    std::filesystem::remove_all(m_dir.file("Data"));
    WorkshopInfoUpdater store(wide(path()));
    EXPECT_FALSE(store.load());
    EXPECT_TRUE(store.isLoaded());
    BSet infos(10);
    EXPECT_FALSE(store.getNewDocuviaMode() || store.getMarvaneIDPInfos(infos)); // error 1: no such key
    EXPECT_TRUE(m_log.contains("WorkshopInfoUpdater::getMarvaneIDPInfosm_BSet.get('IDP_Infos') failed with error '1')",
                               kError));
    EXPECT_TRUE(store.setName(wide("Garage Żółć")) && store.setNewDocuviaMode(true));
    TempDir::write(m_dir.file("Data"), "not a folder");
    EXPECT_FALSE(store.save());
    EXPECT_TRUE(m_log.contains("WorkshopInfoUpdater::save: could not create parent folder for file '" + path() + "'",
                               kWarning));
    std::filesystem::remove(m_dir.file("Data"));
    ASSERT_TRUE(store.save());
    bool mode = false;
    const BSet saved = SettingsFiles::read(path());
    EXPECT_TRUE(SettingsFiles::stringAt(saved, "nom") == "Garage Żółć" &&
                saved.getBool(L"new_docuvia_mode"_w, mode) == 0 && mode && saved.size() == 2);
}

// Each text field reads and writes its own key; the identity provider's infos must be a set.
TEST_F(WorkshopInfoUpdaterTest, FieldsRoundTripAndASecondLoadKeepsEdits)
{
    std::string file = typed("Bool", "new_docuvia_mode", "true") + str("IDP_Infos", "not a set");
    for (const auto& [key, name, get, set] : kFields)
        file += str(key, key);
    WorkshopInfoUpdater& store = loaded(file);
    EXPECT_TRUE(store.getNewDocuviaMode());
    BSet infos(10), given(10);
    EXPECT_FALSE(store.getMarvaneIDPInfos(infos));
    EXPECT_TRUE(m_log.containsSubstring("get('IDP_Infos') failed with error '2')", kError)); // wrong type
    for (const auto& [key, name, get, set] : kFields) // a brand is looked up, see below
        EXPECT_TRUE(std::string(key) == "default_brand" ||
                    (utf8((store.*get)()) == key && (store.*set)(wide(std::string(name) + " 漢字"))))
            << key;
    given.setInt(L"ttl"_w, 3600);
    EXPECT_TRUE(store.setMarvaneIDPInfos(given));
    EXPECT_TRUE(store.load()); // a second load keeps the edits
    EXPECT_TRUE(m_log.contains("WorkshopInfoUpdater::load: file already loaded", kWarning));
    ASSERT_TRUE(store.save());
    ASSERT_TRUE(reread().getMarvaneIDPInfos(infos));
    EXPECT_TRUE(infos.equals(given));
    const BSet saved = SettingsFiles::read(path());
    for (const auto& [key, name, get, set] : kFields)
        EXPECT_EQ(SettingsFiles::stringAt(saved, key),
                  std::string(key) == "default_brand" ? key : std::string(name) + " 漢字");
}

// The file keeps a brand's key; the dialog shows and picks its text from the text component.
// Brands 10 and 20 have texts; 30 has none; "0" and "abc" are keys that are no numbers.
class WorkshopBrandTest : public StoreFixture<WorkshopInfoUpdater, ComponentFixture>
{
protected:
    void publishBrands()
    {
        BSet brands(10);
        for (const char* key : {"10", "20", "30", "0", "abc"})
            brands.setString(wide(key), wide(std::string("name ") + key));
        ASSERT_EQ(m_dataManager->createData(ID(Uri::kBrands), brands), 0);
        m_text->setText(L"10"_w, L"Alpha Motors"_w);
        m_text->setText(L"20"_w, L"Beta Automobiles"_w);
        m_text->setText(L"0"_w, L"Zero Text"_w);
    }
    std::string storedBrand()
    {
        EXPECT_TRUE(m_store->save());
        return SettingsFiles::stringAt(SettingsFiles::read(path()), "default_brand");
    }
};

// An untranslated brand matches under its table name, a translated one does not; with no table
// the key stored is empty.
TEST_F(WorkshopBrandTest, SetStoresTheKeyOfTheShownNameOrTheFirstKeyAndGetShowsItsText)
{
    EXPECT_FALSE(loaded("").setDefaultBrand(L"Alpha Motors"_w));
    EXPECT_EQ(storedBrand(), "");
    publishBrands();
    for (const auto& [shown, matched, stored] : {std::tuple("Beta Automobiles", true, "20"),
                                                 std::tuple("name 30", true, "30"), std::tuple("name 20", false, "10")})
    {
        EXPECT_EQ(loaded("").setDefaultBrand(wide(shown)), matched) << shown;
        EXPECT_EQ(storedBrand(), stored) << shown;
    }
    for (const auto& [stored, shown] : {std::pair("20", "Beta Automobiles"), std::pair("30", ""), std::pair("99", ""),
                                        std::pair("0", ""), std::pair("abc", ""), std::pair("", "")})
        EXPECT_EQ(utf8(loaded(str("default_brand", stored)).getDefaultBrand()), shown) << stored;
}

// Both components are needed: with one of them gone nothing is looked up or written.
TEST_F(WorkshopBrandTest, WithoutTextComponentOrDataManagerNothingIsWritten)
{
    publishBrands();
    loaded("");
    ASSERT_TRUE(m_store->setDefaultBrand(L"Beta Automobiles"_w));
    destroyText();
    EXPECT_FALSE(m_store->setDefaultBrand(L"Alpha Motors"_w) || m_store->getDefaultBrand().length() != 0);
    m_text = CBText::registerWith(*m_manager);
    m_text->setText(L"10"_w, L"Alpha Motors"_w);
    destroyDataManager();
    EXPECT_FALSE(m_store->setDefaultBrand(L"Alpha Motors"_w) || m_store->getDefaultBrand().length() != 0);
    EXPECT_EQ(storedBrand(), "20");
}
}
