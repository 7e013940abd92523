#pragma once

#include "Export.h"

#include <ace/SString.h>

#include <vector>

// An ordered list of strings, as handed out by BSet::getAllKeys.
class TESSEL_EXPORT StringSet
{
public:
    StringSet();

    int length() const;
    // 0 on success; non-zero for an index out of range (value untouched).
    int getAt(int index, ACE_WString& value) const;
    void add(const ACE_WString& value);

private:
    std::vector<ACE_WString> m_items;
};
