#pragma once

#include "BSet.h"
#include "Export.h"

#include <ace/SString.h>

#include <string>

// The online-update settings file: one flat set, loaded once and saved to any path.
class TESSEL_EXPORT UpdateUpdater
{
public:
    explicit UpdateUpdater(const ACE_WString& path);
    UpdateUpdater(const UpdateUpdater& other);
    UpdateUpdater& operator=(const UpdateUpdater& other);
    virtual ~UpdateUpdater();

    bool isLoaded();
    bool load();
    void setInitialValues();
    bool save(ACE_WString path);
    // The same, handing back the bytes written (empty on failure).
    bool save(const ACE_WString& path, std::string& written);

    bool getCheckInternet();
    bool setCheckInternet(bool value);
    const ACE_WString getDeploymentMode();
    bool setDeploymentMode(const ACE_WString& value);
    const ACE_WString getDistributionFolderPath();
    bool setDistributionFolderPath(const ACE_WString& value);
    const ACE_WString getLocalDistributionFolderPath();
    bool setLocalDistributionFolderPath(const ACE_WString& value);
    const ACE_WString getTaskTime();
    bool setTaskTime(const ACE_WString& value);
    const ACE_WString getUpdateRetrievalTime();
    const ACE_WString getFeedbackFolderPath();
    long getErrorCounter();
    long getMaxLogsNumber();
    bool getLogDebug();

private:
    ACE_WString m_path;
    BSet m_settings;
    bool m_loaded;
};
