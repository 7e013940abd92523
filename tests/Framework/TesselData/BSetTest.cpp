#include "BBool.h"
#include "BDataUtilities.h"
#include "BDouble.h"
#include "BInt.h"
#include "BSet.h"
#include "BString.h"

#include <gtest/gtest.h>

#include <limits>
#include <string>
#include <vector>

namespace
{
std::vector<std::wstring> keysOf(const BSet& set)
{
    std::vector<std::wstring> keys;
    const StringSet all = set.getAllKeys();
    for (int i = 0; i < all.length(); ++i)
    {
        ACE_WString key;
        EXPECT_EQ(all.getAt(i, key), 0);
        keys.emplace_back(key.c_str());
    }
    ACE_WString untouched(L"x");
    EXPECT_NE(all.getAt(all.length(), untouched), 0);
    EXPECT_NE(all.getAt(-1, untouched), 0);
    EXPECT_EQ(std::wstring(untouched.c_str()), L"x");
    return keys;
}

TEST(BSet, KeepsInsertionOrderAndReplacesInPlace)
{
    BSet set;
    set.setString(L"b", L"1");
    set.setInt(L"a", 2);
    set.setBool(L"c", true);
    set.setDouble(L"a", 2.5); // replaces, even with another type, at the same place
    EXPECT_EQ(keysOf(set), (std::vector<std::wstring>{L"b", L"a", L"c"}));
    double d = 0;
    EXPECT_EQ(set.getDouble(L"a", d), BSet::eOK);
    EXPECT_EQ(d, 2.5);

    EXPECT_EQ(BDataUtilities::removeBSetSubElement(set, L"b"), 0);
    EXPECT_NE(BDataUtilities::removeBSetSubElement(set, L"b"), 0);
    EXPECT_EQ(keysOf(set), (std::vector<std::wstring>{L"a", L"c"}));
    set.setString(L"b", L"again");
    EXPECT_EQ(keysOf(set), (std::vector<std::wstring>{L"a", L"c", L"b"}));
    bool flag = false;
    EXPECT_EQ(set.getBool(L"c", flag), BSet::eOK); // index still right after the removal
    EXPECT_TRUE(flag);
    EXPECT_EQ(set.size(), 3);
    set.clear();
    EXPECT_TRUE(set.isEmpty());
    EXPECT_FALSE(set.contains(L"a"));
}

TEST(BSet, ManyKeysStayOrderedAndFindable)
{
    BSet set;
    for (long i = 0; i < 500; ++i)
        set.setInt(ACE_WString(std::to_wstring(499 - i).c_str()), i);
    for (long i = 0; i < 500; i += 2)
        set.remove(ACE_WString(std::to_wstring(499 - i).c_str()));
    ASSERT_EQ(set.size(), 250);
    for (int i = 0; i < set.size(); ++i)
    {
        long value = -1;
        ASSERT_EQ(set.getInt(set.keyAt(i), value), BSet::eOK);
        EXPECT_EQ(value, 2 * i + 1);
        EXPECT_EQ(std::wstring(set.keyAt(i).c_str()), std::to_wstring(499 - value));
    }
}

TEST(BSet, CopiesAreDeepAndIndependent)
{
    BSet inner;
    inner.setString(L"name", L"Łukasz");
    BSet outer;
    outer.setSet(L"inner", inner);
    outer.setInt(L"n", 1);

    BSet copy(outer);
    BSet assigned;
    assigned.setBool(L"old", true);
    assigned = outer;
    std::unique_ptr<BData> cloned = outer.clone();

    inner.setString(L"name", L"changed"); // the stored value is a copy
    BSet nested;
    ASSERT_EQ(outer.getSet(L"inner", nested), BSet::eOK);
    nested.setString(L"name", L"changed too");
    outer.setSet(L"inner", nested);
    outer.setInt(L"n", 2);

    for (const BSet* other : {static_cast<const BSet*>(&copy), static_cast<const BSet*>(&assigned),
                              static_cast<const BSet*>(cloned.get())})
    {
        BSet otherInner;
        ASSERT_EQ(other->getSet(L"inner", otherInner), BSet::eOK);
        ACE_WString name;
        EXPECT_EQ(otherInner.getString(L"name", name), BSet::eOK);
        EXPECT_EQ(std::wstring(name.c_str()), L"Łukasz");
        EXPECT_FALSE(other->contains(L"old"));
        EXPECT_FALSE(other->equals(outer));
    }
    EXPECT_TRUE(copy.equals(assigned));

    BSet moved(std::move(copy));
    EXPECT_TRUE(moved.equals(assigned));
    EXPECT_TRUE(copy.isEmpty()); // NOLINT(bugprone-use-after-move): moved-from sets are empty
    outer.setSet(L"self", outer);  // storing a set in itself stores its old content
    BSet self;
    ASSERT_EQ(outer.getSet(L"self", self), BSet::eOK);
    EXPECT_FALSE(self.contains(L"self"));
}

TEST(BSet, TypedReadsReportCodesAndLeaveOutputUntouched)
{
    BSet set;
    set.setString(L"s", L"text");
    set.setInt(L"i", 7);
    set.setBool(L"b", true);
    set.setDouble(L"d", 1.5);
    set.setSet(L"set", BSet());

    const wchar_t* keys[] = {L"s", L"i", L"b", L"d", L"set", L"missing"};
    for (int kind = 0; kind < 5; ++kind)
    {
        for (int k = 0; k < 6; ++k)
        {
            SCOPED_TRACE(std::to_string(kind) + "/" + std::to_string(k));
            const int expected = k == 5 ? BSet::eNO_SUCH_KEY : (k == kind ? BSet::eOK : BSet::eWRONG_TYPE);
            ACE_WString s(L"keep");
            long i = -3;
            bool b = false;
            double d = -3.5;
            BSet sub;
            sub.setInt(L"keep", 1);
            int code = -1;
            switch (kind)
            {
            case 0: code = set.getString(keys[k], s); break;
            case 1: code = set.getInt(keys[k], i); break;
            case 2: code = set.getBool(keys[k], b); break;
            case 3: code = set.getDouble(keys[k], d); break;
            default: code = set.getSet(keys[k], sub); break;
            }
            EXPECT_EQ(code, expected);
            if (code != BSet::eOK)
            {
                EXPECT_EQ(std::wstring(s.c_str()), L"keep");
                EXPECT_EQ(i, -3);
                EXPECT_FALSE(b);
                EXPECT_EQ(d, -3.5);
                EXPECT_TRUE(sub.contains(L"keep"));
            }
        }
    }

    // get(key, BData&) copies into an out value of the same kind only.
    BString text(L"keep");
    EXPECT_EQ(set.get(L"s", text), BSet::eOK);
    EXPECT_EQ(std::wstring(text.value().c_str()), L"text");
    BInt number(5);
    EXPECT_EQ(set.get(L"s", number), BSet::eWRONG_TYPE);
    EXPECT_EQ(number.value(), 5);
    EXPECT_EQ(set.get(L"nope", number), BSet::eNO_SUCH_KEY);
    BSet out;
    out.setInt(L"old", 1);
    EXPECT_EQ(set.get(L"set", out), BSet::eOK);
    EXPECT_TRUE(out.isEmpty());
    EXPECT_EQ(set.find(L"nope"), nullptr);
    EXPECT_EQ(set.keyAt(99).length(), 0u);
    EXPECT_EQ(set.valueAt(-1).type(), BData::eSTRING);
}

TEST(BData, AssignAndEqualsRespectKinds)
{
    BInt i(3);
    BDouble d(3.0);
    EXPECT_FALSE(i.assign(d));
    EXPECT_EQ(i.value(), 3);
    EXPECT_FALSE(i.equals(d));
    BDouble nan1(std::numeric_limits<double>::quiet_NaN());
    EXPECT_TRUE(nan1.equals(BDouble(std::numeric_limits<double>::quiet_NaN())));
    BBool b;
    EXPECT_TRUE(b.assign(BBool(true)));
    EXPECT_TRUE(b.value());
    EXPECT_TRUE(BString(static_cast<const wchar_t*>(nullptr)).equals(BString()));
}
}
