#pragma once

#include <cstddef>
#include <string>

// UTF-8 <-> UTF-32 (wchar_t) coding shared by the data library. Invalid input becomes U+FFFD.
class Utf8Codec
{
public:
    static constexpr wchar_t kReplacement = 0xFFFD;

    // Decodes one character at `p`. `end` bounds the input; with a null `end` the input is
    // NUL-terminated and decoding never reads past the terminator. Returns the bytes used (>= 1)
    // or 0 at the end of the input.
    static std::size_t decodeOne(const char* p, const char* end, wchar_t& out);
    static void decode(const char* data, std::size_t size, std::wstring& out);
    // Decodes `size` bytes into `out`, which has room for `size` characters; returns how many
    // were written.
    static std::size_t decodeInto(const char* data, std::size_t size, wchar_t* out);
    // Offset of the first byte that is not valid UTF-8, or `size` when all of it is.
    static std::size_t firstInvalid(const char* data, std::size_t size);
    // Appends the UTF-8 form of `c`; surrogates and values above U+10FFFF give U+FFFD.
    static void encodeOne(wchar_t c, std::string& out);
    // Writes the UTF-8 form of `c` (at most four bytes) at `out`; returns its length.
    static std::size_t encodeInto(wchar_t c, char* out);
    static void encode(const wchar_t* data, std::size_t size, std::string& out);
};
