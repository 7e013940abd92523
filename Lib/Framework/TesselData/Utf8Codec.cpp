#include "Utf8Codec.h"

#include <cstdint>
#include <cstring>

namespace
{
// Whether the 8 bytes at `p` are all ASCII.
bool asciiWord(const char* p)
{
    std::uint64_t word = 0;
    std::memcpy(&word, p, sizeof word);
    return (word & 0x8080808080808080ULL) == 0;
}

// A well-formed two-byte sequence at `p` (the common non-ASCII case): its length, 0 otherwise.
std::size_t twoByte(const char* p, const char* end, wchar_t& out)
{
    const auto lead = static_cast<unsigned char>(p[0]);
    if (lead < 0xC2 || lead > 0xDF || end - p < 2 || (static_cast<unsigned char>(p[1]) & 0xC0) != 0x80)
        return 0;
    out = static_cast<wchar_t>(((lead & 0x1F) << 6) | (static_cast<unsigned char>(p[1]) & 0x3F));
    return 2;
}
}

std::size_t Utf8Codec::decodeOne(const char* p, const char* end, wchar_t& out)
{
    if (end != nullptr ? p >= end : *p == '\0')
        return 0;
    const auto lead = static_cast<unsigned char>(*p);
    if (lead < 0x80)
    {
        out = static_cast<wchar_t>(lead);
        return 1;
    }
    std::size_t count = 0;
    std::uint32_t value = 0;
    std::uint32_t minimum = 0;
    if (lead >= 0xC2 && lead <= 0xDF)
    {
        count = 1;
        value = lead & 0x1F;
        minimum = 0x80;
    }
    else if (lead >= 0xE0 && lead <= 0xEF)
    {
        count = 2;
        value = lead & 0x0F;
        minimum = 0x800;
    }
    else if (lead >= 0xF0 && lead <= 0xF4)
    {
        count = 3;
        value = lead & 0x07;
        minimum = 0x10000;
    }
    else
    {
        out = kReplacement;
        return 1;
    }
    for (std::size_t i = 1; i <= count; ++i)
    {
        // A NUL or any other non-continuation byte stops the sequence, so a terminated
        // string is never read past its end.
        if (end != nullptr && p + i >= end)
        {
            out = kReplacement;
            return i;
        }
        const auto next = static_cast<unsigned char>(p[i]);
        if ((next & 0xC0) != 0x80)
        {
            out = kReplacement;
            return i;
        }
        value = (value << 6) | (next & 0x3F);
    }
    if (value < minimum || value > 0x10FFFF || (value >= 0xD800 && value <= 0xDFFF))
        out = kReplacement;
    else
        out = static_cast<wchar_t>(value);
    return count + 1;
}

void Utf8Codec::decode(const char* data, std::size_t size, std::wstring& out)
{
    const std::size_t old = out.size();
    out.resize(old + size);
    out.resize(old + decodeInto(data, size, &out[old]));
}

std::size_t Utf8Codec::decodeInto(const char* data, std::size_t size, wchar_t* out)
{
    const char* const end = data + size;
    const char* p = data;
    wchar_t* written = out;
    while (p < end)
    {
        if (end - p >= 8 && asciiWord(p))
        {
            for (int i = 0; i < 8; ++i)
                written[i] = static_cast<wchar_t>(p[i]);
            p += 8;
            written += 8;
            continue;
        }
        const auto lead = static_cast<unsigned char>(*p);
        if (lead < 0x80)
        {
            *written++ = static_cast<wchar_t>(lead);
            ++p;
            continue;
        }
        const std::size_t two = twoByte(p, end, *written);
        p += two != 0 ? two : decodeOne(p, end, *written);
        ++written;
    }
    return static_cast<std::size_t>(written - out);
}

void Utf8Codec::encodeOne(wchar_t c, std::string& out)
{
    char bytes[4];
    out.append(bytes, encodeInto(c, bytes));
}

std::size_t Utf8Codec::encodeInto(wchar_t c, char* out)
{
    auto value = static_cast<std::uint32_t>(c);
    if (value > 0x10FFFF || (value >= 0xD800 && value <= 0xDFFF))
        value = kReplacement;
    if (value < 0x80)
    {
        out[0] = static_cast<char>(value);
        return 1;
    }
    if (value < 0x800)
    {
        out[0] = static_cast<char>(0xC0 | (value >> 6));
        out[1] = static_cast<char>(0x80 | (value & 0x3F));
        return 2;
    }
    if (value < 0x10000)
    {
        out[0] = static_cast<char>(0xE0 | (value >> 12));
        out[1] = static_cast<char>(0x80 | ((value >> 6) & 0x3F));
        out[2] = static_cast<char>(0x80 | (value & 0x3F));
        return 3;
    }
    out[0] = static_cast<char>(0xF0 | (value >> 18));
    out[1] = static_cast<char>(0x80 | ((value >> 12) & 0x3F));
    out[2] = static_cast<char>(0x80 | ((value >> 6) & 0x3F));
    out[3] = static_cast<char>(0x80 | (value & 0x3F));
    return 4;
}

void Utf8Codec::encode(const wchar_t* data, std::size_t size, std::string& out)
{
    const std::size_t old = out.size();
    out.resize(old + 4 * size);
    char* const begin = &out[0];
    char* p = begin + old;
    for (std::size_t i = 0; i < size; ++i)
        p += encodeInto(data[i], p);
    out.resize(static_cast<std::size_t>(p - begin));
}

std::size_t Utf8Codec::firstInvalid(const char* data, std::size_t size)
{
    const char* const end = data + size;
    const char* p = data;
    while (p < end)
    {
        if (end - p >= 8 && asciiWord(p))
        {
            p += 8;
            continue;
        }
        if (static_cast<unsigned char>(*p) < 0x80)
        {
            ++p;
            continue;
        }
        wchar_t c = 0;
        if (const std::size_t two = twoByte(p, end, c))
        {
            p += two;
            continue;
        }
        const std::size_t used = decodeOne(p, end, c);
        // U+FFFD itself is valid when it is written out in full.
        if (c == kReplacement &&
            !(used == 3 && static_cast<unsigned char>(p[0]) == 0xEF && static_cast<unsigned char>(p[1]) == 0xBF &&
              static_cast<unsigned char>(p[2]) == 0xBD))
            return static_cast<std::size_t>(p - data);
        p += used;
    }
    return size;
}
