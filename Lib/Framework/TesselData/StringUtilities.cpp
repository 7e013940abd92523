#include "StringUtilities.h"

#include "Utf8Codec.h"
#include "WideString.h"

#include <algorithm>
#include <charconv>
#include <climits>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cwchar>
#include <string>
#include <sys/types.h>

namespace
{
enum class Length
{
    eNONE,
    eHH,
    eH,
    eL,
    eLL,
    eJ,
    eZ,
    eT,
    eBIG_L
};

// One conversion directive, as read from the format.
struct Directive
{
    std::string flags;
    int width = -1;
    int precision = -1;
    Length length = Length::eNONE;
    bool wideModifier = false;   // "l" or "w" on s/c
    bool narrowModifier = false; // "h" on s/c
};

// Formats a single numeric conversion with the C library; never truncates.
template <typename T>
void appendNumber(std::wstring& out, const Directive& directive, const char* lengthText, char conversion, T value)
{
    std::string format = "%" + directive.flags;
    if (directive.width >= 0)
        format += std::to_string(directive.width);
    if (directive.precision >= 0)
        format += "." + std::to_string(directive.precision);
    format += lengthText;
    format += conversion;
    const int needed = std::snprintf(nullptr, 0, format.c_str(), value);
    if (needed <= 0)
        return;
    std::string buffer(static_cast<std::size_t>(needed) + 1, '\0');
    std::snprintf(buffer.data(), buffer.size(), format.c_str(), value);
    buffer.resize(static_cast<std::size_t>(needed));
    for (char c : buffer)
        out.push_back(static_cast<wchar_t>(static_cast<unsigned char>(c)));
}

// Pads `text` to the directive's width (in characters); "-" pads on the right.
void appendPadded(std::wstring& out, const Directive& directive, const std::wstring& text)
{
    const std::size_t width = directive.width > 0 ? static_cast<std::size_t>(directive.width) : 0;
    const std::size_t padding = text.size() < width ? width - text.size() : 0;
    const bool left = directive.flags.find('-') != std::string::npos;
    if (!left)
        out.append(padding, L' ');
    out += text;
    if (left)
        out.append(padding, L' ');
}

std::wstring wideArgument(const wchar_t* text, int precision)
{
    if (text == nullptr)
        return precision < 0 || precision >= 6 ? L"(null)" : L"";
    std::wstring result;
    for (std::size_t i = 0; (precision < 0 || i < static_cast<std::size_t>(precision)) && text[i] != L'\0'; ++i)
        result.push_back(text[i]);
    return result;
}

std::wstring narrowArgument(const char* text, int precision)
{
    if (text == nullptr)
        return precision < 0 || precision >= 6 ? L"(null)" : L"";
    std::wstring result;
    const char* p = text;
    wchar_t c = 0;
    while (precision < 0 || result.size() < static_cast<std::size_t>(precision))
    {
        const std::size_t used = Utf8Codec::decodeOne(p, nullptr, c);
        if (used == 0)
            break;
        result.push_back(c);
        p += used;
    }
    return result;
}

void appendLiteral(std::wstring& out, const wchar_t* begin, const wchar_t* end)
{
    out.append(begin, end);
}

void appendLiteral(std::wstring& out, const char* begin, const char* end)
{
    Utf8Codec::decode(begin, static_cast<std::size_t>(end - begin), out);
}

bool isDigit(wchar_t c)
{
    return c >= L'0' && c <= L'9';
}

// The shared formatter. `Char` is the format's own width: "%s" takes a string of that width and
// "%S" one of the other width; "%ls"/"%ws" are always wide and "%hs" always narrow.
template <typename Char>
std::wstring formatWith(const Char* format, va_list args)
{
    std::wstring out;
    if (format == nullptr)
        return out;
    constexpr bool wideFormat = sizeof(Char) == sizeof(wchar_t);
    va_list ap;
    va_copy(ap, args);
    const Char* p = format;
    while (*p != 0)
    {
        const Char* literal = p;
        while (*p != 0 && *p != '%')
            ++p;
        appendLiteral(out, literal, p);
        if (*p == 0)
            break;
        const Char* specStart = p;
        ++p; // '%'
        Directive directive;
        while (*p == '-' || *p == '+' || *p == ' ' || *p == '#' || *p == '0' || *p == '\'')
        {
            if (directive.flags.find(static_cast<char>(*p)) == std::string::npos)
                directive.flags.push_back(static_cast<char>(*p));
            ++p;
        }
        if (*p == '*')
        {
            directive.width = va_arg(ap, int);
            if (directive.width < 0)
            {
                directive.flags.push_back('-');
                directive.width = -directive.width;
            }
            ++p;
        }
        else
        {
            while (isDigit(static_cast<wchar_t>(*p)))
            {
                directive.width = (directive.width < 0 ? 0 : directive.width) * 10 + static_cast<int>(*p - '0');
                if (directive.width > 100000)
                    directive.width = 100000;
                ++p;
            }
        }
        if (*p == '.')
        {
            ++p;
            directive.precision = 0;
            if (*p == '*')
            {
                directive.precision = va_arg(ap, int);
                ++p;
            }
            else
            {
                while (isDigit(static_cast<wchar_t>(*p)))
                {
                    directive.precision = directive.precision * 10 + static_cast<int>(*p - '0');
                    if (directive.precision > 100000)
                        directive.precision = 100000;
                    ++p;
                }
            }
        }
        // Length modifiers.
        if (*p == 'h')
        {
            ++p;
            directive.length = Length::eH;
            directive.narrowModifier = true;
            if (*p == 'h')
            {
                ++p;
                directive.length = Length::eHH;
            }
        }
        else if (*p == 'l')
        {
            ++p;
            directive.length = Length::eL;
            directive.wideModifier = true;
            if (*p == 'l')
            {
                ++p;
                directive.length = Length::eLL;
            }
        }
        else if (*p == 'w')
        {
            ++p;
            directive.wideModifier = true;
        }
        else if (*p == 'q' || *p == 'L')
        {
            directive.length = *p == 'q' ? Length::eLL : Length::eBIG_L;
            ++p;
        }
        else if (*p == 'j' || *p == 'z' || *p == 't')
        {
            directive.length = *p == 'j' ? Length::eJ : (*p == 'z' ? Length::eZ : Length::eT);
            ++p;
        }
        else if (*p == 'I')
        {
            if (p[1] == '6' && p[2] == '4')
            {
                directive.length = Length::eLL;
                p += 3;
            }
            else if (p[1] == '3' && p[2] == '2')
            {
                p += 3;
            }
            else
            {
                directive.length = Length::eZ;
                ++p;
            }
        }

        const Char conversion = *p;
        switch (conversion)
        {
        case 'd':
        case 'i':
            switch (directive.length)
            {
            case Length::eHH:
                appendNumber(out, directive, "hh", 'd', static_cast<signed char>(va_arg(ap, int)));
                break;
            case Length::eH:
                appendNumber(out, directive, "h", 'd', static_cast<short>(va_arg(ap, int)));
                break;
            case Length::eL:
                appendNumber(out, directive, "l", 'd', va_arg(ap, long));
                break;
            case Length::eLL:
                appendNumber(out, directive, "ll", 'd', va_arg(ap, long long));
                break;
            case Length::eJ:
                appendNumber(out, directive, "j", 'd', va_arg(ap, intmax_t));
                break;
            case Length::eZ:
                appendNumber(out, directive, "z", 'd', va_arg(ap, ssize_t));
                break;
            case Length::eT:
                appendNumber(out, directive, "t", 'd', va_arg(ap, ptrdiff_t));
                break;
            default:
                appendNumber(out, directive, "", 'd', va_arg(ap, int));
                break;
            }
            break;
        case 'u':
        case 'x':
        case 'X':
        case 'o':
        {
            const char c = static_cast<char>(conversion);
            switch (directive.length)
            {
            case Length::eHH:
                appendNumber(out, directive, "hh", c, static_cast<unsigned char>(va_arg(ap, unsigned int)));
                break;
            case Length::eH:
                appendNumber(out, directive, "h", c, static_cast<unsigned short>(va_arg(ap, unsigned int)));
                break;
            case Length::eL:
                appendNumber(out, directive, "l", c, va_arg(ap, unsigned long));
                break;
            case Length::eLL:
                appendNumber(out, directive, "ll", c, va_arg(ap, unsigned long long));
                break;
            case Length::eJ:
                appendNumber(out, directive, "j", c, va_arg(ap, uintmax_t));
                break;
            case Length::eZ:
                appendNumber(out, directive, "z", c, va_arg(ap, size_t));
                break;
            case Length::eT:
                appendNumber(out, directive, "t", c, va_arg(ap, ptrdiff_t));
                break;
            default:
                appendNumber(out, directive, "", c, va_arg(ap, unsigned int));
                break;
            }
            break;
        }
        case 'f':
        case 'F':
        case 'e':
        case 'E':
        case 'g':
        case 'G':
        case 'a':
        case 'A':
            if (directive.length == Length::eBIG_L)
                appendNumber(out, directive, "L", static_cast<char>(conversion), va_arg(ap, long double));
            else
                appendNumber(out, directive, "", static_cast<char>(conversion), va_arg(ap, double));
            break;
        case 'p':
        {
            Directive pointerSpec = directive;
            pointerSpec.precision = -1;
            appendNumber(out, pointerSpec, "", 'p', va_arg(ap, void*));
            break;
        }
        case 's':
        case 'S':
        {
            bool wide = (conversion == 's') == wideFormat;
            if (directive.wideModifier)
                wide = true;
            else if (directive.narrowModifier)
                wide = false;
            if (wide)
                appendPadded(out, directive, wideArgument(va_arg(ap, const wchar_t*), directive.precision));
            else
                appendPadded(out, directive, narrowArgument(va_arg(ap, const char*), directive.precision));
            break;
        }
        case 'c':
        case 'C':
        {
            bool wide = (conversion == 'c') == wideFormat;
            if (directive.wideModifier)
                wide = true;
            else if (directive.narrowModifier)
                wide = false;
            wchar_t c = 0;
            if (wide)
                c = static_cast<wchar_t>(va_arg(ap, wint_t));
            else
            {
                const auto byte = static_cast<unsigned char>(va_arg(ap, int));
                c = byte < 0x80 ? static_cast<wchar_t>(byte) : Utf8Codec::kReplacement;
            }
            appendPadded(out, directive, std::wstring(1, c));
            break;
        }
        case 'n':
            // Never written to: the pointer is taken and ignored.
            (void)va_arg(ap, void*);
            break;
        case '%':
            out.push_back(L'%');
            break;
        default:
            // Unknown conversion (or the end of the format): copied as written.
            if (conversion == 0)
            {
                appendLiteral(out, specStart, p);
                va_end(ap);
                return out;
            }
            appendLiteral(out, specStart, p + 1);
            break;
        }
        ++p;
    }
    va_end(ap);
    return out;
}
}

