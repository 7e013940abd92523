#pragma once

#include "Export.h"

#include <ace/SString.h>

#include <memory>
#include <string>

// Base of the typed values of the data library.
class TESSEL_EXPORT BData
{
public:
    enum Type
    {
        eSET,
        eSTRING,
        eINT,
        eBOOL,
        eDOUBLE
    };

    virtual ~BData();

    virtual Type type() const = 0;
    virtual std::unique_ptr<BData> clone() const = 0;
    // Replaces this value by a copy of `other`; false (nothing changed) when the types differ.
    virtual bool assign(const BData& other) = 0;
    virtual bool equals(const BData& other) const = 0;

    // Reads the XML file at `path` into this value (only sets can be loaded). A missing,
    // unreadable, malformed or hostile file gives false and leaves the value as it was.
    bool load(const ACE_WString& path);
    // Writes this value as XML to `path`, atomically: temporary file, flush, rename.
    // `flag` is kept for callers; it changes nothing. False leaves any old file untouched.
    bool save(const ACE_WString& path, bool flag) const;
    // The same, handing back in `written` the bytes the file now holds (empty on failure).
    bool save(const ACE_WString& path, bool flag, std::string& written) const;

protected:
    BData() = default;
    BData(const BData&) = default;
    BData& operator=(const BData&) = default;
};
