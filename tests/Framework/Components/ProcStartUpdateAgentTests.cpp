#include "BBool.h"
#include "BString.h"
#include "CProcStartUpdateAgent.h"
#include "ComponentFixture.h"
#include "PProcStartUpdateAgent.h"
#include "SmartProxy.h"
#include "TempDir.h"
#include "WideString.h"

#include <gtest/gtest.h>

#include <sys/stat.h>

#include <chrono>
#include <filesystem>
#include <future>
#include <string>
#include <thread>

namespace
{
const char* const kExecutableURI = "data:/Configuration/OnlineUpdate/UpdateAgentExecutable";
const char* const kEnableURI = "data:/Configuration/MenuBar/EnableOnlineUpdate";
const char* const kActiveSettingsURI = "data:/Auto/SystemMenu/ActivePreparateur";

class UpdateAgentTest : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_agent = CProcStartUpdateAgent::registerWith(*m_manager);
        ASSERT_NE(m_agent, nullptr);
        ASSERT_TRUE(m_proxy.acquire(ID(CProcStartUpdateAgent::componentID)));
    }
    void TearDown() override
    {
        m_proxy.giveBack();
        ComponentFixture::TearDown();
    }

    // A shell script standing in for the update agent; returns its path.
    std::string writeAgent(const std::string& body, bool executable = true)
    {
        const std::string path = m_dir.file("agent.sh");
        TempDir::write(path, "#!/bin/sh\n" + body + "\n");
        chmod(path.c_str(), executable ? 0755 : 0644);
        return path;
    }

    void configureAgent(const std::string& path)
    {
        ASSERT_EQ(m_dataManager->createData(ID(kExecutableURI), BString(WideString::fromUtf8(path))), 0);
    }

    CProcStartUpdateAgent* m_agent = nullptr;
    SmartProxy<PProcStartUpdateAgent> m_proxy;
    TempDir m_dir;
};

struct ExitCase
{
    const char* script;
    int answer;
};

class UpdateAgentExitCode : public UpdateAgentTest, public ::testing::WithParamInterface<ExitCase>
{
};

TEST_P(UpdateAgentExitCode, AnswerIsMinusTheExitStatus)
{
    configureAgent(writeAgent(GetParam().script));
    EXPECT_EQ(static_cast<int>(m_proxy->checkConfigurationPreparer()), GetParam().answer);
}

INSTANTIATE_TEST_SUITE_P(Cases, UpdateAgentExitCode,
                         ::testing::Values(ExitCase{"exit 0", IProcStartUpdateAgent::eOK},
                                           ExitCase{"exit 3", IProcStartUpdateAgent::eNOK_INVALID_CONFIGURATION_FILE},
                                           ExitCase{"exit 9", IProcStartUpdateAgent::eNOK_SERVER_NOT_FOUND},
                                           ExitCase{"exit 13", IProcStartUpdateAgent::eNOK_MISSING_UPDATE_AGENT},
                                           // Beyond the list: passed on as it comes.
                                           ExitCase{"exit 40", -40},
                                           ExitCase{"echo noise; echo more >&2; exit 2",
                                                    IProcStartUpdateAgent::eNOK_MISSING_CONFIGURATION_FILE},
                                           // Killed by a signal: no exit status to read.
                                           ExitCase{"kill -9 $$",
                                                    IProcStartUpdateAgent::eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR}));

TEST_F(UpdateAgentTest, AgentThatCannotRunIsMissing)
{
    // Nothing configured.
    EXPECT_EQ(m_proxy->checkConfigurationPreparer(), IProcStartUpdateAgent::eNOK_MISSING_UPDATE_AGENT);
    // A path to nothing.
    configureAgent(m_dir.file("absent-agent"));
    EXPECT_EQ(m_proxy->checkConfigurationPreparer(), IProcStartUpdateAgent::eNOK_MISSING_UPDATE_AGENT);
    // A file that is not executable.
    configureAgent(writeAgent("exit 0", false));
    EXPECT_EQ(m_proxy->checkConfigurationPreparer(), IProcStartUpdateAgent::eNOK_MISSING_UPDATE_AGENT);
}

