#pragma once

#include "Export.h"

#include <ace/SString.h>

// Identifier of a component or of a data-manager value:
//   scheme ":" library "?" query ["#" parameter]     e.g. "tessel:DM?DataManager"
//   "data:" path                                     e.g. "data:/Auto/SystemMenu/NameEdit"
class TESSEL_EXPORT ID
{
public:
    static const ID null;

    ID();
    explicit ID(const ACE_WString& text);
    explicit ID(const wchar_t* text);
    explicit ID(const char* text);

    // The whole text, as given.
    const ACE_WString& getString() const;
    bool isNull() const;

    ACE_WString getScheme() const;
    // The library part; empty when the text has no "?".
    ACE_WString getLibrary() const;
    // The query without the "#" parameter; false when the text has no "?".
    bool getQuery(ACE_WString& query) const;
    // The text after "#"; empty when there is none.
    ACE_WString getParameter() const;
    // For "data:" identifiers: the text after "data:" (for example "/Auto/SystemMenu/NameEdit").
    ACE_WString getPath() const;

    bool operator==(const ID& other) const;
    bool operator!=(const ID& other) const;
    bool operator<(const ID& other) const;

private:
    ACE_WString m_text;
};
