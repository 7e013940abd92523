#include "XmlSetCodec.h"

#include "BBool.h"
#include "BDouble.h"
#include "BInt.h"
#include "BSet.h"
#include "BString.h"
#include "Utf8Codec.h"

#include <pugixml.hpp>

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cstring>
#include <cwchar>
#include <memory>
#include <system_error>

namespace
{
const char* const kRoot = "BSet";
const char* const kKey = "key";
const char* const kString = "String";
const char* const kInt = "Int";
const char* const kBool = "Bool";
const char* const kDouble = "Double";
const char* const kSet = "Set";

bool sameName(const char* name, const char* expected)
{
    while (*name != '\0' && *name == *expected)
    {
        ++name;
        ++expected;
    }
    return *name == *expected;
}

// The kind an element name stands for: a set, a scalar kind, or -1 for an unknown name.
int kindOf(const char* name)
{
    switch (name[0])
    {
    case 'S':
        return sameName(name, kSet) ? BData::eSET : sameName(name, kString) ? BData::eSTRING : -1;
    case 'I':
        return sameName(name, kInt) ? BData::eINT : -1;
    case 'D':
        return sameName(name, kDouble) ? BData::eDOUBLE : -1;
    case 'B':
        return sameName(name, kBool) ? BData::eBOOL : -1;
    default:
        return -1;
    }
}

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

// The character data of a value element, no child elements allowed. `data` and `size` point at
// the element's single text node when it has one, else at `buffers.text`.
bool elementText(const pugi::xml_node& element, XmlSetCodec::Buffers& buffers, const char*& data, std::size_t& size)
{
    data = "";
    size = 0;
    int texts = 0;
    for (pugi::xml_node child = element.first_child(); child; child = child.next_sibling())
    {
        const auto type = child.type();
        if (type == pugi::node_pcdata || type == pugi::node_cdata)
        {
            const char* value = child.value();
            const std::size_t length = std::strlen(value);
            if (texts == 0)
            {
                data = value;
                size = length;
            }
            else
            {
                if (texts == 1)
                    buffers.text.assign(data, size);
                buffers.text.append(value, length);
                data = buffers.text.data();
                size = buffers.text.size();
            }
            ++texts;
        }
        else if (type == pugi::node_element)
            return false;
    }
    return true;
}

// `size` bytes of UTF-8 at `data` decoded into `buffers.wide`; returns the character count.
std::size_t decodeText(const char* data, std::size_t size, XmlSetCodec::Buffers& buffers)
{
    if (buffers.wide.size() < size)
        buffers.wide.resize(size);
    return Utf8Codec::decodeInto(data, size, &buffers.wide[0]);
}

// The text between `first` and `last` without XML spaces at either end.
void trim(const char*& first, const char*& last)
{
    while (first < last && isXmlSpace(*first))
        ++first;
    while (last > first && isXmlSpace(last[-1]))
        --last;
}

// windows-1252's characters for the bytes 0x80 to 0x9F; the five it leaves undefined keep their
// C1 control code.
const char16_t kWindows1252High[32] = {0x20AC, 0x0081, 0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021,
                                       0x02C6, 0x2030, 0x0160, 0x2039, 0x0152, 0x008D, 0x017D, 0x008F,
                                       0x0090, 0x2018, 0x2019, 0x201C, 0x201D, 0x2022, 0x2013, 0x2014,
                                       0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, 0x009D, 0x017E, 0x0178};

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
// encoding: `data` and `size` then give the UTF-8 text, in `bytes` itself or, for a single-byte
// encoding, in `converted`. Documents in UTF-16 or UTF-32 (recognised by their first bytes) are
// left to the parser: `utf8` is then false.
bool toUtf8(const std::string& bytes, std::string& converted, const char*& data, std::size_t& size, bool& utf8,
            std::string& error)
{
    utf8 = true;
    const auto byteAt = [&bytes](std::size_t i) {
        return i < bytes.size() ? static_cast<unsigned char>(bytes[i]) : 0x100;
    };
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
        converted = singleByteToUtf8(bytes, false);
        data = converted.data();
        size = converted.size();
        return true;
    }
    if (encoding == "windows-1252" || encoding == "cp1252")
    {
        converted = singleByteToUtf8(bytes, true);
        data = converted.data();
        size = converted.size();
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
    data = bytes.data() + start;
    size = bytes.size() - start;
    return true;
}

// Whether `bytes` holds "<!DOCTYPE" or "<!ENTITY" anywhere.
bool hasDeclaration(const std::string& bytes)
{
    const char* const begin = bytes.data();
    const char* const end = begin + bytes.size();
    for (const char* p = begin; p < end;)
    {
        const auto* mark = static_cast<const char*>(std::memchr(p, '!', static_cast<std::size_t>(end - p)));
        if (mark == nullptr)
            return false;
        const std::size_t rest = static_cast<std::size_t>(end - mark);
        if (mark > begin && mark[-1] == '<' &&
            ((rest >= 8 && std::memcmp(mark, "!DOCTYPE", 8) == 0) ||
             (rest >= 7 && std::memcmp(mark, "!ENTITY", 7) == 0)))
            return true;
        p = mark + 1;
    }
    return false;
}

template <typename T>
bool parseNumber(const char* data, std::size_t size, T& value)
{
    const char* first = data;
    const char* last = data + size;
    trim(first, last);
    if (first == last)
        return false;
    const auto result = std::from_chars(first, last, value);
    return result.ec == std::errc() && result.ptr == last;
}

std::unique_ptr<BData> parseScalar(const pugi::xml_node& element, int kind, XmlSetCodec::Buffers& buffers,
                                   std::string& error)
{
    const char* name = element.name();
    const char* data = nullptr;
    std::size_t size = 0;
    if (!elementText(element, buffers, data, size))
    {
        error = std::string("element <") + name + "> holds child elements";
        return nullptr;
    }
    if (kind == BData::eSTRING)
    {
        const std::size_t length = decodeText(data, size, buffers);
        return std::make_unique<BString>(buffers.wide.data(), length);
    }
    if (kind == BData::eINT)
    {
        long value = 0;
        if (!parseNumber(data, size, value))
        {
            error = "bad Int value '" + std::string(data, size) + "'";
            return nullptr;
        }
        return std::make_unique<BInt>(value);
    }
    if (kind == BData::eDOUBLE)
    {
        double value = 0.0;
        if (!parseNumber(data, size, value))
        {
            error = "bad Double value '" + std::string(data, size) + "'";
            return nullptr;
        }
        return std::make_unique<BDouble>(value);
    }
    if (kind == BData::eBOOL)
    {
        const char* first = data;
        const char* last = data + size;
        trim(first, last);
        const std::size_t length = static_cast<std::size_t>(last - first);
        const bool isTrue = length == 4 && std::memcmp(first, "true", 4) == 0;
        if (!isTrue && !(length == 5 && std::memcmp(first, "false", 5) == 0))
        {
            error = "bad Bool value '" + std::string(data, size) + "'";
            return nullptr;
        }
        return std::make_unique<BBool>(isTrue);
    }
    error = std::string("unknown element <") + name + ">";
    return nullptr;
}

template <typename T>
void appendNumber(T value, std::string& out)
{
    char buffer[64];
    const auto result = std::to_chars(buffer, buffer + sizeof buffer, value);
    out.append(buffer, result.ptr);
}

// Appends `text` as UTF-8 with the XML escapes of element text, or of a double-quoted attribute
// value with `attribute`: &, < and the control characters always, > in text, " in attributes;
// tab, line feed and carriage return stay raw in text. False when the text holds a NUL.
bool appendEscaped(const ACE_WString& text, bool attribute, std::string& out)
{
    const wchar_t* const chars = text.fast_rep();
    const std::size_t length = text.length();
    // The longest form of one character is six bytes ("&quot;").
    const std::size_t old = out.size();
    out.resize(old + 6 * length);
    char* const begin = &out[0];
    char* p = begin + old;
    for (std::size_t i = 0; i < length; ++i)
    {
        const wchar_t c = chars[i];
        if (c >= 0x80)
        {
            p += Utf8Codec::encodeInto(c, p);
            continue;
        }
        const char* escape = nullptr;
        switch (c)
        {
        case L'\0':
            out.resize(old);
            return false;
        case L'&':
            escape = "&amp;";
            break;
        case L'<':
            escape = "&lt;";
            break;
        case L'>':
            escape = attribute ? nullptr : "&gt;";
            break;
        case L'"':
            escape = attribute ? "&quot;" : nullptr;
            break;
        default:
            break;
        }
        if (escape != nullptr)
        {
            const std::size_t size = std::strlen(escape);
            std::memcpy(p, escape, size);
            p += size;
        }
        else if (c < 0x20 && (attribute || (c != L'\t' && c != L'\n' && c != L'\r')))
        {
            const char code[5] = {'&', '#', static_cast<char>('0' + c / 10), static_cast<char>('0' + c % 10), ';'};
            std::memcpy(p, code, sizeof code);
            p += sizeof code;
        }
        else
        {
            *p++ = static_cast<char>(c);
        }
    }
    out.resize(static_cast<std::size_t>(p - begin));
    return true;
}

bool writeChildren(const BSet& set, std::string& out, int depth, std::string& error)
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
        switch (value.type())
        {
        case BData::eSTRING:
            if (std::wmemchr(static_cast<const BString&>(value).value().fast_rep(), L'\0',
                             static_cast<const BString&>(value).value().length()) != nullptr)
            {
                error = "string value holds a NUL character";
                return false;
            }
            break;
        case BData::eINT:
            name = kInt;
            break;
        case BData::eBOOL:
            name = kBool;
            break;
        case BData::eDOUBLE:
            name = kDouble;
            break;
        case BData::eSET:
            name = kSet;
            break;
        }
        out += '<';
        out += name;
        out += " key=\"";
        if (!appendEscaped(set.keyAt(i), true, out))
        {
            error = "key holds a NUL character";
            return false;
        }
        out += '"';
        switch (value.type())
        {
        case BData::eSTRING:
        {
            const ACE_WString& text = static_cast<const BString&>(value).value();
            if (text.length() == 0)
            {
                out += "/>";
                continue;
            }
            out += '>';
            appendEscaped(text, false, out);
            break;
        }
        case BData::eINT:
            out += '>';
            appendNumber(static_cast<const BInt&>(value).value(), out);
            break;
        case BData::eBOOL:
            out += static_cast<const BBool&>(value).value() ? ">true" : ">false";
            break;
        case BData::eDOUBLE:
            out += '>';
            appendNumber(static_cast<const BDouble&>(value).value(), out);
            break;
        case BData::eSET:
        {
            const auto& nested = static_cast<const BSet&>(value);
            if (nested.isEmpty())
            {
                // Still checked, so an empty set too deep is refused.
                if (!writeChildren(nested, out, depth + 1, error))
                    return false;
                out += "/>";
                continue;
            }
            out += '>';
            if (!writeChildren(nested, out, depth + 1, error))
                return false;
            break;
        }
        }
        out += "</";
        out += name;
        out += '>';
    }
    return true;
}
}

