#include "CProcStartUpdateAgent.h"
#include "ComponentFixture.h"
#include "PProcStartUpdateAgent.h"
#include "SmartProxy.h"
#include "TempDir.h"
#include "Uris.h"

#include <sys/stat.h>

#include <chrono>
#include <filesystem>
#include <future>
#include <thread>
#include <tuple>

namespace
{
using Agent = IProcStartUpdateAgent;

// The answer of a configuration check made through a proxy of the calling thread.
int check()
{
    SmartProxy<PProcStartUpdateAgent> proxy;
    return proxy.acquire(ID(CProcStartUpdateAgent::componentID)) ? proxy->checkConfigurationPreparer() : 999;
}

class UpdateAgentTest : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        m_agent = CProcStartUpdateAgent::registerWith(*m_manager);
        ASSERT_NE(m_agent, nullptr);
    }
    // A shell script standing in for the update agent, configured as the agent to run.
    void configureAgent(const std::string& body, bool executable = true)
    {
        const std::string path = m_dir.file("agent.sh");
        TempDir::write(path, "#!/bin/sh\n" + body + "\n");
        chmod(path.c_str(), executable ? 0755 : 0644);
        setConfig(Uri::kAgentExecutable, path);
    }

    CProcStartUpdateAgent* m_agent = nullptr;
    TempDir m_dir;
};

// The agent gets the settings file of the dialog, else the configured one. A test answer, while
// set, replaces the agent; an agent that hangs is stopped.
TEST_F(UpdateAgentTest, AnswerIsMinusTheExitStatusOfTheAgent)
{
    EXPECT_EQ(check(), Agent::eNOK_MISSING_UPDATE_AGENT); // none configured
    const std::string record = m_dir.file("arguments.txt");
    configureAgent("printf '%s|' \"$@\" > '" + record + "'");
    for (const auto& [uri, file] : {std::pair<const wchar_t*, std::string>{nullptr, ""},
                                    {Uri::kUpdateFile, "/configured/Preparateur.xml|"},
                                    {Uri::kActivePreparateur, "/active/PreparateurTmp.xml|"}})
    {
        if (uri != nullptr)
            setConfig(uri, file.substr(0, file.size() - 1));
        ASSERT_EQ(check(), Agent::eOK);
        EXPECT_EQ(TempDir::read(record), "--check-configuration|" + file);
    }
    // the agent's script, executable, the answer
    const std::tuple<const char*, bool, int> cases[] = {
        {"exit 40", true, -40}, // beyond the list: passed on as it comes
        {"echo noise >&2; exit 2", true, Agent::eNOK_MISSING_CONFIGURATION_FILE},
        {"kill -9 $$", true, Agent::eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR}, // no exit status to read
        {"exit 0", false, Agent::eNOK_MISSING_UPDATE_AGENT}};
    for (const auto& [script, executable, answer] : cases)
    {
        configureAgent(script, executable);
        EXPECT_EQ(check(), answer) << script;
    }
    m_agent->setTimeoutMilliseconds(300);
    configureAgent("exec sleep 30");
    EXPECT_EQ(check(), Agent::eNOK_DISTRIBUTION_FOLDER_UNKNOWN_ERROR);
    m_agent->setTestAnswer(5, 20);
    EXPECT_EQ(check(), 5);
    m_agent->clearTestAnswer();
    setConfig(Uri::kAgentExecutable, m_dir.file("absent-agent"));
    EXPECT_EQ(check(), Agent::eNOK_MISSING_UPDATE_AGENT);
}

TEST_F(UpdateAgentTest, CallOnAWorkerOutlivesTheComponent)
{
    // The agent tells when it runs, so the component is destroyed while the call is under way.
    const std::string started = m_dir.file("started"), release = m_dir.file("release");
    configureAgent("touch '" + started + "'; while [ ! -e '" + release + "' ]; do sleep 0.01; done; exit 5");
    SmartProxy<PProcStartUpdateAgent> proxy;
    ASSERT_TRUE(proxy.acquire(ID(CProcStartUpdateAgent::componentID)));
    auto answer = std::async(std::launch::async, check);
    for (int i = 0; i < 2000 && !std::filesystem::exists(started); ++i)
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    EXPECT_EQ(destroyComponent(ID(CProcStartUpdateAgent::componentID)), 0);
    TempDir::write(release, ""); // before any check can end the test: the worker waits for it
    EXPECT_EQ(answer.get(), Agent::eNOK_PATH_NOT_CONFIGURED);
    EXPECT_EQ(proxy->checkConfigurationPreparer(), Agent::eNOK_NO_AGENT);
    EXPECT_FALSE(proxy->isOnlineUpdateEnabled());
}
}
