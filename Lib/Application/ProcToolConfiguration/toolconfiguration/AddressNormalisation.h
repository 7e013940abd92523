#pragma once

#include <ace/SString.h>

// The App2App address as it is saved: each dot-separated part as a decimal number without
// leading zeros, "0" for a part that is not a number; the number of parts is kept.
void normaliseDottedAddress(ACE_WString& address);