bool XmlSetCodec::parseChildren(const pugi::xml_node& container, BSet& out, int depth, Buffers& buffers,
                                std::string& error)
{
    if (depth > kMaxDepth)
    {
        error = "sets nested deeper than " + std::to_string(kMaxDepth);
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
        // The key is normally the only attribute.
        pugi::xml_attribute keyAttribute = child.first_attribute();
        if (keyAttribute && !sameName(keyAttribute.name(), kKey))
            keyAttribute = child.attribute(kKey);
        if (!keyAttribute)
        {
            error = std::string("element <") + child.name() + "> without a key";
            return false;
        }
        const char* keyText = keyAttribute.value();
        const std::size_t keyLength = decodeText(keyText, std::strlen(keyText), buffers);
        std::size_t hash = 0;
        if (out.lookUp(buffers.wide.data(), keyLength, hash) >= 0)
        {
            error = std::string("duplicate key '") + keyText + "'";
            return false;
        }
        ACE_WString key(buffers.wide.data(), keyLength);
        std::unique_ptr<BData> value;
        const int kind = kindOf(child.name());
        if (kind == BData::eSET)
        {
            auto nested = std::make_unique<BSet>();
            if (!parseChildren(child, *nested, depth + 1, buffers, error))
                return false;
            value = std::move(nested);
        }
        else
        {
            value = parseScalar(child, kind, buffers, error);
            if (!value)
                return false;
        }
        out.append(key, std::move(value), hash);
    }
    return true;
}

