#pragma once

#include "Win32Com.h"

#include <optional>

// Fault injection for tests: makes a chosen call of the COM, task scheduler, service or user
// layer give a chosen result. Shared by every thread; clear() removes every fault.
class TESSEL_EXPORT TaskSchedulerFaults
{
public:
    enum Call
    {
        eCoInitialize,
        eCoCreateInstance,
        eActivate,
        eNewWorkItem,
        eDelete,
        eQueryInterface,
        eGetTriggerCount,
        eDeleteTrigger,
        eCreateTrigger,
        eGetTrigger,
        eGetStatus,
        eSetAccountInformation,
        eSetFlags,
        eGetFlags,
        eSetApplicationName,
        eGetApplicationName,
        eSetParameters,
        eGetParameters,
        eTriggerSetTrigger,
        eTriggerGetTrigger,
        eSave,
        eOpenSCManager,
        eOpenService,
        eControlService,
        eGetUserName,
        eCALL_COUNT
    };

    // What a faulted call hands out through its pointer out parameter.
    enum Output
    {
        eAUTO,  // an object (the real one) on a success result, null on a failure result
        eNULL,  // always null
        eOBJECT // always an object: the real one when the call can make it, else a blank one
    };

    struct Fault
    {
        // The call's result. For the Win32 calls (service, user name) a failure with this
        // value as last error.
        HRESULT result = E_FAIL;
        Output output = eAUTO;
        // Matching calls let through before the fault applies.
        int skip = 0;
        // How many calls it applies to; -1 for all of them.
        int times = -1;
    };

    static void inject(Call call, const Fault& fault);
    static void inject(Call call, HRESULT result, Output output = eAUTO);
    static void clear();
    // The fault that applies to this call now, if any (counts the call).
    static std::optional<Fault> take(Call call);

    // Runs `real` (returning HRESULT) unless a fault applies: a failure result is returned
    // without running it, a success result after running it.
    template <class Real>
    static HRESULT apply(Call call, Real real)
    {
        const auto fault = take(call);
        if (!fault)
            return real();
        if (SUCCEEDED(fault->result))
            real();
        return fault->result;
    }

    // For a call handing out a pointer through `out`: `real(T** out)` makes the real one,
    // `blank()` a stand-in (owned by the caller) when the fault asks for an object the real
    // call cannot give.
    template <class T, class Real, class Blank>
    static HRESULT applyOut(Call call, T** out, Real real, Blank blank)
    {
        const auto fault = take(call);
        if (!fault)
            return real(out);
        if (out == nullptr)
            return fault->result;
        *out = nullptr;
        const bool wantObject = fault->output == eOBJECT || (fault->output == eAUTO && SUCCEEDED(fault->result));
        if (wantObject)
        {
            T* object = nullptr;
            if (FAILED(real(&object)) || object == nullptr)
                object = blank();
            *out = object;
        }
        return fault->result;
    }
};
