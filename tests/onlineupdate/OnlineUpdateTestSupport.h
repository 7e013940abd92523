#pragma once

#include "OnLineUpdateCommand.h"

#include "BBool.h"
#include "BString.h"
#include "CComponent_Thread_NoRef.h"
#include "CProcStartUpdateAgent.h"
#include "ComponentFixture.h"
#include "Dialog_ConfigurationTestBase.h"
#include "Dialog_OnLineUpdateConfigurationTestResult.h"
#include "EffectiveUser.h"
#include "IComponentManager.h"
#include "LogCapture.h"
#include "TaskFile.h"
#include "TaskRecord.h"
#include "TaskSchedulerFaults.h"
#include "TaskSchedulerSettings.h"
#include "TempDir.h"
#include "WideString.h"

#include <ace/Thread_Manager.h>

#include <QApplication>
#include <QEvent>
#include <QPushButton>
#include <QTimer>

#include <sys/stat.h>

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <vector>

// Reaches the command's private parts: the test's future, the private check and the worker.
class OnLineUpdateCommandTestAccess
{
public:
    static std::shared_ptr<OnLineUpdateCommand::ResultFutureType> future(OnLineUpdateCommand& c)
    {
        return c.m_testFuture;
    }
    static OnlineUpdateCommand_NS::_enum_CheckConfigurationScheduledTaskResult check(OnLineUpdateCommand& c, bool enabled)
    {
        return c.checkScheduledTask(enabled);
    }
    static unsigned long threadMethod(void* parameter) { return OnLineUpdateCommand::threadMethod_static(parameter); }
    static Dialog_ConfigurationTestBase& waitDialog(OnLineUpdateCommand& c) { return c.m_waitDialog; }
};

// A component that is registered but hands out no proxy: whoever asks for it gets nothing.
class UnreachableComponent : public CComponent_Thread_NoRef
{
public:
    explicit UnreachableComponent(const ID& id) : CComponent_Thread_NoRef(id) {}

    static int registerWith(IComponentManager& manager, const wchar_t* id)
    {
        return manager.registerComponent(std::make_unique<UnreachableComponent>(ID(id)),
                                         [](IComponent*) -> ProxyComponent* { return nullptr; });
    }
};

namespace OnlineUpdateTest
{
const wchar_t* const kTaskTimeUri = L"data:/Auto/SystemMenu/TaskTimeEdit";
const wchar_t* const kExecutablePathUri = L"data:/Configuration/MenuBar/Preparateur/ExecutablePath";
const wchar_t* const kParametersUri = L"data:/Configuration/MenuBar/Preparateur/ExecutableParameterPreparer";
const wchar_t* const kTaskNameUri = L"data:/Configuration/MenuBar/Preparateur/TimeScheduledTask";
const wchar_t* const kEnabledUri = L"data:/Configuration/MenuBar/EnableOnlineUpdate";
const wchar_t* const kAgentExecutableUri = L"data:/Configuration/OnlineUpdate/UpdateAgentExecutable";

const std::wstring kDefaultTaskName = L"VEXAPreparerTask";
const std::wstring kDefaultApplication = L"C:/VEXA_Q17/Lib/Application/UpdaterAgent.exe";

inline std::string u(const ACE_WString& text)
{
    return WideString::toUtf8(text);
}
}

// A fresh data manager, text component and update-agent starter, a tasks folder of the test's
// own and a running scheduler service. The task time is 07:30:00, online updates are off.
class OnlineUpdateFixture : public ComponentFixture
{
protected:
    void SetUp() override
    {
        ComponentFixture::SetUp();
        TaskSchedulerSettings::setTasksFolder(m_dir.file("Tasks"));
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerFaults::clear();
        m_manager->destroyComponent(ID(CProcStartUpdateAgent::componentID));
        m_agent = CProcStartUpdateAgent::registerWith(*m_manager);
        ASSERT_NE(m_agent, nullptr);
        setString(OnlineUpdateTest::kTaskTimeUri, "07:30:00");
        setEnabled(false);
    }

    void TearDown() override
    {
        // A worker still blocked in the gated agent is let go, then every worker is joined.
        openGate();
        ACE_Thread_Manager::instance()->wait();
        TaskSchedulerFaults::clear();
        TaskSchedulerSettings::setServiceState(0);
        TaskSchedulerSettings::setTasksFolder(std::string());
        ComponentFixture::TearDown();
    }

