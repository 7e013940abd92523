#include "StringUtilities.h"
#include "TestText.h"

#include <gtest/gtest.h>

#include <climits>
#include <type_traits>
#include <utility>

namespace
{
// Formats through the library's wide (wchar_t format) or narrow (UTF-8 format) printf.
template <typename Char>
std::wstring format(const Char* text, ...)
{
    va_list args;
    va_start(args, text);
    ACE_WString result;
    if constexpr (std::is_same_v<Char, wchar_t>)
        result = StringUtilities::wideVsprintf(text, args);
    else
        result = StringUtilities::narrowVsprintf(text, args);
    va_end(args);
    return WideString::toStd(result);
}

TEST(Format, TranslatesEachConversion)
{
    const std::wstring longText(5000, L'w');
    const auto* noWide = static_cast<const wchar_t*>(nullptr);
    const auto* noNarrow = static_cast<const char*>(nullptr);
    const std::pair<std::wstring, std::wstring> cases[] = {
        // actual, expected
        // Wide formats: %s wide, %S narrow (UTF-8).
        {format(L"%s|%S|%ls|%hs|%ws", L"wide", "narrow", L"l", "h", L"w"), L"wide|narrow|l|h|w"},
        {format(L"[%s] [%S]", noWide, noNarrow), L"[(null)] [(null)]"},
        {format(L"0x%08lX %i %d %ld", 0x80070005UL, -5, INT_MIN, -7L), L"0x80070005 -5 -2147483648 -7"},
        {format(L"%hu %hd %hhu", 65537, 65535, 257), L"1 -1 1"},
        {format(L"%lld %I64d %llu", LLONG_MIN, -1LL, ULLONG_MAX), L"-9223372036854775808 -1 18446744073709551615"},
        {format(L"%x %X %o %#x", 255u, 255u, 8u, 255u), L"ff FF 10 0xff"},
        {format(L"[%5d][%-5d][%05d][%+d][%*d]", 42, 42, 42, 42, 4, 7), L"[   42][42   ][00042][+42][   7]"},
        {format(L"[%6s][%-6S][%.2s][%6.3S]", L"ab", "Żó", L"abcdef", "Łukasz"), L"[    ab][Żó    ][ab][   Łuk]"},
        {format(L"%.2f %g %e", 2.5, 0.5, 1.0), L"2.50 0.5 1.000000e+00"},
        {format(L"%c%C%lc", L'é', 'a', L'王'), L"éa王"},
        {format(L"100%% %y %"), L"100% %y %"},
        {format(L"end %l"), L"end %l"},
        {format(L"%s!", longText.c_str()), longText + L"!"},
        // Narrow formats: %s narrow, %S wide; the format itself is UTF-8.
        {format("Żółć %s %S|%ls|%hs", "Łukasz", L"王小明 😀", L"l", "h"), L"Żółć Łukasz 王小明 😀|l|h"},
        {format("%lX '%i' %lu", 0x80004005UL, 3, 7UL), L"80004005 '3' 7"},
        {format("%S|%s", noWide, noNarrow), L"(null)|(null)"},
        {format("%s", "a\xff"
                      "b"),
         L"a\uFFFDb"},
    };
    for (const auto& [actual, expected] : cases)
        EXPECT_EQ(actual, expected);
    EXPECT_EQ(utf8(StringUtilities::wideSprintf(L"%s=%d", L"n", 3)) + utf8(StringUtilities::wideSprintf(nullptr)),
              "n=3");
    for (unsigned int number : {0u, 7u, 10u, 19u, 4294967295u})
        EXPECT_EQ(StringUtilities::withNumber(L"User#", number),
                  StringUtilities::wideSprintf(L"%s%u", L"User#", number));
}

TEST(WideString, ConvertsExactlyAndReplacesInvalidBytes)
{
    const std::pair<std::string, std::wstring> cases[] = {
        {"", L""},
        {"Łukasz Żółć", L"\u0141ukasz \u017B\u00F3\u0142\u0107"},
        {"王小明 😀", L"\u738B\u5C0F\u660E \U0001F600"},
        {"\xC3", L"\uFFFD"},                             // truncated sequence
        {"\xC0\xAF\xE0\x80\xAF", L"\uFFFD\uFFFD\uFFFD"}, // overlong, with an invalid or a valid lead
        {"\xC3\xC3\xA9", L"\uFFFD\u00E9"},               // a lead byte where a continuation belongs
        {"\xED\xA0\x80", L"\uFFFD"},                     // surrogate
        {"\xF4\x90\x80\x80", L"\uFFFD"},                 // above U+10FFFF
        {"\x80x\xFE", L"\uFFFDx\uFFFD"},                 // stray continuation and invalid lead
        // Runs of eight ASCII bytes and two-byte sequences next to them.
        {"abcdefgh\xC3\xA9"
         "12345678",
         L"abcdefgh\u00E9"
         "12345678"},
        {"abcdefgh\xC3"
         "abcdefgh",
         L"abcdefgh\uFFFDabcdefgh"},
        {"abcdefg\xC3", L"abcdefg\uFFFD"},
        {"\xC2\x80\xDF\xBF\xC1\xBF", L"\u0080\u07FF\uFFFD\uFFFD"}, // lowest, highest, overlong
    };
    for (const auto& [text, wideText] : cases)
    {
        SCOPED_TRACE(text);
        EXPECT_EQ(WideString::toStd(WideString::fromUtf8(text)), wideText);
        EXPECT_EQ(WideString::toStd(WideString::fromUtf8(text.c_str())), wideText);
        EXPECT_TRUE(wideText.find(L'\uFFFD') != std::wstring::npos ||
                    WideString::toUtf8(WideString::fromStd(wideText)) == text); // a clean text round-trips
    }
    const wchar_t invalid[] = {0xD800, static_cast<wchar_t>(0x110000), L'x', 0};
    EXPECT_EQ(WideString::toUtf8(invalid), "\xEF\xBF\xBD\xEF\xBF\xBDx");
    EXPECT_TRUE(WideString::toUtf8(static_cast<const wchar_t*>(nullptr)).empty() &&
                WideString::fromUtf8(static_cast<const char*>(nullptr)).length() == 0);
}
}
