#include "_com_error.h"

#include "TaskSchedulerTypes.h"
#include "Win32ErrnoMap.h"

#include <cstdio>
#include <cstring>

namespace
{
struct Text
{
    uint32_t code;
    const char* text;
};

// Texts of the codes of this layer that are not POSIX errors.
constexpr Text kTexts[] = {
    {0x00000000u, "The operation completed successfully."},
    {0x00000001u, "The operation completed, with nothing to do."},
    {0x80004001u, "Not implemented."},
    {0x80004002u, "No such interface supported."},
    {0x80004003u, "Invalid pointer."},
    {0x80004004u, "Operation aborted."},
    {0x80004005u, "Unspecified error."},
    {0x8000FFFFu, "Catastrophic failure."},
    {0x80010106u, "Cannot change thread mode after it is set."},
    {0x80040110u, "Class does not support aggregation."},
    {0x80040111u, "The class is not available."},
    {0x80040154u, "Class not registered."},
    {0x800401F0u, "CoInitialize has not been called."},
    {0x00041300u, "The task is ready to run at its next scheduled time."},
    {0x00041301u, "The task is currently running."},
    {0x00041302u, "The task will not run at the scheduled times because it has been disabled."},
    {0x00041303u, "The task has not yet run."},
    {0x00041304u, "There are no more runs scheduled for this task."},
    {0x00041305u, "One or more of the properties needed to run this task on a schedule have not been set."},
    {0x00041306u, "The last run of the task was terminated by the user."},
    {0x00041307u, "The task has no triggers, or its triggers are disabled."},
    {0x80041309u, "A task's trigger is not found."},
    {0x8004130Au, "One or more of the properties needed to run this task have not been set."},
    {0x8004130Eu, "The object is either an invalid task object or is not a task object."},
    {0x80041313u, "The task object version is either unsupported or invalid."},
    {0x80041315u, "The Task Scheduler service is not running."},
    // Win32 codes without a POSIX counterpart.
    {0x8007001Fu, "A device attached to the system is not functioning."},
    {0x8007041Cu, "The requested control is not valid for this service."},
    {0x80070424u, "The specified service does not exist as an installed service."},
    {0x80070426u, "The service has not been started."},
    {0x80070534u, "No mapping between account names and security IDs was done."},
    {0x800706BAu, "The RPC server is unavailable."},
};
}

_com_error::_com_error(HRESULT hr) : m_hr(hr)
{
}

HRESULT _com_error::Error() const
{
    return m_hr;
}

WORD _com_error::WCode() const
{
    const uint32_t code = static_cast<uint32_t>(m_hr);
    return code >= 0x80040200u && code <= 0x8004FFFFu ? static_cast<WORD>(code - 0x80040200u) : 0;
}

const char* _com_error::ErrorMessage() const
{
    const uint32_t code = static_cast<uint32_t>(m_hr);
    for (const Text& entry : kTexts)
    {
        if (entry.code == code)
        {
            m_message = entry.text;
            return m_message.c_str();
        }
    }
    if (HRESULT_FACILITY(m_hr) == FACILITY_WIN32 && FAILED(m_hr))
    {
        const int value = Win32ErrnoMap::errnoFromWin32Error(static_cast<DWORD>(HRESULT_CODE(m_hr)));
        if (value != 0)
        {
            char buffer[256];
            // GNU strerror_r: the text may or may not be put into the buffer.
            m_message = strerror_r(value, buffer, sizeof buffer);
            return m_message.c_str();
        }
    }
    char buffer[64];
    if (WCode() != 0)
        std::snprintf(buffer, sizeof buffer, "IDispatch error #%d", static_cast<int>(WCode()));
    else
        std::snprintf(buffer, sizeof buffer, "Unknown error 0x%0lX", static_cast<unsigned long>(code));
    m_message = buffer;
    return m_message.c_str();
}
