#include "TaskSchedulerFaults.h"

#include <array>
#include <mutex>

namespace
{
struct FaultTable
{
    std::mutex mutex;
    std::array<std::optional<TaskSchedulerFaults::Fault>, TaskSchedulerFaults::eCALL_COUNT> faults;
};

FaultTable& table()
{
    static FaultTable instance;
    return instance;
}
}

void TaskSchedulerFaults::inject(Call call, const Fault& fault)
{
    if (call < 0 || call >= eCALL_COUNT)
        return;
    FaultTable& t = table();
    std::lock_guard<std::mutex> lock(t.mutex);
    t.faults[call] = fault;
}

void TaskSchedulerFaults::inject(Call call, HRESULT result, Output output)
{
    Fault fault;
    fault.result = result;
    fault.output = output;
    inject(call, fault);
}

void TaskSchedulerFaults::clear()
{
    FaultTable& t = table();
    std::lock_guard<std::mutex> lock(t.mutex);
    for (auto& fault : t.faults)
        fault.reset();
}

std::optional<TaskSchedulerFaults::Fault> TaskSchedulerFaults::take(Call call)
{
    if (call < 0 || call >= eCALL_COUNT)
        return std::nullopt;
    FaultTable& t = table();
    std::lock_guard<std::mutex> lock(t.mutex);
    auto& slot = t.faults[call];
    if (!slot)
        return std::nullopt;
    if (slot->skip > 0)
    {
        --slot->skip;
        return std::nullopt;
    }
    Fault applied = *slot;
    if (slot->times > 0 && --slot->times == 0)
        slot.reset();
    return applied;
}
