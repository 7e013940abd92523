#include "BBool.h"
#include "BDataUtilities.h"
#include "BDouble.h"
#include "BInt.h"
#include "BSet.h"
#include "BString.h"
#include "WideString.h"

#include <gtest/gtest.h>

#include <limits>
#include <string>
#include <vector>

namespace
{
// Keys and values built with an explicit length (GCC 12 warns falsely inside ACE's
// NUL-terminated string constructor when many literals are converted implicitly).
ACE_WString operator""_w(const wchar_t* text, std::size_t length)
{
    return ACE_WString(text, length);
}

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
    ACE_WString untouched(L"x"_w);
    EXPECT_NE(all.getAt(all.length(), untouched), 0);
    EXPECT_NE(all.getAt(-1, untouched), 0);
    EXPECT_EQ(std::wstring(untouched.c_str()), L"x");
    return keys;
}

TEST(BSet, KeepsInsertionOrderAndReplacesInPlace)
{
    BSet set;
    set.setString(L"b"_w, L"1"_w);
    set.setInt(L"a"_w, 2);
    set.setBool(L"c"_w, true);
    set.setDouble(L"a"_w, 2.5); // replaces, even with another type, at the same place
    EXPECT_EQ(keysOf(set), (std::vector<std::wstring>{L"b", L"a", L"c"}));
    double d = 0;
    EXPECT_EQ(set.getDouble(L"a"_w, d), BSet::eOK);
    EXPECT_EQ(d, 2.5);

    EXPECT_EQ(BDataUtilities::removeBSetSubElement(set, L"b"_w), 0);
    EXPECT_NE(BDataUtilities::removeBSetSubElement(set, L"b"_w), 0);
    EXPECT_EQ(keysOf(set), (std::vector<std::wstring>{L"a", L"c"}));
    set.setString(L"b"_w, L"again"_w);
    EXPECT_EQ(keysOf(set), (std::vector<std::wstring>{L"a", L"c", L"b"}));
    bool flag = false;
    EXPECT_EQ(set.getBool(L"c"_w, flag), BSet::eOK); // index still right after the removal
    EXPECT_TRUE(flag);
    EXPECT_EQ(set.size(), 3);
    set.clear();
    EXPECT_TRUE(set.isEmpty());
    EXPECT_FALSE(set.contains(L"a"_w));
}

TEST(BSet, ManyKeysStayOrderedAndFindable)
{
    BSet set;
    for (long i = 0; i < 500; ++i)
        set.setInt(WideString::fromStd(std::to_wstring(499 - i)), i);
    for (long i = 0; i < 500; i += 2)
        set.remove(WideString::fromStd(std::to_wstring(499 - i)));
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
    inner.setString(L"name"_w, L"Łukasz"_w);
    BSet outer;
    outer.setSet(L"inner"_w, inner);
    outer.setInt(L"n"_w, 1);

    BSet copy(outer);
    BSet assigned;
    assigned.setBool(L"old"_w, true);
    assigned = outer;
    std::unique_ptr<BData> cloned = outer.clone();

    inner.setString(L"name"_w, L"changed"_w); // the stored value is a copy
    BSet nested;
    ASSERT_EQ(outer.getSet(L"inner"_w, nested), BSet::eOK);
    nested.setString(L"name"_w, L"changed too"_w);
    outer.setSet(L"inner"_w, nested);
    outer.setInt(L"n"_w, 2);

    for (const BSet* other : {static_cast<const BSet*>(&copy), static_cast<const BSet*>(&assigned),
                              static_cast<const BSet*>(cloned.get())})
    {
        BSet otherInner;
        ASSERT_EQ(other->getSet(L"inner"_w, otherInner), BSet::eOK);
        ACE_WString name;
        EXPECT_EQ(otherInner.getString(L"name"_w, name), BSet::eOK);
        EXPECT_EQ(std::wstring(name.c_str()), L"Łukasz");
        EXPECT_FALSE(other->contains(L"old"_w));
        EXPECT_FALSE(other->equals(outer));
    }
    EXPECT_TRUE(copy.equals(assigned));

    BSet moved(std::move(copy));
    EXPECT_TRUE(moved.equals(assigned));
    EXPECT_TRUE(copy.isEmpty()); // NOLINT(bugprone-use-after-move): moved-from sets are empty
    outer.setSet(L"self"_w, outer);  // storing a set in itself stores its old content
    BSet self;
    ASSERT_EQ(outer.getSet(L"self"_w, self), BSet::eOK);
    EXPECT_FALSE(self.contains(L"self"_w));
}

TEST(BSet, TypedReadsReportCodesAndLeaveOutputUntouched)
{
    BSet set;
    set.setString(L"s"_w, L"text"_w);
    set.setInt(L"i"_w, 7);
    set.setBool(L"b"_w, true);
    set.setDouble(L"d"_w, 1.5);
    set.setSet(L"set"_w, BSet());

    const wchar_t* keys[] = {L"s", L"i", L"b", L"d", L"set", L"missing"};
    for (int kind = 0; kind < 5; ++kind)
    {
        for (int k = 0; k < 6; ++k)
        {
            SCOPED_TRACE(std::to_string(kind) + "/" + std::to_string(k));
            const int expected = k == 5 ? BSet::eNO_SUCH_KEY : (k == kind ? BSet::eOK : BSet::eWRONG_TYPE);
            ACE_WString s(L"keep"_w);
            long i = -3;
            bool b = false;
            double d = -3.5;
            BSet sub;
            sub.setInt(L"keep"_w, 1);
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
                EXPECT_TRUE(sub.contains(L"keep"_w));
            }
        }
    }

    // get(key, BData&) copies into an out value of the same kind only.
    BString text(L"keep"_w);
    EXPECT_EQ(set.get(L"s"_w, text), BSet::eOK);
    EXPECT_EQ(std::wstring(text.value().c_str()), L"text");
    BInt number(5);
    EXPECT_EQ(set.get(L"s"_w, number), BSet::eWRONG_TYPE);
    EXPECT_EQ(number.value(), 5);
    EXPECT_EQ(set.get(L"nope"_w, number), BSet::eNO_SUCH_KEY);
    BSet out;
    out.setInt(L"old"_w, 1);
    EXPECT_EQ(set.get(L"set"_w, out), BSet::eOK);
    EXPECT_TRUE(out.isEmpty());
    EXPECT_EQ(set.find(L"nope"_w), nullptr);
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
