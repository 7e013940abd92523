#include "BInt.h"
#include "BSet.h"
#include "LogCapture.h"
#include "TempDir.h"
#include "TestText.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <string>
#include <vector>

namespace
{
// Values that are hard to write and read back exactly.
BSet sampleSet()
{
    BSet set;
    BSet user;
    user.setString(L"name"_w, L"Łukasz Żółć 王小明 😀"_w);
    user.setSet(L"empty"_w, BSet());
    user.setBool(L"no"_w, false);
    set.setSet(L"User#0"_w, user);
    set.setString(L"lines"_w, L"one\ntwo\r\nthree\r"_w);
    set.setString(L"markup"_w, L"<a href=\"x\">&amp; 'q'</a> ]]> \x01\x1f\x7f"_w);
    set.setString(L"k\u00e9y <&> \"q\" \t\n"_w, L""_w);
    set.setInt(L"min"_w, std::numeric_limits<long>::min());
    set.setDouble(L"tenth"_w, 0.1);
    set.setDouble(L"minusZero"_w, -0.0);
    set.setDouble(L"infinite"_w, -std::numeric_limits<double>::infinity());
    return set;
}

TEST(XmlFile, RoundTripKeepsOrderTypesAndEveryValue)
{
    TempDir dir;
    const std::string path = dir.file("settings.xml");
    ASSERT_TRUE(sampleSet().save(wide(path), false));
    // The escapes as written: markup and control characters in text, also tabs and line breaks
    // and quotes in keys.
    const std::string written = TempDir::read(path);
    for (const char* part :
         {"<String key=\"lines\">one\ntwo\r\nthree\r</String>",
          "<String key=\"markup\">&lt;a href=\"x\"&gt;&amp;amp; 'q'&lt;/a&gt; ]]&gt; &#01;&#31;\x7f</String>",
          "<String key=\"k\xC3\xA9y &lt;&amp;> &quot;q&quot; &#09;&#10;\"/>", "<Set key=\"empty\"/>"})
        EXPECT_NE(written.find(part), std::string::npos) << part;
    BSet loaded;
    loaded.setInt(L"stale"_w, 1); // a load replaces the whole content
    ASSERT_TRUE(loaded.load(wide(path)));
    EXPECT_TRUE(loaded.equals(sampleSet()));
    double zero = 1.0;
    EXPECT_TRUE(loaded.getDouble(L"minusZero"_w, zero) == BSet::eOK && std::signbit(zero));
    ASSERT_TRUE(loaded.save(wide(dir.file("again.xml")), true));
    EXPECT_EQ(TempDir::read(path), TempDir::read(dir.file("again.xml")));

    // Hand-written: BOM, comments, CRLF, padded values, CDATA, references, empty elements.
    TempDir::write(path, "\xEF\xBB\xBF<?xml version=\"1.0\"?>\r\n<!-- by hand -->\r\n<BSet>\r\n"
                         "  <Int key=\"port\"> 8080 </Int>\r\n  <Bool key=\"on\">\ttrue\n</Bool>\r\n"
                         "  <Set key=\"inner\"><String key=\"s\"><![CDATA[a<b]]> &#x1F600;</String></Set>\n"
                         "  <String key=\"empty\"/>\n</BSet>\n");
    ASSERT_TRUE(loaded.load(wide(path)) && loaded.save(wide(path), false));
    EXPECT_EQ(TempDir::read(path),
              "<?xml version=\"1.0\" encoding=\"UTF-8\"?><BSet><Int key=\"port\">8080</Int>"
              "<Bool key=\"on\">true</Bool><Set key=\"inner\"><String key=\"s\">a&lt;b \xF0\x9F\x98\x80"
              "</String></Set><String key=\"empty\"/></BSet>\n");
}

// One file per refusal reason (file-level limits are tested with the file layer). A string that is
// not UTF-8 is refused at its first bad byte, after ASCII runs and valid sequences.
TEST(XmlFile, BadFileIsRefusedAndLeavesTheSetUnchanged)
{
    const std::string s = "<BSet><String key=\"s\">", end = "</String></BSet>";
    const std::pair<std::string, int> files[] = {
        // content, byte offset of the bad UTF-8 (0: none)
        {"<BSet", 0},
        {"<Set/>", 0},
        {"<BSet/><BSet/>", 0},
        {"<BSet><Float key=\"f\">1</Float></BSet>", 0},
        {"<BSet><Int key=\"n\"/></BSet>", 0},
        {"<BSet><Double key=\"d\">1.5x</Double></BSet>", 0},
        {"<BSet><Bool key=\"b\">yes</Bool></BSet>", 0},
        {"<BSet><String>x</String></BSet>", 0},
        {"<BSet><Int key=\"n\">1</Int><Int key=\"n\">2</Int></BSet>", 0},
        {s + "a<b/>" + end, 0},
        {"<BSet>junk<Int key=\"n\">1</Int></BSet>", 0},
        {"<!DOCTYPE BSet [<!ENTITY x \"boom\">]>" + s + "&x;" + end, 0},
        {s + "abcdefghij\xC3(" + end, 32},
        {s + "\xC3\xA9\xC3\xA9\xE2\x82\xAC\x80" + end, 29},
        {s + "\xEF\xBF\xBD" + "abcdefgh\xED\xA0\x80" + end, 33}, // U+FFFD written out is valid, a surrogate is not
    };
    TempDir dir;
    const std::string path = dir.file("bad.xml");
    for (const auto& [content, offset] : files)
    {
        SCOPED_TRACE(content.substr(0, 80));
        TempDir::write(path, content);
        BSet set = sampleSet();
        LogCapture log;
        EXPECT_FALSE(set.load(wide(path)));
        EXPECT_TRUE(set.equals(sampleSet()));
        EXPECT_TRUE(log.containsSubstring("BData::load", TesselLog_Static::eWARNING));
        const std::vector<std::string> warnings = log.messages(TesselLog_Static::eWARNING);
        const std::string expected = "invalid UTF-8 at byte offset " + std::to_string(offset),
                          last = warnings.empty() ? std::string() : warnings.back();
        EXPECT_TRUE(offset == 0 || (warnings.size() == 1 && last.size() >= expected.size() &&
                                    last.compare(last.size() - expected.size(), expected.size(), expected) == 0))
            << last;
    }
    EXPECT_FALSE(BInt(3).load(wide(path)) || BInt(3).save(wide(path), false)) << "only sets are files";
}
}
