#include "Win32System.h"

#include "TaskSchedulerFaults.h"
#include "Win32ErrnoMap.h"

#include <pugixml.hpp>

#include <pwd.h>
#include <sys/time.h>
#include <unistd.h>

#include <climits>
#include <ctime>
#include <cwchar>
#include <string>
#include <vector>

BOOL GetUserNameW(LPWSTR lpBuffer, DWORD* pcbBuffer)
{
    if (const auto fault = TaskSchedulerFaults::take(TaskSchedulerFaults::eGetUserName))
    {
        SetLastError(static_cast<DWORD>(fault->result));
        return FALSE;
    }
    if (pcbBuffer == nullptr || (lpBuffer == nullptr && *pcbBuffer != 0))
    {
        SetLastError(ERROR_INVALID_PARAMETER);
        return FALSE;
    }

    long bufferSize = sysconf(_SC_GETPW_R_SIZE_MAX);
    std::vector<char> buffer(bufferSize > 0 ? static_cast<size_t>(bufferSize) : 16384);
    passwd entry{};
    passwd* found = nullptr;
    const int error = getpwuid_r(geteuid(), &entry, buffer.data(), buffer.size(), &found);
    if (found == nullptr)
    {
        SetLastError(error != 0 ? Win32ErrnoMap::win32ErrorFromErrno(error) : ERROR_NONE_MAPPED);
        return FALSE;
    }

    const std::wstring name = pugi::as_wide(entry.pw_name);
    const DWORD needed = static_cast<DWORD>(name.size() + 1);
    if (*pcbBuffer < needed)
    {
        *pcbBuffer = needed;
        SetLastError(ERROR_INSUFFICIENT_BUFFER);
        return FALSE;
    }
    wmemcpy(lpBuffer, name.c_str(), needed);
    *pcbBuffer = needed;
    return TRUE;
}

void GetLocalTime(LPSYSTEMTIME lpSystemTime)
{
    if (lpSystemTime == nullptr)
        return;
    timeval now{};
    gettimeofday(&now, nullptr);
    const time_t seconds = now.tv_sec;
    tm local{};
    localtime_r(&seconds, &local);
    lpSystemTime->wYear = static_cast<WORD>(local.tm_year + 1900);
    lpSystemTime->wMonth = static_cast<WORD>(local.tm_mon + 1);
    lpSystemTime->wDayOfWeek = static_cast<WORD>(local.tm_wday);
    lpSystemTime->wDay = static_cast<WORD>(local.tm_mday);
    lpSystemTime->wHour = static_cast<WORD>(local.tm_hour);
    lpSystemTime->wMinute = static_cast<WORD>(local.tm_min);
    lpSystemTime->wSecond = static_cast<WORD>(local.tm_sec);
    lpSystemTime->wMilliseconds = static_cast<WORD>(now.tv_usec / 1000);
}

int _wtoi(const wchar_t* str)
{
    if (str == nullptr)
        return 0;
    const long value = std::wcstol(str, nullptr, 10);
    if (value > INT_MAX)
        return INT_MAX;
    if (value < INT_MIN)
        return INT_MIN;
    return static_cast<int>(value);
}
