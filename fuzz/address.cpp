// normaliseDottedAddress on the input as UTF-8: as many dot-separated parts as before, each a
// decimal number without leading zeros (a minus sign is kept), and nothing but digits, minus
// signs and dots; normalising again changes nothing.

#include "AddressNormalisation.h"
#include "FuzzSupport.h"
#include "WideString.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    ACE_WString address = WideString::fromUtf8(std::string(reinterpret_cast<const char*>(data), size));
    const std::wstring before = WideString::toStd(address);
    normaliseDottedAddress(address);
    const std::wstring after = WideString::toStd(address);
    if (std::count(after.begin(), after.end(), L'.') != std::count(before.begin(), before.end(), L'.') ||
        !std::all_of(after.begin(), after.end(),
                     [](wchar_t c) { return c == L'.' || c == L'-' || (c >= L'0' && c <= L'9'); }))
    {
        std::fprintf(stderr, "'%s' gave '%s'\n", WideString::toUtf8(before.c_str()).c_str(),
                     WideString::toUtf8(after.c_str()).c_str());
        __builtin_trap();
    }
    std::size_t start = 0;
    while (true)
    {
        const std::size_t dot = std::min(after.find(L'.', start), after.size());
        std::wstring part = after.substr(start, dot - start);
        if (!part.empty() && part[0] == L'-')
            part.erase(0, 1);
        FUZZ_CHECK(!part.empty() && part.find(L'-') == std::wstring::npos && (part == L"0" || part[0] != L'0'));
        if (dot == after.size())
            break;
        start = dot + 1;
    }
    ACE_WString again = address;
    normaliseDottedAddress(again);
    FUZZ_CHECK(again == address);
    return 0;
}
