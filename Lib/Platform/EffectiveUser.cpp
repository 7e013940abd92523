#include "EffectiveUser.h"

#include <pugixml.hpp>

#include <pwd.h>
#include <unistd.h>

#include <vector>

std::wstring EffectiveUser::loginName()
{
    const long bufferSize = sysconf(_SC_GETPW_R_SIZE_MAX);
    std::vector<char> buffer(bufferSize > 0 ? static_cast<size_t>(bufferSize) : 16384);
    passwd entry{};
    passwd* found = nullptr;
    if (getpwuid_r(geteuid(), &entry, buffer.data(), buffer.size(), &found) != 0 || found == nullptr)
        return std::wstring();
    return pugi::as_wide(entry.pw_name);
}
