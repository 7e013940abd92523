#pragma once

#include "Win32Com.h"

// Makes the calling thread an apartment for its lifetime: CoInitialize when made, and
// CoUninitialize when dropped only if CoInitialize did not fail. Declare it before the
// interface holders of the same scope so that they are released first.
class ComApartmentScope
{
public:
    ComApartmentScope() : m_result(CoInitialize(nullptr)) {}
    ~ComApartmentScope()
    {
        if (SUCCEEDED(m_result))
            CoUninitialize();
    }
    ComApartmentScope(const ComApartmentScope&) = delete;
    ComApartmentScope& operator=(const ComApartmentScope&) = delete;

    HRESULT result() const { return m_result; }

private:
    HRESULT m_result;
};
