#include "UpdateUpdater.h"

#include "TesselLog_Static.h"

namespace
{
const char* const kComponent = "ProcToolConfiguration";
const char* const kFile = "ProcToolConfiguration.dll";
const char* const kClass = "UpdateUpdater";

const wchar_t* const kOnlineUpdateActivated = L"OnlineUpdateActivated";
const wchar_t* const kDeploymentMode = L"DeploymentMode";
const wchar_t* const kDistributionFolderPath = L"DistributionFolderPath";
const wchar_t* const kLocalDistributionFolderPath = L"LocalDistributionFolderPath";
const wchar_t* const kFeedbackFolderPath = L"FeedbackFolderPath";
const wchar_t* const kUpdateRetrievalTime = L"UpdateRetrievalTime";
const wchar_t* const kErrorCounter = L"ErrorCounter";
const wchar_t* const kMaxLogsNumber = L"MaxLogsNumber";
const wchar_t* const kLogDebug = L"LogDebug";

void trace(const wchar_t* message)
{
    TesselLog_Static::logTrace_static(kComponent, kFile, kClass, message);
}

void traceStarted(const wchar_t* prefix)
{
    ACE_WString message(prefix);
    message += L": Method started.";
    trace(message.c_str());
}

void warnNotLoaded(const wchar_t* prefix)
{
    ACE_WString message(prefix);
    message += L": File not loaded";
    TesselLog_Static::logWarning_static(kComponent, kFile, kClass, message.c_str());
}

// The accessors' common entry: trace, then whether the store may be used.
bool enter(bool loaded, const wchar_t* tracePrefix, const wchar_t* warningPrefix)
{
    traceStarted(tracePrefix);
    if (!loaded)
        warnNotLoaded(warningPrefix);
    return loaded;
}

bool enter(bool loaded, const wchar_t* prefix)
{
    return enter(loaded, prefix, prefix);
}

ACE_WString readString(const BSet& settings, const wchar_t* key)
{
    ACE_WString value;
    settings.getString(key, value);
    return value;
}
}

UpdateUpdater::UpdateUpdater(const ACE_WString& path) : m_path(path), m_settings(10), m_loaded(false)
{
    trace(L"[UpdateUpdater::UpdateUpdater(const ACE_WString&)]: Constructor started.");
}

UpdateUpdater::UpdateUpdater(const UpdateUpdater& other) = default;

UpdateUpdater& UpdateUpdater::operator=(const UpdateUpdater& other) = default;

UpdateUpdater::~UpdateUpdater()
{
    trace(L"[UpdateUpdater::~UpdateUpdater()]: Destructor started.");
}

bool UpdateUpdater::isLoaded()
{
    traceStarted(L"[bool UpdateUpdater::isLoaded()]");
    return m_loaded;
}

bool UpdateUpdater::load()
{
    traceStarted(L"[bool UpdateUpdater::load()]");
    if (m_loaded)
    {
        TesselLog_Static::logWarning_static(kComponent, kFile, kClass, L"[bool UpdateUpdater::load()]: Already loaded");
        return true;
    }
    // Read into a fresh set so the content is exactly the file's.
    BSet fromFile(10);
    m_loaded = fromFile.load(m_path);
    if (m_loaded)
        m_settings = std::move(fromFile);
    setInitialValues();
    return m_loaded;
}

void UpdateUpdater::setInitialValues()
{
    traceStarted(L"[bool UpdateUpdater::setOtherInitialValues()]");
    static const struct
    {
        const wchar_t* key;
        const wchar_t* value;
    } defaults[] = {
        {kDeploymentMode, L"LOCAL"},
        {kDistributionFolderPath, L""},
        {kLocalDistributionFolderPath, L"c:\\TLD_REPOSITORY"},
        {kFeedbackFolderPath, L""},
        {kUpdateRetrievalTime, L"11:00:00"},
    };
    for (const auto& entry : defaults)
        if (readString(m_settings, entry.key).length() == 0)
            m_settings.setString(entry.key, entry.value);
}

bool UpdateUpdater::save(ACE_WString path)
{
    std::string written;
    return save(path, written);
}

bool UpdateUpdater::save(const ACE_WString& path, std::string& written)
{
    written.clear();
    if (!enter(m_loaded, L"[bool UpdateUpdater::save()]"))
        return false;
    return m_settings.save(path, false, written);
}

