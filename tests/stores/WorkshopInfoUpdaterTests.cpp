#include "WorkshopInfoUpdater.h"

#include "BString.h"
#include "ComponentFixture.h"
#include "StoreTestSupport.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <functional>
#include <memory>
#include <string>

using namespace StoreTest;

namespace
{
const int kWarning = TesselLog_Static::eWARNING;
const int kError = TesselLog_Static::eERROR;

std::string flag(bool value)
{
    return value ? "true" : "false";
}

class WorkshopInfoUpdaterTest : public ::testing::Test
{
protected:
    std::string path() const { return m_dir.file("Data/User/InformationsGarage.xml"); }
    void writeFile(const std::string& children) { TempDir::write(path(), document(children)); }

    TempDir m_dir;
    LogCapture m_log;
};

// ---- not loaded (malformed file) ----

struct NotLoadedCase
{
    const char* name;
    std::function<std::string(WorkshopInfoUpdater&)> call;
    std::string result;
};

void PrintTo(const NotLoadedCase& c, std::ostream* os)
{
    *os << c.name;
}

class WorkshopInfoUpdaterNotLoaded : public WorkshopInfoUpdaterTest,
                                     public ::testing::WithParamInterface<NotLoadedCase>
{
};

TEST_P(WorkshopInfoUpdaterNotLoaded, RefusesWithItsErrorAndLeavesTheFile)
{
    const std::string malformed = "<BSet><String key=\"nom\">Garage</String>";
    TempDir::write(path(), malformed);
    WorkshopInfoUpdater store(w(path()));
    EXPECT_FALSE(store.load());
    ASSERT_FALSE(store.isLoaded());
    m_log.clear();

    const NotLoadedCase& c = GetParam();
    EXPECT_EQ(c.call(store), c.result);
    const auto records = m_log.records();
    ASSERT_EQ(records.size(), 1u);
    EXPECT_EQ(records[0].level, kError);
    EXPECT_EQ(records[0].code, -1);
    EXPECT_EQ(records[0].className, "WorkshopInfoUpdater");
    EXPECT_EQ(u(records[0].message), "WorkshopInfoUpdater::" + std::string(c.name) + ": not loaded");

    EXPECT_FALSE(store.save());
    EXPECT_EQ(TempDir::read(path()), malformed);
}

#define TEXT_CASES(Get, Set)                                                                        \
    NotLoadedCase{#Get, [](WorkshopInfoUpdater& s) { return u(s.Get()); }, ""},                     \
        NotLoadedCase                                                                               \
    {                                                                                               \
        #Set, [](WorkshopInfoUpdater& s) { return flag(s.Set(w("x"))); }, "false"                   \
    }

const NotLoadedCase kNotLoadedCases[] = {
    TEXT_CASES(getBusinessNumber, setBusinessNumber),
    TEXT_CASES(getCorporateName, setCorporateName),
    TEXT_CASES(getName, setName),
    TEXT_CASES(getRoad, setRoad),
    TEXT_CASES(getTown, setTown),
    TEXT_CASES(getPostalCode, setPostalCode),
    TEXT_CASES(getTelephone, setTelephone),
    TEXT_CASES(getFax, setFax),
    TEXT_CASES(getDefaultBrand, setDefaultBrand),
    {"getNewDocuviaMode", [](WorkshopInfoUpdater& s) { return flag(s.getNewDocuviaMode()); }, "false"},
    {"setNewDocuviaMode", [](WorkshopInfoUpdater& s) { return flag(s.setNewDocuviaMode(true)); }, "false"},
    {"getMarvaneIDPInfos",
     [](WorkshopInfoUpdater& s) {
         BSet infos(10);
         return flag(s.getMarvaneIDPInfos(infos));
     },
     "false"},
    {"setMarvaneIDPInfos", [](WorkshopInfoUpdater& s) { return flag(s.setMarvaneIDPInfos(BSet(10))); }, "false"},
    {"save", [](WorkshopInfoUpdater& s) { return flag(s.save()); }, "false"},
};

INSTANTIATE_TEST_SUITE_P(Operations, WorkshopInfoUpdaterNotLoaded, ::testing::ValuesIn(kNotLoadedCases),
                         [](const auto& info) { return std::string(info.param.name); });

// ---- missing file ----

TEST_F(WorkshopInfoUpdaterTest, MissingFileGivesEmptyLoadedStoreThatSaveCreates)
{
    WorkshopInfoUpdater store(w(path()));
    EXPECT_FALSE(store.load());
    EXPECT_TRUE(store.isLoaded());
    EXPECT_TRUE(m_log.contains("WorkshopInfoUpdater::load: file '" + path() +
                                   "' does not exist, setting state to empty BSet",
                               kWarning));
    EXPECT_EQ(u(store.getName()), "");
    EXPECT_EQ(u(store.getFax()), "");
    EXPECT_FALSE(store.getNewDocuviaMode());
    EXPECT_TRUE(store.setName(w("Garage Żółć")));
    EXPECT_TRUE(store.setNewDocuviaMode(true));
    EXPECT_FALSE(std::filesystem::exists(m_dir.path() / "Data"));

    ASSERT_TRUE(store.save());
    const BSet saved = readBack(path());
    EXPECT_EQ(stringAt(saved, "nom"), "Garage Żółć");
    bool mode = false;
    EXPECT_EQ(saved.getBool(w("new_docuvia_mode"), mode), 0);
    EXPECT_TRUE(mode);
    EXPECT_EQ(saved.size(), 2);
}

TEST_F(WorkshopInfoUpdaterTest, FolderAtTheFilePathIsHandledAsMissingFile)
{
    std::filesystem::create_directories(path());
    WorkshopInfoUpdater store(w(path()));
    EXPECT_FALSE(store.load());
    EXPECT_TRUE(store.isLoaded());
    EXPECT_TRUE(m_log.containsSubstring("does not exist, setting state to empty BSet", kWarning));
    EXPECT_TRUE(store.setTown(w("Lyon")));
    EXPECT_EQ(u(store.getTown()), "Lyon");
}

TEST_F(WorkshopInfoUpdaterTest, FileInTheWayOfTheFolderMakesSaveRefuseUntilRemoved)
{
    TempDir::write(m_dir.file("Data"), "not a folder");
    WorkshopInfoUpdater store(w(path()));
    store.load();
    ASSERT_TRUE(store.setName(w("Garage")));
    EXPECT_FALSE(store.save());
    EXPECT_TRUE(m_log.contains("WorkshopInfoUpdater::save: could not create parent folder for file '" + path() + "'",
                               kWarning));
    EXPECT_TRUE(store.isLoaded());

    std::filesystem::remove(m_dir.file("Data"));
    ASSERT_TRUE(store.save());
    EXPECT_EQ(stringAt(readBack(path()), "nom"), "Garage");
}

TEST_F(WorkshopInfoUpdaterTest, BareFileNameIsNotSaved)
{
    WorkshopInfoUpdater store(w("InformationsGarage-never-written.xml"));
    store.load();
    EXPECT_FALSE(store.save());
    EXPECT_FALSE(std::filesystem::exists("InformationsGarage-never-written.xml"));
}

// ---- loaded ----

struct FieldCase
{
    const char* key;
    std::function<ACE_WString(WorkshopInfoUpdater&)> get;
    std::function<bool(WorkshopInfoUpdater&, const ACE_WString&)> set;
};

void PrintTo(const FieldCase& c, std::ostream* os)
{
    *os << c.key;
}

class WorkshopInfoUpdaterFields : public WorkshopInfoUpdaterTest, public ::testing::WithParamInterface<FieldCase>
{
};

TEST_P(WorkshopInfoUpdaterFields, ReadsAndWritesItsOwnKey)
{
    const FieldCase& c = GetParam();
    writeFile(str(c.key, "from file ü") + str("other", "o"));
    WorkshopInfoUpdater store(w(path()));
    ASSERT_TRUE(store.load());
    EXPECT_EQ(u(c.get(store)), "from file ü");
    EXPECT_TRUE(c.set(store, w("changed 漢字")));
    ASSERT_TRUE(store.save());
    const BSet saved = readBack(path());
    EXPECT_EQ(stringAt(saved, c.key), "changed 漢字");
    EXPECT_EQ(stringAt(saved, "other"), "o");
    EXPECT_EQ(saved.size(), 2);
    EXPECT_TRUE(m_log.messages(kError).empty());
}

#define FIELD(key, Get, Set)                                                                       \
    FieldCase                                                                                      \
    {                                                                                              \
        key, [](WorkshopInfoUpdater& s) { return s.Get(); },                                       \
            [](WorkshopInfoUpdater& s, const ACE_WString& v) { return s.Set(v); }                  \
    }

INSTANTIATE_TEST_SUITE_P(Keys, WorkshopInfoUpdaterFields,
                         ::testing::Values(FIELD("numero_affaire", getBusinessNumber, setBusinessNumber),
                                           FIELD("raison_sociale", getCorporateName, setCorporateName),
                                           FIELD("nom", getName, setName), FIELD("rue", getRoad, setRoad),
                                           FIELD("ville", getTown, setTown),
                                           FIELD("codepostal", getPostalCode, setPostalCode),
                                           FIELD("telephone", getTelephone, setTelephone),
                                           FIELD("telecopie", getFax, setFax)),
                         [](const auto& info) { return std::string(info.param.key); });

TEST_F(WorkshopInfoUpdaterTest, SecondLoadKeepsEdits)
{
    writeFile(str("nom", "Avant"));
    WorkshopInfoUpdater store(w(path()));
    ASSERT_TRUE(store.load());
    store.setName(w("Après"));
    EXPECT_TRUE(store.load());
    EXPECT_TRUE(m_log.contains("WorkshopInfoUpdater::load: file already loaded", kWarning));
    EXPECT_EQ(u(store.getName()), "Après");
}

TEST_F(WorkshopInfoUpdaterTest, IdentityProviderInfosRoundTrip)
{
    writeFile(typed("Bool", "new_docuvia_mode", "true"));
    WorkshopInfoUpdater store(w(path()));
    ASSERT_TRUE(store.load());
    EXPECT_TRUE(store.getNewDocuviaMode());

    BSet infos(10);
    EXPECT_FALSE(store.getMarvaneIDPInfos(infos));
    EXPECT_TRUE(m_log.contains("WorkshopInfoUpdater::getMarvaneIDPInfosm_BSet.get('IDP_Infos') failed with error '" +
                                   std::to_string(BSet::eNO_SUCH_KEY) + "')",
                               kError));

    BSet given(10);
    given.setString(w("issuer"), w("https://idp.example"));
    given.setInt(w("ttl"), 3600);
    EXPECT_TRUE(store.setMarvaneIDPInfos(given));
    ASSERT_TRUE(store.save());

    WorkshopInfoUpdater reread(w(path()));
    ASSERT_TRUE(reread.load());
    BSet back(10);
    ASSERT_TRUE(reread.getMarvaneIDPInfos(back));
    EXPECT_TRUE(back.equals(given));
}

TEST_F(WorkshopInfoUpdaterTest, IdentityProviderInfosOfWrongTypeIsAnError)
{
    writeFile(str("IDP_Infos", "not a set"));
    WorkshopInfoUpdater store(w(path()));
    ASSERT_TRUE(store.load());
    BSet infos(10);
    EXPECT_FALSE(store.getMarvaneIDPInfos(infos));
    EXPECT_TRUE(m_log.containsSubstring("failed with error '" + std::to_string(BSet::eWRONG_TYPE) + "')", kError));
}

TEST_F(WorkshopInfoUpdaterTest, CopiesAreIndependent)
{
    writeFile(str("nom", "A"));
    WorkshopInfoUpdater store(w(path()));
    ASSERT_TRUE(store.load());
    WorkshopInfoUpdater copy(store);
    copy.setName(w("B"));
    EXPECT_EQ(u(store.getName()), "A");
    WorkshopInfoUpdater assigned(w(m_dir.file("x.xml")));
    assigned = copy;
    EXPECT_TRUE(assigned.isLoaded());
    EXPECT_EQ(u(assigned.getName()), "B");
}

// ---- brands ----

const wchar_t* const kBrandsUri = L"data:/Configuration/DoC/Config_Accueil/Brands";

class WorkshopBrandTest : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        TempDir::write(m_path, document(""));
        m_store = std::make_unique<WorkshopInfoUpdater>(w(m_path));
        ASSERT_TRUE(m_store->load());
    }
    void TearDown() override
    {
        m_store.reset();
        ComponentFixture::TearDown();
    }
    // Brands 10 and 20 have texts; 30 has none; "0" and "abc" are keys that are no numbers.
    void publishBrands()
    {
        BSet brands(10);
        brands.setString(w("10"), w("Alpha"));
        brands.setString(w("20"), w("Beta"));
        brands.setString(w("30"), w("Gamma"));
        brands.setString(w("0"), w("Zero"));
        brands.setString(w("abc"), w("Letters"));
        ASSERT_EQ(m_dataManager->createData(ID(kBrandsUri), brands), 0);
        m_text->setText(w("10"), w("Alpha Motors"));
        m_text->setText(w("20"), w("Beta Automobiles"));
        m_text->setText(w("0"), w("Zero Text"));
    }
    // A store loaded from a file whose "default_brand" is `key`.
    void writeBrand(const std::string& key)
    {
        TempDir::write(m_path, document(str("default_brand", key)));
        m_store = std::make_unique<WorkshopInfoUpdater>(w(m_path));
        ASSERT_TRUE(m_store->load());
    }
    std::string storedBrand()
    {
        EXPECT_TRUE(m_store->save());
        return stringAt(readBack(m_path), "default_brand");
    }

