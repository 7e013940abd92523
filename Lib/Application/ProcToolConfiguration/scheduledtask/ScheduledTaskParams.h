#pragma once

#include "Export.h"

#include <ace/SString.h>

// What the update agent's scheduled task is made of, for the current user.
class TESSEL_EXPORT ScheduledTaskParams
{
public:
    // The user name is read with GetUserNameW; when that fails it stays empty (and the
    // parameters invalid).
    ScheduledTaskParams(const wchar_t* taskName, const wchar_t* applicationPath, const wchar_t* parameters,
                        const wchar_t* startHour, const wchar_t* startMinute);

    // True when all six strings are non-empty.
    bool isValid() const;
    // The name under which the task is stored: taskName "_" userName.
    ACE_WString getTaskName() const;

    const ACE_WString& taskName() const { return m_taskName; }
    const ACE_WString& applicationPath() const { return m_applicationPath; }
    const ACE_WString& parameters() const { return m_parameters; }
    const ACE_WString& startHour() const { return m_startHour; }
    const ACE_WString& startMinute() const { return m_startMinute; }
    const ACE_WString& userName() const { return m_userName; }

    // Made at library load from five empty strings: handed out when no settings can be read;
    // every operation rejects it as invalid.
    static const ScheduledTaskParams s_defaultParams;

private:
    ACE_WString m_taskName;
    ACE_WString m_applicationPath;
    ACE_WString m_parameters;
    ACE_WString m_startHour;
    ACE_WString m_startMinute;
    ACE_WString m_userName;
};
