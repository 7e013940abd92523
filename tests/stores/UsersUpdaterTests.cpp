#include "UsersUpdater.h"

#include "StoreTestSupport.h"

#include <filesystem>

using namespace StoreTest;

namespace
{
using UsersUpdaterTest = StoreFixture<UsersUpdater>;

// Slots "user1".. of a users set; "-" leaves a slot out.
std::string users(const std::vector<std::string>& names)
{
    std::string list;
    for (size_t i = 0; i < names.size(); ++i)
        if (names[i] != "-")
            list += typed("Set", "user" + std::to_string(i + 1),
                          str("name", names[i]) + str("address", "addr") + str("telephone", "tel"));
    return typed("Set", "users", list);
}

// Written as " | "-separated port, IP and dealer, retries and timeout, request attributes.
std::string app2App(UsersUpdater& store)
{
    const BSet attributes = store.getApp2AppReqAttrs();
    return utf8(store.getApp2AppPort() + L" | "_w + store.getApp2AppIP() + L" | "_w + store.getApp2AppDealerID()) +
           " | " + std::to_string(store.getApp2AppNumRetries()) + " " + std::to_string(store.getApp2AppTimeout()) +
           " | " + SettingsFiles::stringAt(attributes, "application") + " " +
           SettingsFiles::stringAt(attributes, "service") + " " + SettingsFiles::stringAt(attributes, "dealerId") +
           " (" + std::to_string(attributes.size()) + ")";
}

// Activation is the leading integer, written as "1" or "0".
TEST_F(UsersUpdaterTest, MissingApp2AppGetsDefaultsAndActivationIsOneOrZero)
{
    UsersUpdater& store = loaded(str("activation", "12abc"));
    EXPECT_TRUE(store.getUserCount() == 0 && store.isActivated()); // no users set at all
    EXPECT_EQ(app2App(store), " |  |  | 3 3.000000 | vexa sfd  (2)");
    EXPECT_TRUE(store.setApp2AppParams(L"9000"_w, L"10.1.2.3"_w, wide("Händler-7")) && store.activate(false) &&
                store.save());
    EXPECT_EQ(app2App(reread()), "9000 | 10.1.2.3 | Händler-7 | 3 3.000000 | vexa sfd Händler-7 (3)");
    EXPECT_EQ(SettingsFiles::stringAt(SettingsFiles::read(path()), "activation"), "0");
    EXPECT_FALSE(m_store->isActivated() || loaded("").isActivated());
    SettingsFiles::writeUsers(path(), {kAnna});
    ASSERT_TRUE(m_store->reload());
    EXPECT_EQ(app2App(*m_store), "8080 | 10.0.0.7 | D77 | -1 -1.000000 |   D77 (1)");
}

// The list is positional: it ends at the first missing slot or free name ("" or "0"); a used
// slot after the gap is neither counted nor overwritten.
TEST_F(UsersUpdaterTest, CountsConsecutiveUsedSlotsAndAddsAfterThem)
{
    for (const char* gap : {"0", "", "-"})
    {
        UsersUpdater& store = loaded(users({"Anna", gap, "Carl"}));
        EXPECT_EQ(store.getUserCount(), 1u) << gap;
        ASSERT_TRUE(store.addUser(L"Neu"_w, L"Rue 1"_w, L"0102"_w));
        EXPECT_EQ(utf8(store.getUserName(1) + store.getUserAddress(1) + store.getUserPhone(1) + store.getUserName(2)),
                  "NeuRue 10102Carl");
        EXPECT_EQ(store.getUserCount(), 3u) << gap; // the filled gap joins the used slot after it
    }
}

// Added one by one after removeAllUsers, users fill the slots in call order up to twenty, the
// limit; a name "0" is written but leaves its slot free. doesUserExist looks at all twenty slots,
// matching exactly.
TEST_F(UsersUpdaterTest, AddsUpToTwentyInCallOrder)
{
    UsersUpdater& store = loaded(users({"Old1", "Old2", "Old3"}));
    ASSERT_TRUE(store.removeAllUsers());
    ASSERT_TRUE(store.addUser(L"0"_w, L"a"_w, L"p"_w));
    EXPECT_EQ(store.getUserCount(), 0u);
    for (unsigned int n = 1; n <= 21; ++n)
    {
        EXPECT_EQ(store.addUser(wide("u" + std::to_string(n)), L"a"_w, L"p"_w), n <= 20) << n;
        EXPECT_EQ(store.getUserCount(), n <= 20 ? n : 20u) << n;
    }
    EXPECT_EQ(utf8(store.getUserName(0) + store.getUserName(9) + store.getUserName(19)), "u1u10u20");
    ASSERT_TRUE(store.save());
    UsersUpdater& saved = reread();
    m_log.clear();
    EXPECT_EQ(saved.getUserCount(), 20u);
    EXPECT_FALSE(saved.addUser(L"Extra"_w, L"a"_w, L"p"_w));
    EXPECT_EQ(utf8(saved.getUserName(19) + saved.getUserName(20) + saved.getUserAddress(20) + saved.getUserPhone(20)),
              "u20");
    EXPECT_TRUE(saved.doesUserExist(L"u20"_w));
    EXPECT_FALSE(saved.doesUserExist(L"U1"_w) || saved.doesUserExist(L""_w));
    EXPECT_EQ(m_log.messages(kWarning).size(), 5u); // one per refusal
}

// Removing frees all twenty slots, keeping their other keys and the file's unknown keys; a second
// load keeps edits, reload discards them.
TEST_F(UsersUpdaterTest, RemoveAllUsersReloadAndSecondLoad)
{
    UsersUpdater& store = loaded(typed("Set", "users", typed("Set", "user1", str("name", "Old") + str("badge", "B1"))) +
                                 typed("Int", "Version", "7"));
    ASSERT_TRUE(store.removeAllUsers() && store.save() && store.addUser(L"Bruno"_w, L""_w, L""_w));
    EXPECT_TRUE(store.load());
    EXPECT_TRUE(m_log.contains("[bool UsersUpdater::load()]: File already loaded", kWarning));
    EXPECT_EQ(store.getUserCount(), 1u);
    EXPECT_TRUE(store.reload());
    EXPECT_EQ(store.getUserCount(), 0u);
    EXPECT_EQ(utf8(store.getUserName(19) + store.getUserAddress(19) + store.getUserPhone(19)), "000");
    // Only the name is required; users with any text survive save and load unchanged.
    EXPECT_FALSE(store.addUser(L""_w, L"addr"_w, L"tel"_w));
    ASSERT_TRUE(store.addUser(wide("王"), L""_w, L""_w) &&
                store.addUser(wide(kLukasz.name), wide(kLukasz.address), wide(kLukasz.phone)) && store.save());
    EXPECT_EQ(SettingsFiles::usersIn(path()), (std::vector<User>{{"王", "", ""}, kLukasz}));
    const std::string file = TempDir::read(path());
    EXPECT_TRUE(file.find(">B1<") != std::string::npos && file.find("\"Version\">7<") != std::string::npos);
    std::filesystem::remove(path());
    EXPECT_FALSE(store.reload() || store.isLoaded() || store.save());
    EXPECT_FALSE(std::filesystem::exists(path()));
}
}