    TempDir m_dir;
    std::string m_path = m_dir.file("InformationsGarage.xml");
    std::unique_ptr<WorkshopInfoUpdater> m_store;
};

struct SetBrandCase
{
    const char* shown;
    bool matched;
    const char* stored;
};

void PrintTo(const SetBrandCase& c, std::ostream* os)
{
    *os << '"' << c.shown << '"';
}

class WorkshopSetBrand : public WorkshopBrandTest, public ::testing::WithParamInterface<SetBrandCase>
{
};

TEST_P(WorkshopSetBrand, StoresTheKeyOfTheShownName)
{
    publishBrands();
    const SetBrandCase& c = GetParam();
    EXPECT_EQ(m_store->setDefaultBrand(w(c.shown)), c.matched) << c.shown;
    EXPECT_EQ(storedBrand(), c.stored) << c.shown;
}

INSTANTIATE_TEST_SUITE_P(Names, WorkshopSetBrand,
                         ::testing::Values(SetBrandCase{"Beta Automobiles", true, "20"},
                                           SetBrandCase{"Alpha Motors", true, "10"},
                                           // Untranslated brand: matched under its default name.
                                           SetBrandCase{"Gamma", true, "30"},
                                           // A translated brand is not matched by its default name.
                                           SetBrandCase{"Beta", false, "10"},
                                           SetBrandCase{"beta automobiles", false, "10"},
                                           SetBrandCase{"", false, "10"}));

