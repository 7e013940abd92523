#pragma once

// Our COM layer: result codes, interface identifiers, apartments (counted per thread) and the
// task memory allocator. Only the in-process classes of this layer can be created.

#include "Win32Types.h"

#include <cstddef>

typedef uint64_t ULONGLONG;

#define SUCCEEDED(hr) (((HRESULT)(hr)) >= 0)
#define FAILED(hr) (((HRESULT)(hr)) < 0)
#define HRESULT_CODE(hr) ((hr)&0xFFFF)
#define HRESULT_FACILITY(hr) (((hr) >> 16) & 0x1FFF)
#define FACILITY_ITF 4
#define FACILITY_WIN32 7
#define MAKE_HRESULT(sev, fac, code) ((HRESULT)(((uint32_t)(sev) << 31) | ((uint32_t)(fac) << 16) | ((uint32_t)(code))))

// HRESULT of a Win32 error code: 0 stays 0, anything else becomes 0x8007xxxx.
inline HRESULT HRESULT_FROM_WIN32(DWORD error)
{
    return (HRESULT)error <= 0 ? (HRESULT)error : MAKE_HRESULT(1, FACILITY_WIN32, error & 0xFFFF);
}

#define S_OK ((HRESULT)0)
#define S_FALSE ((HRESULT)1)
#define E_NOTIMPL ((HRESULT)0x80004001)
#define E_NOINTERFACE ((HRESULT)0x80004002)
#define E_POINTER ((HRESULT)0x80004003)
#define E_ABORT ((HRESULT)0x80004004)
#define E_FAIL ((HRESULT)0x80004005)
#define E_UNEXPECTED ((HRESULT)0x8000FFFF)
#define E_ACCESSDENIED ((HRESULT)0x80070005)
#define E_HANDLE ((HRESULT)0x80070006)
#define E_OUTOFMEMORY ((HRESULT)0x8007000E)
#define E_INVALIDARG ((HRESULT)0x80070057)
#define CLASS_E_NOAGGREGATION ((HRESULT)0x80040110)
#define REGDB_E_CLASSNOTREG ((HRESULT)0x80040154)
#define CO_E_NOTINITIALIZED ((HRESULT)0x800401F0)
#define RPC_E_CHANGED_MODE ((HRESULT)0x80010106)

#define CLSCTX_INPROC_SERVER 0x1

struct GUID
{
    uint32_t Data1;
    uint16_t Data2;
    uint16_t Data3;
    uint8_t Data4[8];
};
typedef GUID IID;
typedef GUID CLSID;
typedef const IID& REFIID;
typedef const CLSID& REFCLSID;

inline bool operator==(const GUID& a, const GUID& b)
{
    if (a.Data1 != b.Data1 || a.Data2 != b.Data2 || a.Data3 != b.Data3)
        return false;
    for (int i = 0; i < 8; ++i)
        if (a.Data4[i] != b.Data4[i])
            return false;
    return true;
}
inline bool operator!=(const GUID& a, const GUID& b)
{
    return !(a == b);
}
inline bool IsEqualGUID(const GUID& a, const GUID& b)
{
    return a == b;
}

inline constexpr IID IID_IUnknown = {0x00000000, 0x0000, 0x0000, {0xC0, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x46}};

// Makes the calling thread an apartment: S_OK the first time, S_FALSE when it already is one.
// Every successful call (S_OK or S_FALSE) must be matched by one CoUninitialize.
TESSEL_EXPORT HRESULT CoInitialize(LPVOID reserved);
TESSEL_EXPORT void CoUninitialize();
// How many CoInitialize calls of this thread are not yet matched (0: not an apartment).
TESSEL_EXPORT int CoGetInitializeCount();

class IUnknown;
// Creates an object of one of this layer's classes (the task scheduler). CO_E_NOTINITIALIZED
// outside an apartment, REGDB_E_CLASSNOTREG for an unknown class, E_NOINTERFACE for an
// interface the class does not offer.
TESSEL_EXPORT HRESULT CoCreateInstance(REFCLSID rclsid, IUnknown* outer, DWORD clsContext, REFIID riid, LPVOID* ppv);

// Memory handed across interfaces (strings returned by tasks).
TESSEL_EXPORT LPVOID CoTaskMemAlloc(size_t size);
TESSEL_EXPORT void CoTaskMemFree(LPVOID pv);
