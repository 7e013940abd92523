#include "OnlineUpdateTestSupport.h"

#include "CScheduledTaskHelper.h"
#include "Win32Service.h"

#include <QMetaMethod>
#include <QMetaObject>

using namespace OnlineUpdateTest;
using namespace OnlineUpdateCommand_NS;

namespace
{
const int kError = TesselLog_Static::eERROR;
const int kWarning = TesselLog_Static::eWARNING;
const int kInformation = TesselLog_Static::eINFORMATION;

std::string user()
{
    return WideString::toUtf8(ACE_WString(EffectiveUser::loginName().c_str()));
}
}

// ---- Parameters read from the data manager ----

struct TimeCase
{
    const char* name;
    const char* time;
    const char* hour;
    const char* minute;
    bool valid;
};

void PrintTo(const TimeCase& c, std::ostream* os)
{
    *os << '"' << c.time << '"';
}

class TaskTimeTest : public OnlineUpdateFixture, public ::testing::WithParamInterface<TimeCase>
{
};

TEST_P(TaskTimeTest, TimeIsCutIntoHourAndMinuteTexts)
{
    setString(kTaskTimeUri, GetParam().time);
    const ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    EXPECT_EQ(u(params.startHour()), GetParam().hour);
    EXPECT_EQ(u(params.startMinute()), GetParam().minute);
    EXPECT_EQ(params.isValid(), GetParam().valid);
    EXPECT_EQ(m_log.containsSubstring("- invalid setting"), std::string(GetParam().time).size() < 5);
    EXPECT_FALSE(m_log.containsSubstring("will attempt to init"));
}

// Texts shorter than "hh:mm" are invalid settings: the empty default parameters come back.
const TimeCase kTimeCases[] = {
    {"Full", "07:30:00", "07", "30", true},
    {"NoSeconds", "07:30", "07", "30", true},
    {"SingleDigitHour", "7:30", "", "", false},
    {"ThreeCharacters", "7:3", "", "", false},
    {"HourOnly", "7", "", "", false},
    {"NotDigits", "ab:cd:ef", "ab", "cd", true},
};
INSTANTIATE_TEST_SUITE_P(Times, TaskTimeTest, ::testing::ValuesIn(kTimeCases),
                         [](const auto& info) { return std::string(info.param.name); });

TEST_F(OnlineUpdateFixture, EmptyKeysGiveTheDefaultTaskAgentAndParameters)
{
    const ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    EXPECT_EQ(u(params.applicationPath()), "C:/VEXA_Q17/Lib/Application/UpdaterAgent.exe");
    EXPECT_EQ(u(params.parameters()), "preparer");
    EXPECT_EQ(u(params.taskName()), "VEXAPreparerTask");
    EXPECT_EQ(u(params.getTaskName()), "VEXAPreparerTask_" + user());
    EXPECT_TRUE(params.isValid());

    // Keys present but empty count as absent.
    setString(kExecutablePathUri, "");
    setString(kParametersUri, "");
    setString(kTaskNameUri, "");
    EXPECT_EQ(u(getScheduledTaskParamsFromDM().getTaskName()), "VEXAPreparerTask_" + user());
}

TEST_F(OnlineUpdateFixture, KeysOfTheDataManagerAreUsed)
{
    setString(kExecutablePathUri, "/opt/agent/UpdaterAgent");
    setString(kParametersUri, "--preparer now");
    setString(kTaskNameUri, "NightlyAgent");
    const ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    EXPECT_EQ(u(params.applicationPath()), "/opt/agent/UpdaterAgent");
    EXPECT_EQ(u(params.parameters()), "--preparer now");
    EXPECT_EQ(u(params.getTaskName()), "NightlyAgent_" + user());
}

TEST_F(OnlineUpdateFixture, WithoutDataManagerTheParametersAreInvalid)
{
    destroyDataManager();
    const ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    EXPECT_FALSE(params.isValid());
    EXPECT_TRUE(m_log.contains("getScheduledTaskParamsFromDM: spDM is not valid", kError));

    OnLineUpdateCommand command("WC_TOOLCONFIGURATION");
    EXPECT_FALSE(command.CreateScheduledTask());
    EXPECT_FALSE(command.DeleteScheduledTask());
    EXPECT_EQ(eWRONG_SETTINGS, OnLineUpdateCommandTestAccess::check(command, false));
}