TEST_F(UpdateAgentTest, AgentGetsTheCheckArgumentAndTheSettingsInUse)
{
    const std::string record = m_dir.file("arguments.txt");
    configureAgent(writeAgent("printf '%s|' \"$@\" > '" + record + "'; exit 0"));
    const std::string settings = m_dir.file("PreparateurTmp.xml");
    ASSERT_EQ(m_dataManager->createData(ID(kActiveSettingsURI), BString(WideString::fromUtf8(settings))), 0);
    ASSERT_EQ(m_proxy->checkConfigurationPreparer(), IProcStartUpdateAgent::eOK);
    EXPECT_EQ(TempDir::read(record), "--check-configuration|" + settings + "|");
}

TEST_F(UpdateAgentTest, AgentThatHangsIsStopped)
{
    configureAgent(writeAgent("sleep 30; exit 0"));
    m_agent->setTimeoutMilliseconds(300);
    EXPECT_EQ(m_proxy->checkConfigurationPreparer(), IProcStartUpdateAgent::eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR);
}

TEST_F(UpdateAgentTest, TestAnswerReplacesTheAgentUntilCleared)
{
    configureAgent(writeAgent("exit 0"));
    m_agent->setTestAnswer(IProcStartUpdateAgent::eNOK_A2A_NOT_CONFIGURED, 0);
    EXPECT_EQ(m_proxy->checkConfigurationPreparer(), IProcStartUpdateAgent::eNOK_A2A_NOT_CONFIGURED);
    m_agent->setTestAnswer(5, 0);
    EXPECT_EQ(static_cast<int>(m_proxy->checkConfigurationPreparer()), 5);
    m_agent->clearTestAnswer();
    EXPECT_EQ(m_proxy->checkConfigurationPreparer(), IProcStartUpdateAgent::eOK);
}

TEST_F(UpdateAgentTest, CallOnAWorkerOutlivesTheComponent)
{
    // The agent tells when it runs, so the component is destroyed while the call is under way.
    const std::string started = m_dir.file("started");
    const std::string release = m_dir.file("release");
    configureAgent(writeAgent("touch '" + started + "'; while [ ! -e '" + release + "' ]; do sleep 0.01; done; exit 5"));
    auto answer = std::async(std::launch::async, []() {
        SmartProxy<PProcStartUpdateAgent> workerProxy;
        if (!workerProxy.acquire(ID(CProcStartUpdateAgent::componentID)))
            return static_cast<int>(IProcStartUpdateAgent::eNOK_NO_AGENT);
        return static_cast<int>(workerProxy->checkConfigurationPreparer());
    });
    while (!std::filesystem::exists(started))
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    ASSERT_EQ(destroyComponent(ID(CProcStartUpdateAgent::componentID)), 0);
    m_agent = nullptr;
    TempDir::write(release, "");
    EXPECT_EQ(answer.get(), IProcStartUpdateAgent::eNOK_PATH_NOT_CONFIGURED);
    EXPECT_EQ(m_proxy->checkConfigurationPreparer(), IProcStartUpdateAgent::eNOK_NO_AGENT);
    EXPECT_FALSE(m_proxy->isOnlineUpdateEnabled());
}

TEST_F(UpdateAgentTest, TestAnswerComesAfterItsDelayOnAWorker)
{
    m_agent->setTestAnswer(IProcStartUpdateAgent::eNOK_SERVER_NOT_FOUND, 50);
    auto answer = std::async(std::launch::async, []() {
        SmartProxy<PProcStartUpdateAgent> workerProxy;
        if (!workerProxy.acquire(ID(CProcStartUpdateAgent::componentID)))
            return static_cast<int>(IProcStartUpdateAgent::eNOK_NO_AGENT);
        return static_cast<int>(workerProxy->checkConfigurationPreparer());
    });
    EXPECT_EQ(answer.get(), IProcStartUpdateAgent::eNOK_SERVER_NOT_FOUND);
}

TEST_F(UpdateAgentTest, OnlineUpdateSwitchComesFromTheDataManager)
{
    EXPECT_FALSE(m_proxy->isOnlineUpdateEnabled());
    ASSERT_EQ(m_dataManager->createData(ID(kEnableURI), BBool(true)), 0);
    EXPECT_TRUE(m_proxy->isOnlineUpdateEnabled());
    ASSERT_EQ(m_dataManager->setBool(ID(kEnableURI), false), 0);
    EXPECT_FALSE(m_proxy->isOnlineUpdateEnabled());
    ASSERT_EQ(m_dataManager->setBool(ID(kEnableURI), true), 0);
    ASSERT_EQ(destroyDataManager(), 0);
    EXPECT_FALSE(m_proxy->isOnlineUpdateEnabled());
}
}