bool XmlSetCodec::parse(const std::string& bytes, BSet& out, std::string& error)
{
    // Document type declarations (and with them entity declarations) are refused outright.
    if (hasDeclaration(bytes))
    {
        error = "document type or entity declarations are not accepted";
        return false;
    }
    pugi::xml_document document;
    // No end-of-line normalisation: a "\r" written raw inside a value must come back as it was.
    const unsigned int flags = (pugi::parse_default & ~pugi::parse_eol) | pugi::parse_ws_pcdata | pugi::parse_doctype;
    std::string converted;
    const char* data = nullptr;
    std::size_t size = 0;
    bool utf8 = true;
    if (!toUtf8(bytes, converted, data, size, utf8, error))
        return false;
    const pugi::xml_parse_result result =
        utf8 ? document.load_buffer(data, size, flags, pugi::encoding_utf8)
             : document.load_buffer(bytes.data(), bytes.size(), flags, pugi::encoding_auto);
    if (!result)
    {
        error = std::string("malformed XML: ") + result.description() + " at offset " + std::to_string(result.offset);
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
    Buffers buffers;
    return parseChildren(root, out, 1, buffers, error);
}

bool XmlSetCodec::write(const BSet& set, std::string& out, std::string& error)
{
    // No indentation, so no whitespace is added to values. Built aside so that `out` is left
    // alone on failure.
    std::string text = "<?xml version=\"1.0\" encoding=\"UTF-8\"?><";
    text += kRoot;
    if (set.isEmpty())
        text += "/>";
    else
    {
        text += '>';
        if (!writeChildren(set, text, 1, error))
            return false;
        text += "</";
        text += kRoot;
        text += '>';
    }
    text += '\n';
    out.swap(text);
    return true;
}
