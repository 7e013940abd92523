// TaskFile::load of the input written as a task file: S_OK with a record that passes the task
// rules, or one of the documented error codes with the caller's record untouched.

#include "EffectiveUser.h"
#include "FuzzSupport.h"
#include "TaskFile.h"
#include "TaskRecord.h"
#include "TaskSchedulerSettings.h"
#include "Win32Com.h"

#include <cstddef>
#include <cstdint>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    static const FuzzFolder folder;
    static const std::wstring name = L"FuzzTask";
    static const std::wstring user = EffectiveUser::loginName();
    TaskSchedulerSettings::setTasksFolder(folder.path);
    writeInput(TaskFile::pathOf(name), data, size);
    TaskRecord record;
    record.applicationName = L"untouched";
    const HRESULT result = TaskFile::load(name, record);
    if (result != S_OK)
    {
        FUZZ_CHECK(result == SCHED_E_UNKNOWN_OBJECT_VERSION || result == E_ACCESSDENIED);
        FUZZ_CHECK(record.applicationName == L"untouched");
        return 0;
    }
    FUZZ_CHECK(record.owner == user);
    FUZZ_CHECK(record.triggers.size() <= 0xFFFF);
    for (const TASK_TRIGGER& trigger : record.triggers)
        FUZZ_CHECK(TaskFile::isValidTrigger(trigger));
    return 0;
}
