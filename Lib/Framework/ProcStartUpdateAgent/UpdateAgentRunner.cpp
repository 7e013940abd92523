#include "UpdateAgentRunner.h"

#include "PDataManager.h"
#include "SmartProxy.h"
#include "TesselLog_Static.h"
#include "WideString.h"

#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <thread>
#include <vector>

extern char** environ;

namespace
{
const char* const kComponent = "ProcStartUpdateAgent";
const char* const kFile = "ProcStartUpdateAgent.dll";
const char* const kClass = "CProcStartUpdateAgent";

const char* const kDataManagerID = "tessel:DM?DataManager";
const char* const kEnableOnlineUpdate = "data:/Configuration/MenuBar/EnableOnlineUpdate";
const char* const kAgentExecutable = "data:/Configuration/OnlineUpdate/UpdateAgentExecutable";
const char* const kActiveSettings = "data:/Auto/SystemMenu/ActivePreparateur";
const char* const kConfiguredSettings = "data:/Configuration/MenuBar/PreparateurConfigFile";
const char* const kCheckArgument = "--check-configuration";

const int kDefaultTimeoutMilliseconds = 60000;

std::string readString(PDataManager& dataManager, const char* uri)
{
    ACE_WString value;
    if (dataManager.getString(ID(uri), value) != 0)
        return std::string();
    return WideString::toUtf8(value);
}

// Closes the file actions whatever way the spawn goes.
struct SpawnActions
{
    posix_spawn_file_actions_t actions;
    bool ready;
    SpawnActions() { ready = posix_spawn_file_actions_init(&actions) == 0; }
    ~SpawnActions()
    {
        if (ready)
            posix_spawn_file_actions_destroy(&actions);
    }
    SpawnActions(const SpawnActions&) = delete;
    SpawnActions& operator=(const SpawnActions&) = delete;
};
}

UpdateAgentRunner::UpdateAgentRunner() : m_timeoutMilliseconds(kDefaultTimeoutMilliseconds)
{
}

bool UpdateAgentRunner::isOnlineUpdateEnabled() const
{
    SmartProxy<PDataManager> dataManager;
    if (!dataManager.acquire(ID(kDataManagerID)))
        return false;
    bool enabled = false;
    if (dataManager->getBool(ID(kEnableOnlineUpdate), enabled) != 0)
        return false;
    return enabled;
}

IProcStartUpdateAgent::_enum_CheckConfigurationPreparer UpdateAgentRunner::checkConfigurationPreparer() const
{
    std::optional<TestAnswer> testAnswer;
    int timeoutMilliseconds = kDefaultTimeoutMilliseconds;
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        testAnswer = m_testAnswer;
        timeoutMilliseconds = m_timeoutMilliseconds;
    }
    if (testAnswer)
    {
        if (testAnswer->delayMilliseconds > 0)
            std::this_thread::sleep_for(std::chrono::milliseconds(testAnswer->delayMilliseconds));
        return static_cast<IProcStartUpdateAgent::_enum_CheckConfigurationPreparer>(testAnswer->answer);
    }

    std::string executable;
    std::string settings;
    {
        SmartProxy<PDataManager> dataManager;
        if (dataManager.acquire(ID(kDataManagerID)))
        {
            executable = readString(*dataManager.get(), kAgentExecutable);
            settings = readString(*dataManager.get(), kActiveSettings);
            if (settings.empty())
                settings = readString(*dataManager.get(), kConfiguredSettings);
        }
    }
    if (executable.empty())
    {
        TesselLog_Static::logError_static(
            kComponent, kFile, kClass, -1,
            "CProcStartUpdateAgent::checkConfigurationPreparer: no update agent configured at %s", kAgentExecutable);
        return IProcStartUpdateAgent::eNOK_MISSING_UPDATE_AGENT;
    }
    return static_cast<IProcStartUpdateAgent::_enum_CheckConfigurationPreparer>(
        runAgent(executable, settings, timeoutMilliseconds));
}

void UpdateAgentRunner::setTestAnswer(int answer, int delayMilliseconds)
{
    std::lock_guard<std::mutex> lock(m_mutex);
    m_testAnswer = TestAnswer{answer, delayMilliseconds};
}

void UpdateAgentRunner::clearTestAnswer()
{
    std::lock_guard<std::mutex> lock(m_mutex);
    m_testAnswer.reset();
}

void UpdateAgentRunner::setTimeoutMilliseconds(int milliseconds)
{
    std::lock_guard<std::mutex> lock(m_mutex);
    m_timeoutMilliseconds = milliseconds > 0 ? milliseconds : kDefaultTimeoutMilliseconds;
}

int UpdateAgentRunner::runAgent(const std::string& executable, const std::string& settings, int timeoutMilliseconds)
{
    std::vector<std::string> arguments = {executable, kCheckArgument};
    if (!settings.empty())
        arguments.push_back(settings);
    std::vector<char*> argv;
    for (std::string& argument : arguments)
        argv.push_back(argument.data());
    argv.push_back(nullptr);

    SpawnActions actions;
    if (!actions.ready || posix_spawn_file_actions_addopen(&actions.actions, 0, "/dev/null", O_RDONLY, 0) != 0 ||
        posix_spawn_file_actions_addopen(&actions.actions, 1, "/dev/null", O_WRONLY, 0) != 0 ||
        posix_spawn_file_actions_addopen(&actions.actions, 2, "/dev/null", O_WRONLY, 0) != 0)
    {
        TesselLog_Static::logError_static(
            kComponent, kFile, kClass, -1,
            "CProcStartUpdateAgent::checkConfigurationPreparer: cannot prepare to start %s", executable.c_str());
        return IProcStartUpdateAgent::eNOK_MISSING_UPDATE_AGENT;
    }
    pid_t child = 0;
    const int spawned = posix_spawn(&child, executable.c_str(), &actions.actions, nullptr, argv.data(), environ);
    if (spawned != 0)
    {
        TesselLog_Static::logError_static(
            kComponent, kFile, kClass, -1,
            "CProcStartUpdateAgent::checkConfigurationPreparer: cannot start %s (error %d)", executable.c_str(),
            spawned);
        return IProcStartUpdateAgent::eNOK_MISSING_UPDATE_AGENT;
    }

    const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(timeoutMilliseconds);
    int status = 0;
    for (;;)
    {
        const pid_t waited = waitpid(child, &status, WNOHANG);
        if (waited == child)
            break;
        if (waited < 0 && errno != EINTR)
        {
            TesselLog_Static::logError_static(kComponent, kFile, kClass, -1,
                                              "CProcStartUpdateAgent::checkConfigurationPreparer: lost %s",
                                              executable.c_str());
            return IProcStartUpdateAgent::eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR;
        }
        if (std::chrono::steady_clock::now() >= deadline)
        {
            kill(child, SIGKILL);
            while (waitpid(child, &status, 0) < 0 && errno == EINTR)
            {
            }
            TesselLog_Static::logError_static(
                kComponent, kFile, kClass, -1,
                "CProcStartUpdateAgent::checkConfigurationPreparer: %s did not answer within %d ms, stopped",
                executable.c_str(), timeoutMilliseconds);
            return IProcStartUpdateAgent::eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    if (!WIFEXITED(status))
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, -1,
                                          "CProcStartUpdateAgent::checkConfigurationPreparer: %s ended abnormally",
                                          executable.c_str());
        return IProcStartUpdateAgent::eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR;
    }
    return -WEXITSTATUS(status);
}
