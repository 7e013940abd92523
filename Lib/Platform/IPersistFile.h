#pragma once

#include "IUnknown.h"

// Keeps an object in its file. Save(NULL, TRUE) writes the object to the file it came from.
class IPersistFile : public IUnknown
{
public:
    virtual HRESULT Save(LPCWSTR pszFileName, BOOL fRemember) = 0;

protected:
    ~IPersistFile() = default;
};
