#include "ScheduledTaskParams.h"

#include "CScheduledTaskHelper.h"
#include "Win32System.h"

namespace
{
const wchar_t* orEmpty(const wchar_t* text)
{
    return text != nullptr ? text : L"";
}
}

const ScheduledTaskParams ScheduledTaskParams::s_defaultParams(L"", L"", L"", L"", L"");

ScheduledTaskParams::ScheduledTaskParams(const wchar_t* taskName, const wchar_t* applicationPath,
                                         const wchar_t* parameters, const wchar_t* startHour,
                                         const wchar_t* startMinute)
    : m_taskName(orEmpty(taskName)),
      m_applicationPath(orEmpty(applicationPath)),
      m_parameters(orEmpty(parameters)),
      m_startHour(orEmpty(startHour)),
      m_startMinute(orEmpty(startMinute))
{
    wchar_t userName[UNLEN + 1] = {};
    DWORD size = UNLEN + 1;
    if (!GetUserNameW(userName, &size))
    {
        if (s_logFunction != nullptr)
            s_logFunction(16, 0, "ProcToolConfiguration", "ProcToolConfiguration.dll", "OnLineUpdateCommand",
                          L"CScheduledTaskHelper::ScheduledTaskParams::ScheduledTaskParams: GetUserNameW failed with "
                          L"last error '%lu'",
                          static_cast<unsigned long>(GetLastError()));
        return;
    }
    m_userName = userName;
}

bool ScheduledTaskParams::isValid() const
{
    return !m_taskName.empty() && !m_applicationPath.empty() && !m_parameters.empty() && !m_startHour.empty() &&
           !m_startMinute.empty() && !m_userName.empty();
}

ACE_WString ScheduledTaskParams::getTaskName() const
{
    return m_taskName + ACE_WString(L"_") + m_userName;
}
