// XmlSetCodec::parse on the input. What parses must write, parse again and write the same bytes.

#include "BSet.h"
#include "FuzzSupport.h"
#include "XmlSetCodec.h"

#include <cstddef>
#include <cstdint>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string bytes(reinterpret_cast<const char*>(data), size);
    BSet first;
    std::string error;
    if (!XmlSetCodec::parse(bytes, first, error))
    {
        FUZZ_CHECK(!error.empty());
        return 0;
    }
    std::string written;
    FUZZ_CHECK(XmlSetCodec::write(first, written, error));
    BSet second;
    const bool parsedAgain = XmlSetCodec::parse(written, second, error);
    if (!parsedAgain)
        std::fprintf(stderr, "second parse: %s\n", error.c_str());
    FUZZ_CHECK(parsedAgain);
    std::string writtenAgain;
    FUZZ_CHECK(XmlSetCodec::write(second, writtenAgain, error));
    FUZZ_CHECK(writtenAgain == written);
    return 0;
}
