#pragma once

#include "BSet.h"
#include "LogCapture.h"
#include "TempDir.h"
#include "WideString.h"

#include <ace/SString.h>

#include <string>

// Small helpers shared by the store tests: XML entries in the data library's layout and
// conversions between the tests' UTF-8 text and the stores' wide strings.
namespace StoreTest
{
inline ACE_WString w(const std::string& utf8)
{
    return WideString::fromUtf8(utf8);
}

inline std::string u(const ACE_WString& text)
{
    return WideString::toUtf8(text);
}

inline std::string typed(const std::string& type, const std::string& key, const std::string& value)
{
    return "<" + type + " key=\"" + key + "\">" + value + "</" + type + ">";
}

inline std::string str(const std::string& key, const std::string& value)
{
    return typed("String", key, value);
}

inline std::string set(const std::string& key, const std::string& children)
{
    return typed("Set", key, children);
}

inline std::string document(const std::string& children)
{
    return "<?xml version=\"1.0\" encoding=\"UTF-8\"?><BSet>" + children + "</BSet>";
}

// The set saved at path, read back through the data library.
inline BSet readBack(const std::string& path)
{
    BSet result(10);
    result.load(w(path));
    return result;
}

inline std::string stringAt(const BSet& set, const std::string& key)
{
    ACE_WString value;
    set.getString(w(key), value);
    return u(value);
}
}