// The task time comes from the dialog's controller when nobody has published it yet.
class TaskTimeInitTest : public OnlineUpdateFixture
{
protected:
    void SetUp() override
    {
        OnlineUpdateFixture::SetUp();
        ASSERT_EQ(0, m_dataManager->removeData(ID(kTaskTimeUri)));
        setString(L"data:/Configuration/MenuBar/WorkshopFile", m_dir.file("User/InformationsGarage.xml"));
        setString(L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagParamsFileName", m_dir.file("User/FicheDiagParams.xml"));
        setString(L"data:/Configuration/MenuBar/PreparateurConfigFile", m_updatePath);
        save(BSet(10), m_dir.file("User/FicheDiagParams.xml"));
    }

    static void save(const BSet& set, const std::string& path)
    {
        TempDir::write(path, "");
        ASSERT_TRUE(set.save(WideString::fromUtf8(path), false)) << path;
    }

    const std::string m_updatePath = m_dir.file("User/OnLineUpdate/Preparateur.xml");
};

TEST_F(TaskTimeInitTest, OneInitialisationAttemptPublishesTheTime)
{
    BSet settings(10);
    settings.setString(L"UpdateRetrievalTime", L"06:45:00");
    save(settings, m_updatePath);

    const ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    EXPECT_EQ(u(params.startHour()), "06");
    EXPECT_EQ(u(params.startMinute()), "45");
    EXPECT_TRUE(params.isValid());
    EXPECT_TRUE(m_log.contains("getScheduledTaskParamsFromDM: uri 'data:/Auto/SystemMenu/TaskTimeEdit' does not "
                               "exist or empty - will attempt to init",
                               kWarning));
    EXPECT_FALSE(m_log.containsSubstring("second failure"));
    ACE_WString published;
    EXPECT_EQ(0, m_dataManager->getString(ID(kTaskTimeUri), published));
    EXPECT_EQ(u(published), "06:45:00");
}

TEST_F(TaskTimeInitTest, SecondFailureGivesInvalidParameters)
{
    // No settings file: the controller publishes nothing.
    const ScheduledTaskParams params = getScheduledTaskParamsFromDM();
    EXPECT_FALSE(params.isValid());
    EXPECT_TRUE(params.startHour().is_empty());
    EXPECT_TRUE(params.applicationPath().is_empty());
    EXPECT_TRUE(m_log.containsSubstring("will attempt to init", kWarning));
    EXPECT_TRUE(m_log.contains(
        "getScheduledTaskParamsFromDM: unable to find task time in DM - second failure, after init attempt", kError));
    // Exactly one attempt.
    const std::vector<std::string> warnings = m_log.messages(kWarning);
    EXPECT_EQ(1, std::count_if(warnings.begin(), warnings.end(), [](const std::string& m) {
                  return m.find("will attempt to init") != std::string::npos;
              }));

    OnLineUpdateCommand command("WC_TOOLCONFIGURATION");
    EXPECT_FALSE(command.CreateScheduledTask());
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::CreateScheduledTask: invalid scheduled task DM settings", kError));
    EXPECT_FALSE(taskExists());
}

// ---- Checking the task as the settings ask ----

struct CheckCase
{
    const char* name;
    bool enabled;
    bool taskBefore;
    const char* createdLine;  // logged when the check had to make the task
    int createdLevel;
};

void PrintTo(const CheckCase& c, std::ostream* os)
{
    *os << c.name;
}

class CheckTaskTest : public OnlineUpdateFixture, public ::testing::WithParamInterface<CheckCase>
{
};

TEST_P(CheckTaskTest, TaskStaysExactlyWhenOnlineUpdatesAreEnabled)
{
    setEnabled(GetParam().enabled);
    if (GetParam().taskBefore)
        writeTask(7, 30);

    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_EQ(eOK, command.checkScheduledTask());
    EXPECT_EQ(taskExists(), GetParam().enabled);

    if (GetParam().createdLine != nullptr)
    {
        EXPECT_TRUE(m_log.containsSubstring(GetParam().createdLine, GetParam().createdLevel));
    }
    else
    {
        EXPECT_FALSE(m_log.containsSubstring("OnLineUpdateCommand::checkScheduledTask"));
    }
}

const CheckCase kCheckCases[] = {
    {"EnabledNoTask", true, false,
     "OnLineUpdateCommand::checkScheduledTask: online updates were enabled in settings but task did not exist for "
     "this windows user - we created it.",
     kWarning},
    {"EnabledTask", true, true, nullptr, 0},
    {"DisabledNoTask", false, false,
     "OnLineUpdateCommand::checkScheduledTask: successfully created temporary task for checking purposes", kInformation},
    {"DisabledTask", false, true, nullptr, 0},
};
INSTANTIATE_TEST_SUITE_P(Settings, CheckTaskTest, ::testing::ValuesIn(kCheckCases),
                         [](const auto& info) { return std::string(info.param.name); });

TEST_F(OnlineUpdateFixture, TaskWithOtherTimeIsReportedAndStillFollowsTheSetting)
{
    writeTask(8, 15);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_EQ(eWRONG_SETTINGS, OnLineUpdateCommandTestAccess::check(command, true));
    EXPECT_TRUE(taskExists());
    EXPECT_EQ(eWRONG_SETTINGS, OnLineUpdateCommandTestAccess::check(command, false));
    EXPECT_FALSE(taskExists());
}

TEST_F(OnlineUpdateFixture, MadeTaskStartsAtTheSetTime)
{
    setEnabled(true);
    setString(kTaskTimeUri, "07:05:00");
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_EQ(eOK, command.checkScheduledTask());
    TaskRecord record;
    ASSERT_TRUE(loadTask(record));
    ASSERT_EQ(1u, record.triggers.size());
    EXPECT_EQ(7, record.triggers[0].wStartHour);
    EXPECT_EQ(5, record.triggers[0].wStartMinute);
    EXPECT_EQ(std::wstring(kDefaultApplication), record.applicationName);
}

TEST_F(OnlineUpdateFixture, SlotInvocationRunsTheCheck)
{
    setEnabled(true);
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_TRUE(QMetaObject::invokeMethod(&command, "checkScheduledTask"));
    EXPECT_TRUE(taskExists());
}

// Ways the check cannot run to its end.
struct FailureCase
{
    const char* name;
    bool enabled;
    bool taskBefore;
    TaskSchedulerFaults::Call faultCall;  // eCALL_COUNT for none
    HRESULT faultResult;
    const char* time;
    DWORD serviceState;
    _enum_CheckConfigurationScheduledTaskResult expected;
    const char* errorLine;  // nullptr when only the helper logs
};

void PrintTo(const FailureCase& c, std::ostream* os)
{
    *os << c.name;
}

class CheckFailureTest : public OnlineUpdateFixture, public ::testing::WithParamInterface<FailureCase>
{
};

TEST_P(CheckFailureTest, EachFailureHasItsResult)
{
    const FailureCase& c = GetParam();
    if (c.taskBefore)
        writeTask(7, 30);
    setString(kTaskTimeUri, c.time);
    TaskSchedulerSettings::setServiceState(c.serviceState);
    if (c.faultCall != TaskSchedulerFaults::eCALL_COUNT)
        TaskSchedulerFaults::inject(c.faultCall, c.faultResult);

    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_EQ(c.expected, OnLineUpdateCommandTestAccess::check(command, c.enabled));
    if (c.errorLine != nullptr)
    {
        EXPECT_TRUE(m_log.containsSubstring(c.errorLine, kError)) << c.errorLine;
    }
    TaskSchedulerFaults::clear();
    EXPECT_EQ(taskExists(), c.taskBefore);
}

const FailureCase kFailureCases[] = {
    {"InvalidSettings", true, false, TaskSchedulerFaults::eCALL_COUNT, S_OK, "7", 0, eWRONG_SETTINGS,
     "OnLineUpdateCommand::checkScheduledTask: invalid scheduled task DM settings"},
    {"ServiceStopped", true, false, TaskSchedulerFaults::eCALL_COUNT, S_OK, "07:30:00", SERVICE_STOPPED,
     eCAN_NOT_ACCESS_SERVICE, nullptr},
    {"SchedulerUnreachable", false, false, TaskSchedulerFaults::eCoCreateInstance, E_FAIL, "07:30:00", 0,
     eUNKNOWN_ERROR,
     "OnLineUpdateCommand::checkScheduledTask: checkTaskAvailableForCurrentUser did not complete successfully - "
     "cannot continue"},
    {"AccessDenied", true, false, TaskSchedulerFaults::eActivate, static_cast<HRESULT>(0x80070005), "07:30:00", 0,
     eCAN_NOT_ACCESS_SERVICE, "OnLineUpdateCommand::checkScheduledTask: checkTaskAvailableForCurrentUser reported accessDenied"},
    {"CreationFails", true, false, TaskSchedulerFaults::eNewWorkItem, E_FAIL, "07:30:00", 0, eUNKNOWN_ERROR,
     "OnLineUpdateCommand::checkScheduledTask: trying to create task failed"},
    {"DeletionFails", false, true, TaskSchedulerFaults::eDelete, E_FAIL, "07:30:00", 0, eUNKNOWN_ERROR,
     "OnLineUpdateCommand::checkScheduledTask: trying to delete temporary task failed"},
};
INSTANTIATE_TEST_SUITE_P(Failures, CheckFailureTest, ::testing::ValuesIn(kFailureCases),
                         [](const auto& info) { return std::string(info.param.name); });

TEST_F(OnlineUpdateFixture, PublicCheckWithoutUpdateAgentIsUnknownError)
{
    makeAgentUnreachable();
    OnLineUpdateCommand command("WC_ONLINEUPDATECOMMAND");
    EXPECT_EQ(eUNKNOWN_ERROR, command.checkScheduledTask());
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::checkScheduledTask: spPSUA is not valid", kError));
    EXPECT_FALSE(taskExists());
}

// ---- Create and Delete ----

class CreateDeleteTest : public OnlineUpdateFixture, public ::testing::WithParamInterface<bool>
{
protected:
    // With the parameter false the text component is gone before the command is made.
    std::unique_ptr<OnLineUpdateCommand> makeCommand()
    {
        if (!GetParam())
            destroyText();
        auto command = std::make_unique<OnLineUpdateCommand>("WC_TOOLCONFIGURATION");
        EXPECT_EQ(!GetParam(),
                  m_log.contains("OnLineUpdateCommand::OnLineUpdateCommand: Cannot get proxy to BText.", kWarning));
        return command;
    }
};

TEST_P(CreateDeleteTest, CreateSavesAndRewritesTheTask)
{
    auto command = makeCommand();
    EXPECT_TRUE(command->CreateScheduledTask());
    TaskRecord record;
    ASSERT_TRUE(loadTask(record));
    EXPECT_EQ(30, record.triggers.at(0).wStartMinute);

    setString(kTaskTimeUri, "21:05:00");
    EXPECT_TRUE(command->CreateScheduledTask());
    ASSERT_TRUE(loadTask(record));
    ASSERT_EQ(1u, record.triggers.size());
    EXPECT_EQ(21, record.triggers[0].wStartHour);
    EXPECT_EQ(5, record.triggers[0].wStartMinute);
    EXPECT_EQ(eOK, OnLineUpdateCommandTestAccess::check(*command, true));
}

TEST_P(CreateDeleteTest, DeleteRemovesTheTaskAndToleratesItsAbsence)
{
    auto command = makeCommand();
    writeTask(7, 30);
    EXPECT_TRUE(command->DeleteScheduledTask());
    EXPECT_FALSE(taskExists());
    EXPECT_TRUE(command->DeleteScheduledTask());
    EXPECT_FALSE(m_log.containsSubstring("invalid scheduled task DM settings"));
}

TEST_P(CreateDeleteTest, InvalidSettingsAreRefused)
{
    auto command = makeCommand();
    writeTask(7, 30);
    setString(kTaskTimeUri, "7:");
    EXPECT_FALSE(command->CreateScheduledTask());
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::CreateScheduledTask: invalid scheduled task DM settings", kError));
    EXPECT_FALSE(command->DeleteScheduledTask());
    EXPECT_TRUE(m_log.contains("OnLineUpdateCommand::DeleteScheduledTask: invalid scheduled task DM settings", kError));
    EXPECT_TRUE(taskExists());
}

TEST_P(CreateDeleteTest, UnreachableSchedulerFailsBoth)
{
    auto command = makeCommand();
    TaskSchedulerFaults::inject(TaskSchedulerFaults::eCoCreateInstance, E_FAIL);
    EXPECT_FALSE(command->CreateScheduledTask());
    EXPECT_FALSE(command->DeleteScheduledTask());
    TaskSchedulerFaults::clear();
    EXPECT_FALSE(taskExists());
}

TEST_P(CreateDeleteTest, FailedDeletionOnceReachedStillCountsAsDone)
{
    auto command = makeCommand();
    writeTask(7, 30);
    TaskSchedulerFaults::inject(TaskSchedulerFaults::eDelete, E_FAIL);
    EXPECT_TRUE(command->DeleteScheduledTask());
    TaskSchedulerFaults::clear();
    EXPECT_TRUE(taskExists());
}

INSTANTIATE_TEST_SUITE_P(TextComponent, CreateDeleteTest, ::testing::Bool(),
                         [](const auto& info) { return std::string(info.param ? "Present" : "Missing"); });

// ---- Meta-object ----

TEST(OnLineUpdateCommandMeta, TwoSlotsInOrderAndNoSignals)
{
    const QMetaObject& meta = OnLineUpdateCommand::staticMetaObject;
    EXPECT_STREQ("OnLineUpdateCommand", meta.className());
    ASSERT_EQ(2, meta.methodCount() - meta.methodOffset());
    EXPECT_EQ(QByteArray("onCancelClicked()"), meta.method(meta.methodOffset()).methodSignature());
    EXPECT_EQ(QByteArray("checkScheduledTask()"), meta.method(meta.methodOffset() + 1).methodSignature());
    for (int i = meta.methodOffset(); i < meta.methodCount(); ++i)
    {
        EXPECT_EQ(QMetaMethod::Slot, meta.method(i).methodType());
        EXPECT_EQ(QMetaMethod::Public, meta.method(i).access());
    }
    EXPECT_EQ(0, meta.propertyCount() - meta.propertyOffset());
}