struct GetBrandCase
{
    const char* stored;
    const char* shown;
};

void PrintTo(const GetBrandCase& c, std::ostream* os)
{
    *os << '"' << c.stored << '"';
}

class WorkshopGetBrand : public WorkshopBrandTest, public ::testing::WithParamInterface<GetBrandCase>
{
};

TEST_P(WorkshopGetBrand, ShowsTheTextOfTheStoredKey)
{
    publishBrands();
    const GetBrandCase& c = GetParam();
    writeBrand(c.stored);
    EXPECT_EQ(u(m_store->getDefaultBrand()), c.shown) << c.stored;
}

INSTANTIATE_TEST_SUITE_P(Keys, WorkshopGetBrand,
                         ::testing::Values(GetBrandCase{"20", "Beta Automobiles"}, GetBrandCase{"10", "Alpha Motors"},
                                           // No text: the empty default, not the table's name.
                                           GetBrandCase{"30", ""}, GetBrandCase{"99", ""},
                                           GetBrandCase{"0", ""}, GetBrandCase{"abc", ""},
                                           GetBrandCase{"20 ", ""}, GetBrandCase{"", ""}));

TEST_F(WorkshopBrandTest, EmptyTableStoresEmptyKey)
{
    ASSERT_TRUE(m_store->setBusinessNumber(w("B-1")));
    EXPECT_FALSE(m_store->setDefaultBrand(w("Alpha Motors")));
    EXPECT_EQ(storedBrand(), "");
    EXPECT_TRUE(readBack(m_path).contains(w("default_brand")));
}

TEST_F(WorkshopBrandTest, WithoutTextComponentNothingIsWritten)
{
    publishBrands();
    ASSERT_TRUE(m_store->setDefaultBrand(w("Beta Automobiles")));
    destroyText();
    EXPECT_FALSE(m_store->setDefaultBrand(w("Alpha Motors")));
    EXPECT_EQ(u(m_store->getDefaultBrand()), "");
    EXPECT_EQ(storedBrand(), "20");
}

TEST_F(WorkshopBrandTest, WithoutDataManagerNothingIsWritten)
{
    publishBrands();
    ASSERT_TRUE(m_store->setDefaultBrand(w("Beta Automobiles")));
    destroyDataManager();
    EXPECT_FALSE(m_store->setDefaultBrand(w("Alpha Motors")));
    EXPECT_EQ(u(m_store->getDefaultBrand()), "");
    EXPECT_EQ(storedBrand(), "20");
}
}
