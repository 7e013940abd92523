#pragma once

#include "IScheduledWorkItem.h"

// A task: the program it starts and the program's parameters. Strings handed out are freed
// by the caller with CoTaskMemFree.
class ITask : public IScheduledWorkItem
{
public:
    virtual HRESULT SetApplicationName(LPCWSTR pwszApplicationName) = 0;
    virtual HRESULT GetApplicationName(LPWSTR* ppwszApplicationName) = 0;
    virtual HRESULT SetParameters(LPCWSTR pwszParameters) = 0;
    virtual HRESULT GetParameters(LPWSTR* ppwszParameters) = 0;

protected:
    ~ITask() = default;
};
