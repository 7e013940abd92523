#include "BDataUtilities.h"

int BDataUtilities::removeBSetSubElement(BSet& set, const ACE_WString& key)
{
    return set.remove(key);
}
