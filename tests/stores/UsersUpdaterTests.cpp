#include "UsersUpdater.h"

#include "StoreTestSupport.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <vector>

using namespace StoreTest;

namespace
{
const int kTrace = TesselLog_Static::eTRACE;
const int kWarning = TesselLog_Static::eWARNING;
const std::string kAddUser = "[bool UsersUpdater::addUser(const ACE_WString&, const ACE_WString&, const ACE_WString&)]";

std::string slot(int number, const std::string& name, const std::string& address = "addr",
                 const std::string& phone = "tel")
{
    return set("user" + std::to_string(number), str("name", name) + str("address", address) + str("telephone", phone));
}

std::string flag(bool value)
{
    return value ? "true" : "false";
}

class UsersUpdaterTest : public ::testing::Test
{
protected:
    std::string path() const { return m_dir.file("FicheDiagParams.xml"); }
    void writeFile(const std::string& children) { TempDir::write(path(), document(children)); }
    // A store loaded from a file holding `children`.
    UsersUpdater& loaded(const std::string& children)
    {
        writeFile(children);
        m_store = std::make_unique<UsersUpdater>(w(path()));
        EXPECT_TRUE(m_store->load());
        return *m_store;
    }

    TempDir m_dir;
    LogCapture m_log;
    std::unique_ptr<UsersUpdater> m_store;
};

// ---- not loaded ----

struct NotLoadedCase
{
    const char* name;
    std::function<std::string(UsersUpdater&)> call;
    std::string result;
    std::string prefix;
};

void PrintTo(const NotLoadedCase& c, std::ostream* os)
{
    *os << c.name;
}

class UsersUpdaterNotLoaded : public UsersUpdaterTest, public ::testing::WithParamInterface<NotLoadedCase>
{
};

TEST_P(UsersUpdaterNotLoaded, RefusesWithItsResultAndWarning)
{
    UsersUpdater store(w(path()));
    ASSERT_FALSE(store.load());
    m_log.clear();
    const NotLoadedCase& c = GetParam();
    EXPECT_EQ(c.call(store), c.result);
    EXPECT_TRUE(m_log.contains(c.prefix + ": Method started.", kTrace));
    EXPECT_TRUE(m_log.contains(c.prefix + ": File not loaded", kWarning));
    // Only the not-loaded warning: the argument checks come after the loaded test.
    EXPECT_EQ(m_log.messages(kWarning).size(), 1u);
}

const NotLoadedCase kNotLoadedCases[] = {
    {"save", [](UsersUpdater& s) { return flag(s.save()); }, "false", "[bool UsersUpdater::save()]"},
    {"getUserCount", [](UsersUpdater& s) { return std::to_string(s.getUserCount()); }, "0",
     "[unsigned int UsersUpdater::getUserCount()]"},
    {"getUserName", [](UsersUpdater& s) { return u(s.getUserName(25)); }, "",
     "[const ACE_WString UsersUpdater::getUserName(unsigned int)]"},
    {"getUserAddress", [](UsersUpdater& s) { return u(s.getUserAddress(0)); }, "",
     "[const ACE_WString UsersUpdater::getUserAddress(unsigned int)]"},
    {"getUserPhone", [](UsersUpdater& s) { return u(s.getUserPhone(0)); }, "",
     "[const ACE_WString UsersUpdater::getUserPhone(unsigned int)]"},
    {"addUser", [](UsersUpdater& s) { return flag(s.addUser(w(""), w("a"), w("p"))); }, "false", kAddUser},
    {"removeAllUsers", [](UsersUpdater& s) { return flag(s.removeAllUsers()); }, "false",
     "[bool UsersUpdater::removeAllUsers()]"},
    {"doesUserExist", [](UsersUpdater& s) { return flag(s.doesUserExist(w(""))); }, "false",
     "[bool UsersUpdater::doesUserExist(const ACE_WString&)]"},
    {"isActivated", [](UsersUpdater& s) { return flag(s.isActivated()); }, "false",
     "[bool UsersUpdater::isActivated()]"},
    {"activate", [](UsersUpdater& s) { return flag(s.activate(true)); }, "false", "[bool UsersUpdater::activate(bool)]"},
    {"setApp2AppParams", [](UsersUpdater& s) { return flag(s.setApp2AppParams(w("1"), w("2"), w("3"))); }, "false",
     "[bool UsersUpdater::setApp2AppParams(const ACE_WString&, const ACE_WString&, const ACE_WString&)]"},
    {"getApp2AppPort", [](UsersUpdater& s) { return u(s.getApp2AppPort()); }, "",
     "[const ACE_WString UsersUpdater::getApp2AppPort()]"},
    {"getApp2AppIP", [](UsersUpdater& s) { return u(s.getApp2AppIP()); }, "",
     "[const ACE_WString UsersUpdater::getApp2AppIP()]"},
    {"getApp2AppDealerID", [](UsersUpdater& s) { return u(s.getApp2AppDealerID()); }, "",
     "[const ACE_WString UsersUpdater::getApp2AppDealerID()]"},
    {"getApp2AppNumRetries", [](UsersUpdater& s) { return std::to_string(s.getApp2AppNumRetries()); }, "-1",
     "[long UsersUpdater::getApp2AppNumRetries()]"},
    {"getApp2AppTimeout", [](UsersUpdater& s) { return std::to_string(s.getApp2AppTimeout()); }, std::to_string(-1.0),
     "[double UsersUpdater::getApp2AppTimeout()]"},
};

INSTANTIATE_TEST_SUITE_P(Operations, UsersUpdaterNotLoaded, ::testing::ValuesIn(kNotLoadedCases),
                         [](const auto& info) { return std::string(info.param.name); });

TEST_F(UsersUpdaterTest, NotLoadedStoreStillAnswersCapacityAndRequestAttributes)
{
    UsersUpdater store(w(path()));
    EXPECT_FALSE(store.load());
    EXPECT_FALSE(store.isLoaded());
    m_log.clear();
    EXPECT_EQ(store.getMaxUserCount(), 20u);
    EXPECT_TRUE(store.getApp2AppReqAttrs().isEmpty());
    EXPECT_TRUE(m_log.contains("[BSet UsersUpdater::getApp2AppReqAttrs()]: Method started.", kTrace));
    EXPECT_TRUE(m_log.messages(kWarning).empty());
}

TEST_F(UsersUpdaterTest, MalformedFileGetsNoApp2AppDefaults)
{
    TempDir::write(path(), "<BSet><Set key=\"users\"></BSet>");
    UsersUpdater store(w(path()));
    EXPECT_FALSE(store.load());
    EXPECT_TRUE(store.getApp2AppReqAttrs().isEmpty());
}

// ---- App2App ----

TEST_F(UsersUpdaterTest, MissingApp2AppGetsDefaultsThatSaveWrites)
{
    UsersUpdater& store = loaded(str("activation", "1"));
    EXPECT_EQ(store.getApp2AppNumRetries(), 3);
    EXPECT_EQ(store.getApp2AppTimeout(), 3.0);
    const BSet attributes = store.getApp2AppReqAttrs();
    EXPECT_EQ(stringAt(attributes, "application"), "vexa");
    EXPECT_EQ(stringAt(attributes, "service"), "sfd");
    EXPECT_EQ(attributes.size(), 2);
    EXPECT_EQ(u(store.getApp2AppPort()), "");
    EXPECT_EQ(u(store.getApp2AppIP()), "");
    EXPECT_EQ(u(store.getApp2AppDealerID()), "");

    ASSERT_TRUE(store.save());
    BSet app2App(10);
    ASSERT_EQ(readBack(path()).getSet(w("App2App"), app2App), 0);
    long retries = 0;
    EXPECT_EQ(app2App.getInt(w("NumRetries"), retries), 0);
    EXPECT_EQ(retries, 3);
    EXPECT_FALSE(app2App.contains(w("Port")));
}

TEST_F(UsersUpdaterTest, ExistingApp2AppIsLeftAsItIs)
{
    UsersUpdater& store = loaded(set("App2App", str("Port", "8080") + set("RequestAttributes", str("dealerId", "D42"))));
    EXPECT_EQ(store.getApp2AppNumRetries(), -1);
    EXPECT_EQ(store.getApp2AppTimeout(), -1.0);
    EXPECT_EQ(u(store.getApp2AppPort()), "8080");
    EXPECT_EQ(u(store.getApp2AppDealerID()), "D42");
    EXPECT_FALSE(store.getApp2AppReqAttrs().contains(w("application")));
}

TEST_F(UsersUpdaterTest, SetApp2AppParamsKeepsTheOtherKeys)
{
    UsersUpdater& store = loaded("");
    EXPECT_TRUE(store.setApp2AppParams(w("9000"), w("10.1.2.3"), w("Händler-7")));
    EXPECT_EQ(u(store.getApp2AppPort()), "9000");
    EXPECT_EQ(u(store.getApp2AppIP()), "10.1.2.3");
    EXPECT_EQ(u(store.getApp2AppDealerID()), "Händler-7");
    EXPECT_EQ(store.getApp2AppNumRetries(), 3);
    EXPECT_EQ(stringAt(store.getApp2AppReqAttrs(), "application"), "vexa");
    ASSERT_TRUE(store.save());

    UsersUpdater reread(w(path()));
    ASSERT_TRUE(reread.load());
    EXPECT_EQ(u(reread.getApp2AppDealerID()), "Händler-7");
    EXPECT_EQ(reread.getApp2AppTimeout(), 3.0);
}

// ---- activation ----

struct ActivationCase
{
    const char* stored; // null: key missing
    bool expected;
};

void PrintTo(const ActivationCase& c, std::ostream* os)
{
    *os << (c.stored != nullptr ? "\"" + std::string(c.stored) + "\"" : "(missing)");
}

class UsersUpdaterActivation : public UsersUpdaterTest, public ::testing::WithParamInterface<ActivationCase>
{
};

TEST_P(UsersUpdaterActivation, ReadsTheLeadingInteger)
{
    const ActivationCase& c = GetParam();
    UsersUpdater& store = loaded(c.stored != nullptr ? str("activation", c.stored) : std::string());
    EXPECT_EQ(store.isActivated(), c.expected) << (c.stored != nullptr ? c.stored : "(missing)");
}

INSTANTIATE_TEST_SUITE_P(Values, UsersUpdaterActivation,
                         ::testing::Values(ActivationCase{"1", true}, ActivationCase{"0", false},
                                           ActivationCase{"", false}, ActivationCase{nullptr, false},
                                           ActivationCase{"yes", false}, ActivationCase{"12abc", true},
                                           ActivationCase{" 7", true}, ActivationCase{"-3", true},
                                           ActivationCase{"00", false}));

TEST_F(UsersUpdaterTest, ActivateWritesOneOrZero)
{
    UsersUpdater& store = loaded(str("activation", "yes"));
    EXPECT_TRUE(store.activate(true));
    EXPECT_TRUE(store.isActivated());
    ASSERT_TRUE(store.save());
    EXPECT_EQ(stringAt(readBack(path()), "activation"), "1");
    EXPECT_TRUE(store.activate(false));
    EXPECT_FALSE(store.isActivated());
    ASSERT_TRUE(store.save());
    EXPECT_EQ(stringAt(readBack(path()), "activation"), "0");
}

// ---- positional user list ----

struct UserListCase
{
    const char* name;
    std::vector<std::string> names; // slot n+1; "-" leaves the slot out
    unsigned int count;
};

void PrintTo(const UserListCase& c, std::ostream* os)
{
    *os << c.name;
}

class UsersUpdaterList : public UsersUpdaterTest, public ::testing::WithParamInterface<UserListCase>
{
};

TEST_P(UsersUpdaterList, CountsConsecutiveUsedSlotsAndAddsAfterThem)
{
    const UserListCase& c = GetParam();
    std::string slots;
    for (size_t i = 0; i < c.names.size(); ++i)
        if (c.names[i] != "-")
            slots += slot(static_cast<int>(i) + 1, c.names[i]);
    UsersUpdater& store = loaded(set("users", slots));
    EXPECT_EQ(store.getUserCount(), c.count);

    ASSERT_TRUE(store.addUser(w("Neu"), w("Rue 1"), w("0102")));
    EXPECT_EQ(u(store.getUserName(c.count)), "Neu");
    EXPECT_EQ(u(store.getUserAddress(c.count)), "Rue 1");
    EXPECT_EQ(u(store.getUserPhone(c.count)), "0102");
    // A used slot after the gap is neither counted nor overwritten.
    for (size_t i = c.count + 1; i < c.names.size(); ++i)
    {
        if (c.names[i] != "-")
        {
            EXPECT_EQ(u(store.getUserName(static_cast<unsigned int>(i))), c.names[i]);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(
    Slots, UsersUpdaterList,
    ::testing::Values(UserListCase{"NoUsers", {}, 0}, UserListCase{"TwoUsers", {"Anna", "Bruno"}, 2},
                      UserListCase{"ZeroMarksFreeSlot", {"Anna", "Bruno", "0", "Dora"}, 2},
                      UserListCase{"EmptyNameMarksFreeSlot", {"Anna", "", "Carl"}, 1},
                      UserListCase{"MissingSlotEndsList", {"Anna", "-", "Carl"}, 1},
                      UserListCase{"FirstSlotFree", {"0", "Bruno"}, 0},
                      UserListCase{"NineteenUsers",
                                   {"u1", "u2", "u3", "u4", "u5", "u6", "u7", "u8", "u9", "u10", "u11", "u12", "u13",
                                    "u14", "u15", "u16", "u17", "u18", "u19"},
                                   19}),
    [](const auto& info) { return std::string(info.param.name); });

TEST_F(UsersUpdaterTest, TwentyUsersIsTheLimit)
{
    std::string slots;
    for (int n = 1; n <= 20; ++n)
        slots += slot(n, "user" + std::to_string(n));
    UsersUpdater& store = loaded(set("users", slots));
    EXPECT_EQ(store.getUserCount(), 20u);
    EXPECT_FALSE(store.addUser(w("Extra"), w("a"), w("p")));
    EXPECT_TRUE(m_log.contains(kAddUser + ": Max user count reached", kWarning));
    EXPECT_FALSE(store.doesUserExist(w("Extra")));
    EXPECT_EQ(u(store.getUserName(19)), "user20");
    m_log.clear();
    EXPECT_EQ(u(store.getUserName(20)), "");
    EXPECT_TRUE(m_log.contains("[const ACE_WString UsersUpdater::getUserName(unsigned int)]: Index out of range", kWarning));
    EXPECT_EQ(u(store.getUserPhone(1000)), "");
    EXPECT_TRUE(m_log.contains("[const ACE_WString UsersUpdater::getUserPhone(unsigned int)]: Index out of range", kWarning));
}

TEST_F(UsersUpdaterTest, AddUserRefusesOnlyAnEmptyName)
{
    UsersUpdater& store = loaded("");
    EXPECT_FALSE(store.addUser(w(""), w("addr"), w("tel")));
    EXPECT_TRUE(m_log.contains(kAddUser + ": Empty Name, Address or Phone", kWarning));
    EXPECT_EQ(store.getUserCount(), 0u);
    EXPECT_TRUE(store.addUser(w("Solo"), w(""), w("")));
    EXPECT_EQ(store.getUserCount(), 1u);
    ASSERT_TRUE(store.save());

    UsersUpdater reread(w(path()));
    ASSERT_TRUE(reread.load());
    EXPECT_EQ(reread.getUserCount(), 1u);
    EXPECT_EQ(u(reread.getUserName(0)), "Solo");
    EXPECT_EQ(u(reread.getUserAddress(0)), "");
}

TEST_F(UsersUpdaterTest, RemoveAllUsersOnFileWithoutUsersCreatesTwentyFreeSlots)
{
    UsersUpdater& store = loaded(str("activation", "1"));
    EXPECT_TRUE(store.removeAllUsers());
    EXPECT_EQ(store.getUserCount(), 0u);
    ASSERT_TRUE(store.save());

    BSet users(10);
    ASSERT_EQ(readBack(path()).getSet(w("users"), users), 0);
    EXPECT_EQ(users.size(), 20);
    for (int n = 1; n <= 20; ++n)
    {
        BSet user(10);
        ASSERT_EQ(users.getSet(w("user" + std::to_string(n)), user), 0) << n;
        EXPECT_EQ(stringAt(user, "name"), "0");
        EXPECT_EQ(stringAt(user, "address"), "0");
        EXPECT_EQ(stringAt(user, "telephone"), "0");
    }
}

TEST_F(UsersUpdaterTest, RemoveAllThenAddKeepsCallOrderAndOtherSlotKeys)
{
    UsersUpdater& store = loaded(set("users", set("user1", str("name", "Old") + str("badge", "B1")) + slot(2, "Older")));
    ASSERT_TRUE(store.removeAllUsers());
    EXPECT_EQ(u(store.getUserName(5)), "0");
    ASSERT_TRUE(store.addUser(w("First"), w("a1"), w("p1")));
    ASSERT_TRUE(store.addUser(w("Second"), w("a2"), w("p2")));
    EXPECT_EQ(store.getUserCount(), 2u);
    EXPECT_EQ(u(store.getUserName(0)), "First");
    EXPECT_EQ(u(store.getUserName(1)), "Second");
    EXPECT_FALSE(store.doesUserExist(w("Older")));
    ASSERT_TRUE(store.save());

    BSet users(10), user1(10);
    ASSERT_EQ(readBack(path()).getSet(w("users"), users), 0);
    ASSERT_EQ(users.getSet(w("user1"), user1), 0);
    EXPECT_EQ(stringAt(user1, "badge"), "B1");
}

TEST_F(UsersUpdaterTest, DoesUserExistLooksAtAllTwentySlots)
{
    UsersUpdater& store = loaded(set("users", slot(1, "Anna") + slot(2, "0") + slot(20, "Zoé")));
    EXPECT_EQ(store.getUserCount(), 1u);
    EXPECT_TRUE(store.doesUserExist(w("Anna")));
    EXPECT_TRUE(store.doesUserExist(w("Zoé")));
    EXPECT_FALSE(store.doesUserExist(w("anna")));
    EXPECT_FALSE(store.doesUserExist(w("Ann")));
    EXPECT_TRUE(store.doesUserExist(w("0")));
    m_log.clear();
    EXPECT_FALSE(store.doesUserExist(w("")));
    EXPECT_TRUE(m_log.contains("[bool UsersUpdater::doesUserExist(const ACE_WString&)]: Empty UserName ", kWarning));
}

TEST_F(UsersUpdaterTest, UnicodeUsersSurviveLoadChangeAndSave)
{
    UsersUpdater& store = loaded(set("users", slot(1, "Łukasz Żółć", "ul. Długa 5", "+48 22") + slot(2, "王小明")));
    ASSERT_TRUE(store.addUser(w("Ørjan Ærø"), w("Vägen 3"), w("☎ 42")));
    ASSERT_TRUE(store.save());

    UsersUpdater reread(w(path()));
    ASSERT_TRUE(reread.load());
    ASSERT_EQ(reread.getUserCount(), 3u);
    EXPECT_EQ(u(reread.getUserName(0)), "Łukasz Żółć");
    EXPECT_EQ(u(reread.getUserAddress(0)), "ul. Długa 5");
    EXPECT_EQ(u(reread.getUserName(1)), "王小明");
    EXPECT_EQ(u(reread.getUserPhone(2)), "☎ 42");
    EXPECT_TRUE(reread.doesUserExist(w("王小明")));
}

// ---- state ----

TEST_F(UsersUpdaterTest, SecondLoadKeepsEditsAndReloadDiscardsThem)
{
    UsersUpdater& store = loaded(set("users", slot(1, "Anna")));
    ASSERT_TRUE(store.addUser(w("Bruno"), w(""), w("")));
    EXPECT_TRUE(store.load());
    EXPECT_TRUE(m_log.contains("[bool UsersUpdater::load()]: File already loaded", kWarning));
    EXPECT_EQ(store.getUserCount(), 2u);

    EXPECT_TRUE(store.reload());
    EXPECT_EQ(store.getUserCount(), 1u);
    EXPECT_FALSE(store.doesUserExist(w("Bruno")));
}

TEST_F(UsersUpdaterTest, FailedReloadLeavesStoreNotLoaded)
{
    UsersUpdater& store = loaded(str("activation", "1"));
    std::filesystem::remove(path());
    EXPECT_FALSE(store.reload());
    EXPECT_FALSE(store.isLoaded());
    EXPECT_FALSE(store.save());
    EXPECT_FALSE(std::filesystem::exists(path()));
}

TEST_F(UsersUpdaterTest, UnknownKeysAreKeptThroughSave)
{
    UsersUpdater& store = loaded(str("activation", "0") + typed("Int", "Version", "7") +
                                 set("Extra", str("inner", "x")));
    store.activate(true);
    ASSERT_TRUE(store.save());
    const BSet saved = readBack(path());
    long version = 0;
    EXPECT_EQ(saved.getInt(w("Version"), version), 0);
    EXPECT_EQ(version, 7);
    BSet extra(10);
    EXPECT_EQ(saved.getSet(w("Extra"), extra), 0);
    EXPECT_EQ(stringAt(extra, "inner"), "x");
}

TEST_F(UsersUpdaterTest, CopiesAreIndependent)
{
    UsersUpdater& store = loaded(set("users", slot(1, "Anna")));
    UsersUpdater copy(store);
    ASSERT_TRUE(copy.addUser(w("Bruno"), w(""), w("")));
    EXPECT_EQ(store.getUserCount(), 1u);
    UsersUpdater assigned(w(m_dir.file("other.xml")));
    assigned = copy;
    EXPECT_TRUE(assigned.isLoaded());
    EXPECT_EQ(assigned.getUserCount(), 2u);
    // The path was copied too: saving writes the file the copy came from.
    ASSERT_TRUE(assigned.save());
    UsersUpdater reread(w(path()));
    ASSERT_TRUE(reread.load());
    EXPECT_EQ(reread.getUserCount(), 2u);
}
}
