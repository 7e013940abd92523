#pragma once

namespace OnlineUpdateCommand_NS
{
// Result of checking the update agent's scheduled task.
enum _enum_CheckConfigurationScheduledTaskResult
{
    eOK = 1,
    eTASK_NOT_REGISTERED = 2,
    eWRONG_SETTINGS = 3,
    eCAN_NOT_ACCESS_SERVICE = 4,
    eUNKNOWN_ERROR = 5
};
}
