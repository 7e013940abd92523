#pragma once

#include "ITaskTrigger.h"

// The scheduling part of a task: triggers, account, flags and state.
class IScheduledWorkItem : public IUnknown
{
public:
    virtual HRESULT CreateTrigger(WORD* piNewTrigger, ITaskTrigger** ppTrigger) = 0;
    // Removes one trigger; those after it move down by one index.
    virtual HRESULT DeleteTrigger(WORD iTrigger) = 0;
    virtual HRESULT GetTriggerCount(WORD* pwCount) = 0;
    virtual HRESULT GetTrigger(WORD iTrigger, ITaskTrigger** ppTrigger) = 0;
    virtual HRESULT GetStatus(HRESULT* phrStatus) = 0;
    virtual HRESULT SetAccountInformation(LPCWSTR pwszAccountName, LPCWSTR pwszPassword) = 0;
    virtual HRESULT SetFlags(DWORD dwFlags) = 0;
    virtual HRESULT GetFlags(DWORD* pdwFlags) = 0;

protected:
    ~IScheduledWorkItem() = default;
};
