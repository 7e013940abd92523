#include "BBool.h"
#include "BDataUtilities.h"
#include "BDouble.h"
#include "BInt.h"
#include "BSet.h"
#include "BString.h"
#include "ID.h"
#include "TestText.h"

#include <gtest/gtest.h>

#include <limits>
#include <string>
#include <utility>

namespace
{
// The keys in order, read through StringSet, whose reads out of range fail and change nothing.
std::string keysOf(const BSet& set)
{
    const StringSet all = set.getAllKeys();
    ACE_WString key(L"x"_w);
    EXPECT_TRUE(all.getAt(all.length(), key) != 0 && all.getAt(-1, key) != 0 && key == L"x"_w);
    std::string keys;
    for (int i = 0; i < all.length() && all.getAt(i, key) == 0; ++i)
        keys += utf8(key);
    return keys;
}

TEST(BSet, KeepsInsertionOrderReplacesInPlaceAndCopiesDeeply)
{
    BSet set;
    set.setString(L"b"_w, L"1"_w);
    set.setInt(L"a"_w, 2);
    set.setBool(L"c"_w, true);
    set.setDouble(L"a"_w, 2.5); // replaces, even with another type, at the same place
    EXPECT_EQ(keysOf(set), "bac");
    EXPECT_EQ(BDataUtilities::removeBSetSubElement(set, L"b"_w), 0);
    EXPECT_NE(BDataUtilities::removeBSetSubElement(set, L"b"_w), 0);
    set.setString(L"b"_w, L"again"_w);
    EXPECT_EQ(keysOf(set), "acb");
    EXPECT_TRUE(set.find(L"c"_w) != nullptr && set.find(L"c"_w)->equals(BBool(true))); // index right after removal
    EXPECT_TRUE(set.keyAt(99).length() == 0 && set.valueAt(-1).type() == BData::eSTRING);

    BSet outer;
    outer.setSet(L"inner"_w, set);
    const BSet original(outer);
    BSet assigned;
    assigned.setBool(L"old"_w, true);
    assigned = outer;
    const std::unique_ptr<BData> cloned = outer.clone();
    set.clear();
    EXPECT_TRUE(set.isEmpty() && !set.contains(L"a"_w));
    EXPECT_TRUE(outer.equals(original)) << "the stored value is a copy";
    outer.setSet(L"inner"_w, set);
    EXPECT_TRUE(assigned.equals(original) && cloned->equals(original) && !original.equals(outer));
    BSet moved(std::move(assigned));
    EXPECT_TRUE(moved.equals(original));
    EXPECT_TRUE(assigned.isEmpty()); // NOLINT(bugprone-use-after-move): moved-from sets are empty
    outer.setSet(L"self"_w, outer);  // storing a set in itself stores its old content
    ASSERT_EQ(outer.getSet(L"self"_w, set), BSet::eOK);
    EXPECT_FALSE(set.contains(L"self"_w));
}

// Sets small and large (large ones are indexed) find every key after inserts, a removal, a copy
// and a move.
TEST(BSet, FindsEveryKeyAtAnySize)
{
    for (const int size : {1, 15, 16, 17, 40, 300})
    {
        SCOPED_TRACE(size);
        BSet set;
        for (int i = 0; i < size; ++i)
            set.setInt(wide("k" + std::to_string(i)), i);
        set.setInt(L"k0"_w, -1); // replaced in place, not added
        ASSERT_EQ(set.size(), size);
        EXPECT_EQ(BDataUtilities::removeBSetSubElement(set, wide("k" + std::to_string(size / 2))), 0);
        BSet copy(set);
        const BSet moved(std::move(copy));
        for (const BSet* each : {static_cast<const BSet*>(&set), &moved})
        {
            for (int i = 0; i < size; ++i)
            {
                long value = 0;
                const int code = each->getInt(wide("k" + std::to_string(i)), value);
                EXPECT_EQ(code, i == size / 2 ? BSet::eNO_SUCH_KEY : BSet::eOK) << i;
                EXPECT_TRUE(code != BSet::eOK || value == (i == 0 ? -1 : i)) << i;
            }
            EXPECT_FALSE(each->contains(L"k"_w) || each->contains(wide("k" + std::to_string(size))));
        }
    }
}

TEST(BSet, MovesInAndEditsNestedSetsInPlace)
{
    BSet inner;
    for (int i = 0; i < 20; ++i)
        inner.setString(wide("u" + std::to_string(i)), wide(std::to_string(i)));
    const BSet expected(inner);
    BSet outer;
    outer.setString(L"s"_w, L"not a set"_w);
    outer.setSet(L"m"_w, std::move(inner));
    EXPECT_TRUE(outer.find(L"m"_w) != nullptr && outer.find(L"m"_w)->equals(expected));
    EXPECT_TRUE(inner.isEmpty()); // NOLINT(bugprone-use-after-move): a moved-in set is left empty and usable
    inner.setInt(L"again"_w, 1);
    EXPECT_EQ(inner.size(), 1);

    outer.editSet(L"s"_w).setInt(L"x"_w, 1);       // another kind is replaced at its place
    outer.editSet(L"m"_w).setInt(L"u3"_w, 3);      // an existing set is changed, keeping its other keys
    outer.editSet(L"new"_w).setBool(L"y"_w, true); // a missing key is added at the end
    EXPECT_EQ(keysOf(outer), "smnew");
    BSet m;
    ASSERT_EQ(outer.getSet(L"m"_w, m), BSet::eOK);
    long three = 0;
    EXPECT_TRUE(m.size() == 20 && m.getInt(L"u3"_w, three) == BSet::eOK && three == 3 && m.contains(L"u19"_w));
    BSet s;
    EXPECT_TRUE(outer.getSet(L"s"_w, s) == BSet::eOK && s.size() == 1);
}

TEST(BSet, TypedReadsReportCodesAndLeaveOutputUntouched)
{
    BSet set;
    set.setString(L"s"_w, L"text"_w);
    set.setInt(L"i"_w, 7);
    set.setBool(L"b"_w, true);
    set.setDouble(L"d"_w, 1.5);
    set.setSet(L"set"_w, BSet());
    const ACE_WString keys[] = {L"s"_w, L"i"_w, L"b"_w, L"d"_w, L"set"_w, L"missing"_w};
    for (int k = 0; k < 6; ++k)
    {
        SCOPED_TRACE(utf8(keys[k]));
        // Only the read of the stored kind succeeds; the others leave their output alone.
        ACE_WString s(L"keep"_w);
        long i = -3;
        bool b = false;
        double d = -3.5;
        BSet sub;
        sub.setInt(L"keep"_w, 1);
        const int codes[] = {set.getString(keys[k], s), set.getInt(keys[k], i), set.getBool(keys[k], b),
                             set.getDouble(keys[k], d), set.getSet(keys[k], sub)};
        for (int kind = 0; kind < 5; ++kind)
            EXPECT_EQ(codes[kind], k == 5 ? BSet::eNO_SUCH_KEY : k == kind ? BSet::eOK : BSet::eWRONG_TYPE) << kind;
        EXPECT_TRUE(utf8(s) == (k == 0 ? "text" : "keep") && i == (k == 1 ? 7 : -3) && b == (k == 2) &&
                    d == (k == 3 ? 1.5 : -3.5) && sub.contains(L"keep"_w) == (k != 4));
    }
    BInt number(3);
    EXPECT_FALSE(number.assign(BDouble(4.0)) || number.equals(BDouble(3.0)) || number.value() != 3);
    EXPECT_TRUE(number.assign(BInt(4)) && number.value() == 4 && !BString().assign(number));
    BSet one;
    BSet other;
    one.setInt(L"one"_w, 7);
    other.setInt(L"other"_w, 7);
    EXPECT_FALSE(one.equals(other) || other.equals(BSet())) << "sets with other keys or sizes differ";
    const double nan = std::numeric_limits<double>::quiet_NaN();
    EXPECT_TRUE(BDouble(nan).equals(BDouble(nan)) && BString(static_cast<const wchar_t*>(nullptr)).equals(BString()));
}
}
