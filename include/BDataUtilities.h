#pragma once

#include "BSet.h"

class TESSEL_EXPORT BDataUtilities
{
public:
    // Removes `key` from `set`; 0 on success, non-zero when the key is absent.
    static int removeBSetSubElement(BSet& set, const ACE_WString& key);
};