    // The update-agent starter stays registered but cannot be reached.
    void makeAgentUnreachable()
    {
        m_agent = nullptr;
        ASSERT_EQ(0, m_manager->destroyComponent(ID(CProcStartUpdateAgent::componentID)));
        ASSERT_EQ(0, UnreachableComponent::registerWith(*m_manager, CProcStartUpdateAgent::componentID));
    }

    void setString(const wchar_t* uri, const std::string& value)
    {
        ASSERT_EQ(0, m_dataManager->createData(ID(uri), BString(WideString::fromUtf8(value))));
    }
    void setEnabled(bool enabled) { ASSERT_EQ(0, m_dataManager->createData(ID(OnlineUpdateTest::kEnabledUri), BBool(enabled))); }

    static std::wstring storedName(const std::wstring& base = OnlineUpdateTest::kDefaultTaskName)
    {
        return base + L"_" + EffectiveUser::loginName();
    }
    static bool taskExists() { return std::filesystem::exists(TaskFile::pathOf(storedName())); }
    static bool loadTask(TaskRecord& record) { return TaskFile::load(storedName(), record) == S_OK; }

    // Stores the default task directly, as the scheduler would, starting at hour:minute.
    static void writeTask(WORD hour, WORD minute)
    {
        TaskRecord record;
        record.applicationName = OnlineUpdateTest::kDefaultApplication;
        record.parameters = L"preparer";
        record.account = EffectiveUser::loginName();
        record.flags = 0x2001;
        TASK_TRIGGER trigger;
        std::memset(&trigger, 0, sizeof trigger);
        trigger.cbTriggerSize = sizeof(TASK_TRIGGER);
        trigger.wBeginYear = 2024;
        trigger.wBeginMonth = 3;
        trigger.wBeginDay = 14;
        trigger.wStartHour = hour;
        trigger.wStartMinute = minute;
        trigger.TriggerType = TASK_TIME_TRIGGER_DAILY;
        trigger.Type.Daily.DaysInterval = 1;
        record.triggers.push_back(trigger);
        ASSERT_EQ(S_OK, TaskFile::save(storedName(), record));
    }

    // An update agent that answers minus `exitStatus` once the gate file exists.
    void useGatedAgent(int exitStatus)
    {
        m_gate = m_dir.file("gate");
        const std::string script = m_dir.file("agent.sh");
        TempDir::write(script, "#!/bin/sh\nwhile [ ! -e '" + m_gate + "' ]; do sleep 0.01; done\nexit " +
                                   std::to_string(exitStatus) + "\n");
        ASSERT_EQ(0, chmod(script.c_str(), 0755));
        setString(OnlineUpdateTest::kAgentExecutableUri, script);
    }
    void openGate()
    {
        if (!m_gate.empty())
            TempDir::write(m_gate, "open");
    }

    CProcStartUpdateAgent* m_agent = nullptr;
    std::string m_gate;
    TempDir m_dir;
    LogCapture m_log;
};

// Watches the dialogs that the configuration test shows. A result dialog is recorded and
// accepted with its OK button from its own event loop; a wait dialog runs `onWaitShown` from
// the next round of events.
class DialogWatcher : public QObject
{
public:
    struct Result
    {
        QString preparerText;
        QString taskText;
        QString style;
        bool ranModally = false;
    };

    DialogWatcher() { qApp->installEventFilter(this); }
    ~DialogWatcher() override { qApp->removeEventFilter(this); }

    std::function<void(Dialog_ConfigurationTestBase&)> onWaitShown;
    std::vector<Result> results;
    int waitShown = 0;
    QString waitStyle;
    bool waitModal = false;

protected:
    bool eventFilter(QObject* watched, QEvent* event) override
    {
        if (event->type() != QEvent::Show)
            return false;
        if (auto* result = dynamic_cast<Dialog_OnLineUpdateConfigurationTestResult*>(watched))
        {
            const size_t index = results.size();
            results.push_back({result->preparerText(), result->taskText(),
                               result->property("decoratorStyle").toString(), false});
            QTimer::singleShot(0, result, [this, result, index]() {
                results[index].ranModally = QApplication::activeModalWidget() == result;
                result->okButton()->click();
            });
        }
        else if (auto* wait = dynamic_cast<Dialog_ConfigurationTestBase*>(watched))
        {
            ++waitShown;
            waitStyle = wait->property("decoratorStyle").toString();
            waitModal = wait->isModal();
            if (onWaitShown)
                QTimer::singleShot(0, wait, [this, wait]() { onWaitShown(*wait); });
        }
        return false;
    }
};