ACE_WString StringUtilities::wideSprintf(const wchar_t* format, ...)
{
    va_list args;
    va_start(args, format);
    ACE_WString result = wideVsprintf(format, args);
    va_end(args);
    return result;
}

ACE_WString StringUtilities::wideVsprintf(const wchar_t* format, va_list args)
{
    return WideString::fromStd(formatWith(format, args));
}

ACE_WString StringUtilities::narrowVsprintf(const char* format, va_list args)
{
    return WideString::fromStd(formatWith(format, args));
}

ACE_WString StringUtilities::withNumber(const wchar_t* prefix, unsigned int number)
{
    char digits[16];
    const char* end = std::to_chars(digits, digits + sizeof(digits), number).ptr;
    ACE_WString text(prefix);
    text += ACE_WString(std::wstring(static_cast<const char*>(digits), end).c_str());
    return text;
}

int StringUtilities::toInt(const wchar_t* text)
{
    if (text == nullptr)
        return 0;
    while (*text == L' ' || (*text >= L'\t' && *text <= L'\r'))
        ++text;
    const bool negative = *text == L'-';
    if (*text == L'-' || *text == L'+')
        ++text;
    long long value = 0;
    for (; *text >= L'0' && *text <= L'9'; ++text)
    {
        value = value * 10 + (*text - L'0');
        if (value > static_cast<long long>(INT_MAX) + 1)
            value = static_cast<long long>(INT_MAX) + 1;
    }
    if (negative)
        value = -value;
    return static_cast<int>(std::clamp<long long>(value, INT_MIN, INT_MAX));
}
