#pragma once

#include "Win32Com.h"

// Base of every interface: identity and reference counting. An object lives as long as one
// reference to it is held; Release of the last reference destroys it.
class IUnknown
{
public:
    virtual HRESULT QueryInterface(REFIID riid, void** ppvObject) = 0;
    virtual ULONG AddRef() = 0;
    virtual ULONG Release() = 0;

protected:
    ~IUnknown() = default;
};
