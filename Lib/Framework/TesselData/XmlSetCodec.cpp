#include "XmlSetCodec.h"

#include "BBool.h"
#include "BDouble.h"
#include "BInt.h"
#include "BSet.h"
#include "BString.h"
#include "Utf8Codec.h"
#include "WideString.h"

#include <pugixml.hpp>

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cstring>
#include <memory>
#include <system_error>
#include <unordered_set>

namespace
{
const char* const kRoot = "BSet";
const char* const kKey = "key";
const char* const kString = "String";
const char* const kInt = "Int";
const char* const kBool = "Bool";
const char* const kDouble = "Double";
const char* const kSet = "Set";

bool isXmlSpace(char c)
{
    return c == ' ' || c == '\t' || c == '\n' || c == '\r';
}

bool isBlank(const char* text)
{
    for (; *text != '\0'; ++text)
        if (!isXmlSpace(*text))
            return false;
    return true;
}

// The text of a value element: its character data, no child elements allowed.
bool elementText(const pugi::xml_node& element, std::string& text)
{
    text.clear();
    for (pugi::xml_node child = element.first_child(); child; child = child.next_sibling())
    {
        const auto type = child.type();
        if (type == pugi::node_pcdata || type == pugi::node_cdata)
            text += child.value();
        else if (type == pugi::node_element)
            return false;
    }
    return true;
}

std::string trimmed(const std::string& text)
{
    std::size_t begin = 0;
    std::size_t end = text.size();
    while (begin < end && isXmlSpace(text[begin]))
        ++begin;
    while (end > begin && isXmlSpace(text[end - 1]))
        --end;
    return text.substr(begin, end - begin);
}

// windows-1252's characters for the bytes 0x80 to 0x9F; the five it leaves undefined keep their
// C1 control code.
const char16_t kWindows1252High[32] = {
    0x20AC, 0x0081, 0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021, 0x02C6, 0x2030, 0x0160,
    0x2039, 0x0152, 0x008D, 0x017D, 0x008F, 0x0090, 0x2018, 0x2019, 0x201C, 0x201D, 0x2022,
    0x2013, 0x2014, 0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, 0x009D, 0x017E, 0x0178};

std::string lowerAscii(std::string text)
{
    std::transform(text.begin(), text.end(), text.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    return text;
}

// The encoding named by the XML declaration at the start of `bytes`, lower case; empty when none.
std::string declaredEncoding(const std::string& bytes)
{
    if (bytes.compare(0, 5, "<?xml") != 0)
        return std::string();
    const std::size_t close = bytes.find("?>");
    const std::string declaration = bytes.substr(0, close);
    std::size_t at = declaration.find("encoding");
    if (at == std::string::npos)
        return std::string();
    at = declaration.find_first_of("\"'", at);
    if (at == std::string::npos)
        return std::string();
    const std::size_t end = declaration.find(declaration[at], at + 1);
    if (end == std::string::npos)
        return std::string();
    return lowerAscii(declaration.substr(at + 1, end - at - 1));
}

// Each byte of a single-byte encoding as UTF-8: ISO-8859-1, or windows-1252 with `windows`.
std::string singleByteToUtf8(const std::string& bytes, bool windows)
{
    std::string out;
    out.reserve(bytes.size() + bytes.size() / 8);
    for (const char byte : bytes)
    {
        const auto value = static_cast<unsigned char>(byte);
        const wchar_t c =
            windows && value >= 0x80 && value < 0xA0 ? static_cast<wchar_t>(kWindows1252High[value - 0x80]) : value;
        Utf8Codec::encodeOne(c, out);
    }
    return out;
}

// Brings the document to UTF-8 for the parser, honouring a byte-order mark or the declared
// encoding. Documents in UTF-16 or UTF-32 (recognised by their first bytes) are left to the
// parser: `utf8` is then false and `out` untouched.
bool toUtf8(const std::string& bytes, std::string& out, bool& utf8, std::string& error)
{
    utf8 = true;
    const auto byteAt = [&bytes](std::size_t i) { return i < bytes.size() ? static_cast<unsigned char>(bytes[i]) : 0x100; };
    std::size_t start = 0;
    if (byteAt(0) == 0xEF && byteAt(1) == 0xBB && byteAt(2) == 0xBF)
        start = 3;
    else if ((byteAt(0) == 0xFE && byteAt(1) == 0xFF) || (byteAt(0) == 0xFF && byteAt(1) == 0xFE) ||
             byteAt(0) == 0x00 || byteAt(1) == 0x00)
    {
        utf8 = false;
        return true;
    }
    const std::string encoding = start == 0 ? declaredEncoding(bytes) : std::string("utf-8");
    if (encoding == "iso-8859-1" || encoding == "iso8859-1" || encoding == "latin1" || encoding == "latin-1")
    {
        out = singleByteToUtf8(bytes, false);
        return true;
    }
    if (encoding == "windows-1252" || encoding == "cp1252")
    {
        out = singleByteToUtf8(bytes, true);
        return true;
    }
    if (!encoding.empty() && encoding != "utf-8" && encoding != "utf8" && encoding != "us-ascii")
    {
        error = "unsupported encoding '" + encoding + "'";
        return false;
    }
    const std::size_t invalid = Utf8Codec::firstInvalid(bytes.data() + start, bytes.size() - start);
    if (invalid != bytes.size() - start)
    {
        error = "invalid UTF-8 at byte offset " + std::to_string(start + invalid);
        return false;
    }
    out.assign(bytes, start, std::string::npos);
    return true;
}

template <typename T>
bool parseNumber(const std::string& text, T& value)
{
    const std::string digits = trimmed(text);
    if (digits.empty())
        return false;
    const char* first = digits.data();
    const char* last = digits.data() + digits.size();
    const auto result = std::from_chars(first, last, value);
    return result.ec == std::errc() && result.ptr == last;
}

std::unique_ptr<BData> parseScalar(const pugi::xml_node& element, const std::string& name, std::string& error)
{
    std::string text;
    if (!elementText(element, text))
    {
        error = "element <" + name + "> holds child elements";
        return nullptr;
    }
    if (name == kString)
        return std::make_unique<BString>(WideString::fromUtf8(text));
    if (name == kInt)
    {
        long value = 0;
        if (!parseNumber(text, value))
        {
            error = "bad Int value '" + text + "'";
            return nullptr;
        }
        return std::make_unique<BInt>(value);
    }
    if (name == kDouble)
    {
        double value = 0.0;
        if (!parseNumber(text, value))
        {
            error = "bad Double value '" + text + "'";
            return nullptr;
        }
        return std::make_unique<BDouble>(value);
    }
    if (name == kBool)
    {
        const std::string word = trimmed(text);
        if (word != "true" && word != "false")
        {
            error = "bad Bool value '" + text + "'";
            return nullptr;
        }
        return std::make_unique<BBool>(word == "true");
    }
    error = "unknown element <" + name + ">";
    return nullptr;
}

// Reads the children of a <BSet> or <Set> element; recursion is bounded by kMaxDepth.
bool parseChildren(const pugi::xml_node& container, BSet& out, int depth, std::string& error)
{
    if (depth > XmlSetCodec::kMaxDepth)
    {
        error = "sets nested deeper than " + std::to_string(XmlSetCodec::kMaxDepth);
        return false;
    }
    for (pugi::xml_node child = container.first_child(); child; child = child.next_sibling())
    {
        const auto type = child.type();
        if (type == pugi::node_pcdata || type == pugi::node_cdata)
        {
            if (!isBlank(child.value()))
            {
                error = "text outside a value element";
                return false;
            }
            continue;
        }
        if (type != pugi::node_element)
            continue; // comments, processing instructions
        const std::string name = child.name();
        const pugi::xml_attribute keyAttribute = child.attribute(kKey);
        if (!keyAttribute)
        {
            error = "element <" + name + "> without a key";
            return false;
        }
        const ACE_WString key = WideString::fromUtf8(keyAttribute.value());
        if (out.contains(key))
        {
            error = std::string("duplicate key '") + keyAttribute.value() + "'";
            return false;
        }
        std::unique_ptr<BData> value;
        if (name == kSet)
        {
            auto nested = std::make_unique<BSet>();
            if (!parseChildren(child, *nested, depth + 1, error))
                return false;
            value = std::move(nested);
        }
        else
        {
            value = parseScalar(child, name, error);
            if (!value)
                return false;
        }
        out.put(key, std::move(value));
    }
    return true;
}

template <typename T>
std::string formatNumber(T value)
{
    char buffer[64];
    const auto result = std::to_chars(buffer, buffer + sizeof buffer, value);
    return std::string(buffer, result.ptr);
}

bool writeChildren(const BSet& set, pugi::xml_node& container, int depth, std::string& error)
{
    if (depth > XmlSetCodec::kMaxDepth)
    {
        error = "sets nested deeper than " + std::to_string(XmlSetCodec::kMaxDepth);
        return false;
    }
    for (int i = 0; i < set.size(); ++i)
    {
        const BData& value = set.valueAt(i);
        const char* name = kString;
        std::string text;
        switch (value.type())
        {
        case BData::eSTRING:
            text = WideString::toUtf8(static_cast<const BString&>(value).value());
            if (text.find('\0') != std::string::npos)
            {
                error = "string value holds a NUL character";
                return false;
            }
            break;
        case BData::eINT:
            name = kInt;
            text = formatNumber(static_cast<const BInt&>(value).value());
            break;
        case BData::eBOOL:
            name = kBool;
            text = static_cast<const BBool&>(value).value() ? "true" : "false";
            break;
        case BData::eDOUBLE:
            name = kDouble;
            text = formatNumber(static_cast<const BDouble&>(value).value());
            break;
        case BData::eSET:
            name = kSet;
            break;
        }
        const std::string key = WideString::toUtf8(set.keyAt(i));
        if (key.find('\0') != std::string::npos)
        {
            error = "key holds a NUL character";
            return false;
        }
        pugi::xml_node element = container.append_child(name);
        element.append_attribute(kKey).set_value(key.c_str());
        if (value.type() == BData::eSET)
        {
            if (!writeChildren(static_cast<const BSet&>(value), element, depth + 1, error))
                return false;
        }
        else if (!text.empty())
        {
            element.append_child(pugi::node_pcdata).set_value(text.c_str());
        }
    }
    return true;
}

class StringWriter : public pugi::xml_writer
{
public:
    explicit StringWriter(std::string& out) : m_out(out) {}
    void write(const void* data, size_t size) override { m_out.append(static_cast<const char*>(data), size); }

private:
    std::string& m_out;
};
}

bool XmlSetCodec::parse(const std::string& bytes, BSet& out, std::string& error)
{
    // Document type declarations (and with them entity declarations) are refused outright.
    if (bytes.find("<!DOCTYPE") != std::string::npos || bytes.find("<!ENTITY") != std::string::npos)
    {
        error = "document type or entity declarations are not accepted";
        return false;
    }
    pugi::xml_document document;
    // No end-of-line normalisation: a "\r" written raw inside a value must come back as it was.
    const unsigned int flags =
        (pugi::parse_default & ~pugi::parse_eol) | pugi::parse_ws_pcdata | pugi::parse_doctype;
    std::string utf8Bytes;
    bool utf8 = true;
    if (!toUtf8(bytes, utf8Bytes, utf8, error))
        return false;
    const pugi::xml_parse_result result =
        utf8 ? document.load_buffer(utf8Bytes.data(), utf8Bytes.size(), flags, pugi::encoding_utf8)
             : document.load_buffer(bytes.data(), bytes.size(), flags, pugi::encoding_auto);
    if (!result)
    {
        error = std::string("malformed XML: ") + result.description() + " at offset " +
                std::to_string(result.offset);
        return false;
    }
    pugi::xml_node root;
    for (pugi::xml_node node = document.first_child(); node; node = node.next_sibling())
    {
        switch (node.type())
        {
        case pugi::node_doctype:
            error = "document type declarations are not accepted";
            return false;
        case pugi::node_element:
            if (root)
            {
                error = "more than one root element";
                return false;
            }
            root = node;
            break;
        case pugi::node_pcdata:
        case pugi::node_cdata:
            if (!isBlank(node.value()))
            {
                error = "text outside the root element";
                return false;
            }
            break;
        default:
            break;
        }
    }
    if (!root || std::strcmp(root.name(), kRoot) != 0)
    {
        error = std::string("root element is not <") + kRoot + ">";
        return false;
    }
    return parseChildren(root, out, 1, error);
}

bool XmlSetCodec::write(const BSet& set, std::string& out, std::string& error)
{
    pugi::xml_document document;
    pugi::xml_node declaration = document.append_child(pugi::node_declaration);
    declaration.append_attribute("version").set_value("1.0");
    declaration.append_attribute("encoding").set_value("UTF-8");
    pugi::xml_node root = document.append_child(kRoot);
    if (!writeChildren(set, root, 1, error))
        return false;
    out.clear();
    StringWriter writer(out);
    document.save(writer, "", pugi::format_raw, pugi::encoding_utf8);
    out += '\n';
    return true;
}
