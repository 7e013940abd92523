#include "StringUtilities.h"
#include "WideString.h"

#include <gtest/gtest.h>

#include <climits>
#include <string>

namespace
{
std::wstring wideFormat(const wchar_t* format, ...)
{
    va_list args;
    va_start(args, format);
    const ACE_WString result = StringUtilities::wideVsprintf(format, args);
    va_end(args);
    return WideString::toStd(result);
}

std::wstring narrowFormat(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    const ACE_WString result = StringUtilities::narrowVsprintf(format, args);
    va_end(args);
    return WideString::toStd(result);
}

TEST(Format, TranslatesEachConversion)
{
    const std::wstring longText(5000, L'w');
    const struct
    {
        std::wstring actual;
        std::wstring expected;
    } cases[] = {
        // Wide formats: %s wide, %S narrow (UTF-8).
        {wideFormat(L"%s|%S", L"wide", "narrow"), L"wide|narrow"},
        {wideFormat(L"%S", "Łukasz Żółć 王小明"), L"Łukasz Żółć 王小明"},
        {wideFormat(L"%ls|%hs|%ws", L"l", "h", L"w"), L"l|h|w"},
        {wideFormat(L"[%s] [%S]", static_cast<const wchar_t*>(nullptr), static_cast<const char*>(nullptr)),
         L"[(null)] [(null)]"},
        {wideFormat(L"0x%08lX", static_cast<unsigned long>(0x80070005u)), L"0x80070005"},
        {wideFormat(L"%i %d", -5, INT_MIN), L"-5 -2147483648"},
        {wideFormat(L"%lu %ld", 4294967296UL, -4294967296L), L"4294967296 -4294967296"},
        {wideFormat(L"%hu %hd %hhu", 65537, 65535, 257), L"1 -1 1"},
        {wideFormat(L"%lld %I64d %llu", LLONG_MIN, -1LL, ULLONG_MAX),
         L"-9223372036854775808 -1 18446744073709551615"},
        {wideFormat(L"%x %X %o %#x", 255u, 255u, 8u, 255u), L"ff FF 10 0xff"},
        {wideFormat(L"[%5d][%-5d][%05d][%+d][%*d]", 42, 42, 42, 42, 4, 7), L"[   42][42   ][00042][+42][   7]"},
        {wideFormat(L"[%6s][%-6S][%.2s][%6.3S]", L"ab", "Żó", L"abcdef", "Łukasz"),
         L"[    ab][Żó    ][ab][   Łuk]"},
        {wideFormat(L"%.2f %g %e", 2.5, 0.5, 1.0), L"2.50 0.5 1.000000e+00"},
        {wideFormat(L"%c%C%lc", L'é', 'a', L'王'), L"éa王"},
        {wideFormat(L"100%% %y %"), L"100% %y %"},
        {wideFormat(L"end %l"), L"end %l"},
        {wideFormat(L"%s!", longText.c_str()), longText + L"!"},
        // Narrow formats: %s narrow, %S wide; the format itself is UTF-8.
        {narrowFormat("%s|%S", "narrow", L"wide"), L"narrow|wide"},
        {narrowFormat("Żółć %s %S", "Łukasz", L"王小明 😀"), L"Żółć Łukasz 王小明 😀"},
        {narrowFormat("%ls|%hs", L"l", "h"), L"l|h"},
        {narrowFormat("%lX '%i' %lu", static_cast<unsigned long>(0x80004005u), 3, 7UL), L"80004005 '3' 7"},
        {narrowFormat("%S|%s", static_cast<const wchar_t*>(nullptr), static_cast<const char*>(nullptr)),
         L"(null)|(null)"},
        {narrowFormat("%s", "a\xff" "b"), L"a\uFFFDb"},
    };
    for (std::size_t i = 0; i < sizeof cases / sizeof cases[0]; ++i)
        EXPECT_EQ(cases[i].actual, cases[i].expected) << "case " << i;
    EXPECT_EQ(WideString::toStd(StringUtilities::wideSprintf(L"%s=%d", L"n", 3)), L"n=3");
    EXPECT_EQ(WideString::toStd(StringUtilities::wideSprintf(nullptr)), L"");
}

TEST(WideString, ConvertsExactlyAndReplacesInvalidBytes)
{
    const struct
    {
        std::string utf8;
        std::wstring wide;
        bool roundTrips;
    } cases[] = {
        {"", L"", true},
        {"plain", L"plain", true},
        {"Łukasz Żółć", L"\u0141ukasz \u017B\u00F3\u0142\u0107", true},
        {"王小明 😀", L"\u738B\u5C0F\u660E \U0001F600", true},
        {"\xC3", L"\uFFFD", false},                        // truncated sequence
        {"\xC0\xAF", L"\uFFFD\uFFFD", false},              // overlong
        {"\xED\xA0\x80", L"\uFFFD", false},                // surrogate
        {"\xF4\x90\x80\x80", L"\uFFFD", false},            // above U+10FFFF
        {"a\xE2\x82" "b", L"a\uFFFDb", false},             // cut short by an ASCII byte
        {"\x80x\xFE", L"\uFFFDx\uFFFD", false},            // stray continuation and invalid lead
    };
    for (const auto& c : cases)
    {
        EXPECT_EQ(WideString::toStd(WideString::fromUtf8(c.utf8)), c.wide) << c.utf8;
        EXPECT_EQ(WideString::toStd(WideString::fromUtf8(c.utf8.c_str())), c.wide) << c.utf8;
        if (c.roundTrips)
        {
            EXPECT_EQ(WideString::toUtf8(WideString::fromStd(c.wide)), c.utf8);
        }
    }
    const wchar_t invalid[] = {0xD800, static_cast<wchar_t>(0x110000), L'x', 0};
    EXPECT_EQ(WideString::toUtf8(invalid), "\xEF\xBF\xBD\xEF\xBF\xBDx");
    EXPECT_EQ(WideString::toUtf8(static_cast<const wchar_t*>(nullptr)), "");
    EXPECT_EQ(WideString::fromUtf8(static_cast<const char*>(nullptr)).length(), 0u);
}
}