bool UpdateUpdater::getCheckInternet()
{
    if (!enter(m_loaded, L"[const ACE_WString UpdateUpdater::getCheckInternet()]"))
        return true;
    bool value = false;
    m_settings.getBool(kOnlineUpdateActivated, value);
    return value;
}

bool UpdateUpdater::setCheckInternet(bool value)
{
    if (!enter(m_loaded, L"[bool UpdateUpdater::setCheckInternet(bool)]"))
        return false;
    m_settings.setBool(kOnlineUpdateActivated, value);
    return true;
}

const ACE_WString UpdateUpdater::getDeploymentMode()
{
    if (!enter(m_loaded, L"[const ACE_WString UpdateUpdater::getDeploymentMode()]"))
        return ACE_WString();
    return readString(m_settings, kDeploymentMode);
}

bool UpdateUpdater::setDeploymentMode(const ACE_WString& value)
{
    if (!enter(m_loaded, L"[bool UpdateUpdater::setDeploymentMode(const ACE_WString&)]"))
        return false;
    m_settings.setString(kDeploymentMode, value);
    return true;
}

const ACE_WString UpdateUpdater::getDistributionFolderPath()
{
    if (!enter(m_loaded, L"[const ACE_WString UpdateUpdater::getDistributionFolderPath()]"))
        return ACE_WString();
    return readString(m_settings, kDistributionFolderPath);
}

bool UpdateUpdater::setDistributionFolderPath(const ACE_WString& value)
{
    if (!enter(m_loaded, L"[bool UpdateUpdater::setDistributionFolderPath(const ACE_WString&)]"))
        return false;
    m_settings.setString(kDistributionFolderPath, value);
    return true;
}

const ACE_WString UpdateUpdater::getLocalDistributionFolderPath()
{
    if (!enter(m_loaded, L"[const ACE_WString UpdateUpdater::getLocalDistributionFolderPath()]"))
        return ACE_WString();
    return readString(m_settings, kLocalDistributionFolderPath);
}

bool UpdateUpdater::setLocalDistributionFolderPath(const ACE_WString& value)
{
    if (!enter(m_loaded, L"[bool UpdateUpdater::setLocalDistributionFolderPath(const ACE_WString&)]"))
        return false;
    m_settings.setString(kLocalDistributionFolderPath, value);
    return true;
}

const ACE_WString UpdateUpdater::getTaskTime()
{
    if (!enter(m_loaded, L"[const ACE_WString UpdateUpdater::getTaskTime()]"))
        return ACE_WString();
    return readString(m_settings, kUpdateRetrievalTime);
}

bool UpdateUpdater::setTaskTime(const ACE_WString& value)
{
    if (!enter(m_loaded, L"[bool UpdateUpdater::setTaskTime(const ACE_WString&)]"))
        return false;
    m_settings.setString(kUpdateRetrievalTime, value);
    return true;
}

const ACE_WString UpdateUpdater::getUpdateRetrievalTime()
{
    if (!enter(m_loaded, L"[const ACE_WString UpdateUpdater::getUpdateRetrievalTime()]"))
        return ACE_WString();
    return readString(m_settings, kUpdateRetrievalTime);
}

const ACE_WString UpdateUpdater::getFeedbackFolderPath()
{
    if (!enter(m_loaded, L"[const ACE_WString UpdateUpdater::getFeedbackFolderPat()]"))
        return ACE_WString();
    return readString(m_settings, kFeedbackFolderPath);
}

long UpdateUpdater::getErrorCounter()
{
    if (!enter(m_loaded, L"[const ACE_WString UpdateUpdater::getErrorCounter()]",
               L"[bool UpdateUpdater::getErrorCounter()]"))
        return 0;
    long value = 0;
    m_settings.getInt(kErrorCounter, value);
    return value;
}

long UpdateUpdater::getMaxLogsNumber()
{
    if (!enter(m_loaded, L"[const ACE_WString UpdateUpdater::MaxLogsNumber()]",
               L"[bool UpdateUpdater::getMaxLogsNumber()]"))
        return 0;
    long value = 0;
    m_settings.getInt(kMaxLogsNumber, value);
    return value;
}

bool UpdateUpdater::getLogDebug()
{
    if (!enter(m_loaded, L"[const ACE_WString UpdateUpdater::getLogDebug()]"))
        return false;
    bool value = false;
    m_settings.getBool(kLogDebug, value);
    return value;
}
