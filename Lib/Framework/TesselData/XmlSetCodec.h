#pragma once

#include <cstddef>
#include <string>

class BSet;

namespace pugi
{
class xml_node;
}

// Converts a BSet to and from the data library's XML layout (see docs/XML-FORMAT.md).
class XmlSetCodec
{
public:
    // Deepest nesting of sets accepted in either direction.
    static constexpr int kMaxDepth = 64;

    // Parses `bytes` into `out` (which should be empty). False with a reason on any fault;
    // `out` may then hold part of the content.
    static bool parse(const std::string& bytes, BSet& out, std::string& error);
    // Writes `set` as UTF-8 XML into `out`.
    static bool write(const BSet& set, std::string& out, std::string& error);

    // Scratch space reused across one parse, so values are not built through temporaries.
    struct Buffers
    {
        std::string text;
        std::wstring wide;
    };

private:
    // Reads the children of a <BSet> or <Set> element; recursion is bounded by kMaxDepth.
    static bool parseChildren(const pugi::xml_node& container, BSet& out, int depth, Buffers& buffers,
                              std::string& error);
};
