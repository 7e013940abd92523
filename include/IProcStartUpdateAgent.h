#pragma once

#include "Export.h"

// The update-agent starter's interface.
class TESSEL_EXPORT IProcStartUpdateAgent
{
public:
    // Fixed to int: an agent may answer values outside the list, which callers map themselves.
    enum _enum_CheckConfigurationPreparer : int
    {
        eOK = 0,
        eNOK_FAILED_INITIALIZE_LOG_SYSTEM = -1,
        eNOK_MISSING_CONFIGURATION_FILE = -2,
        eNOK_INVALID_CONFIGURATION_FILE = -3,
        eNOK_A2A_NOT_CONFIGURED = -4,
        eNOK_PATH_NOT_CONFIGURED = -5,
        eNOK_MISSING_ROBOCOPY = -6,
        eNOK_CONFIGURATION_UNKNOWN = -7,
        eNOK_LOCAL_CLIENT_NOT_INSTALLED = -8,
        eNOK_SERVER_NOT_FOUND = -9,
        eNOK_DISTANT_CLIENT_NOT_INSTALLED = -10,
        eNOK_DISTRIBUTION_FOLDER_NO_ACCESS = -11,
        eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR = -12,
        eNOK_MISSING_UPDATE_AGENT = -13,
        eNOK_NO_AGENT = -14
    };

    virtual ~IProcStartUpdateAgent();

    virtual bool isOnlineUpdateEnabled() = 0;
    virtual _enum_CheckConfigurationPreparer checkConfigurationPreparer() = 0;
};
