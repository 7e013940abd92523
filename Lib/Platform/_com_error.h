#pragma once

#include "Win32Com.h"

#include <string>

// An HRESULT with its system text, as the compiler support class of the original platform
// offers it.
class TESSEL_EXPORT _com_error
{
public:
    explicit _com_error(HRESULT hr);

    HRESULT Error() const;
    // The code of an interface error (0x80040200..0x8004FFFF) counted from 0x80040200, else 0.
    WORD WCode() const;
    // The system text of the HRESULT without line break at its end; "IDispatch error #%d" for
    // an interface error the system has no text for, "Unknown error 0x%0lX" otherwise. The
    // text lives as long as this object.
    const char* ErrorMessage() const;

private:
    HRESULT m_hr;
    mutable std::string m_message;
};
