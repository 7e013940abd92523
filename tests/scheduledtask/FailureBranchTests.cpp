#include "ScheduledTaskTestSupport.h"

#include <filesystem>

using namespace OnlineUpdateCommand_NS;
using Faults = TaskSchedulerFaults;

namespace
{
// "%s" stands for the stored task name, "%u" for the user name.
std::string expand(std::string line)
{
    const std::string name = toUtf8(ScheduledTaskFixture::storedName(L"UpdTask"));
    for (size_t at; (at = line.find("%s")) != std::string::npos;)
        line.replace(at, 2, name);
    for (size_t at; (at = line.find("%u")) != std::string::npos;)
        line.replace(at, 2, ScheduledTaskFixture::userUtf8());
    return line;
}

std::vector<std::string> expand(const std::vector<const char*>& lines)
{
    std::vector<std::string> result;
    for (const char* line : lines)
        result.push_back(expand(line));
    return result;
}

ScheduledTaskParams standardParams()
{
    return ScheduledTaskParams(L"UpdTask", L"/opt/agent/UpdaterAgent", L"preparer", L"07", L"05");
}

// ---------------------------------------------------------------- getExistingTask

struct ActivateRow
{
    const char* name;
    HRESULT hr;
    Faults::Output output;
    bool result;
    bool taskSet;
    bool denied;
    int level;
    const char* line;
};

class GetExistingTaskRows : public ScheduledTaskFixture, public ::testing::WithParamInterface<ActivateRow>
{
};

TEST_P(GetExistingTaskRows, ClassifiesActivate)
{
    const ActivateRow& row = GetParam();
    writeTask(storedName(L"UpdTask"), goodRecord(), user());
    ASSERT_EQ(S_OK, CoInitialize(nullptr));
    {
        void* object = nullptr;
        ASSERT_EQ(S_OK, CoCreateInstance(CLSID_CTaskScheduler, nullptr, CLSCTX_INPROC_SERVER, IID_ITaskScheduler, &object));
        ComPtr<ITaskScheduler> scheduler(static_cast<ITaskScheduler*>(object));
        Faults::inject(Faults::eActivate, row.hr, row.output);

        const ScheduledTaskParams params = standardParams();
        ComPtr<ITask> task;
        bool denied = !row.denied;
        EXPECT_EQ(row.result, getExistingTask(scheduler.get(), params, task.ref(), denied));
        EXPECT_EQ(row.taskSet, static_cast<bool>(task));
        EXPECT_EQ(row.denied, denied);
        if (row.level == 0)
            EXPECT_TRUE(m_log.messages().empty());
        else
            EXPECT_EQ(std::vector<std::string>{expand(row.line)}, m_log.messages(row.level));
    }
    CoUninitialize();
}

INSTANTIATE_TEST_SUITE_P(
    Rows, GetExistingTaskRows,
    ::testing::Values(
        ActivateRow{"found", S_OK, Faults::eAUTO, true, true, false, 0, ""},
        ActivateRow{"okWithoutTask", S_OK, Faults::eNULL, false, false, false, 16,
                    "getExistingTask: rTaskSchedPtr->Activate('%s') returns S_OK but rTaskPtr is NULL"},
        ActivateRow{"absent", static_cast<HRESULT>(0x80070002), Faults::eAUTO, true, false, false, 0, ""},
        ActivateRow{"absentWithTask", static_cast<HRESULT>(0x80070002), Faults::eOBJECT, false, true, false, 16,
                    "getExistingTask: rTaskSchedPtr->Activate('%s') return COR_E_FILENOTFOUND but rTaskPtr is not "
                    "NULL"},
        ActivateRow{"accessDenied", E_ACCESSDENIED, Faults::eAUTO, true, false, true, 1,
                    "getExistingTask: rTaskSchedPtr->Activate('%s') failed with HRESULT '0x80070005' ('Permission "
                    "denied') - most likely tasks exists but we don't have privileges to access it"},
        ActivateRow{"accessDeniedWithTask", E_ACCESSDENIED, Faults::eOBJECT, true, true, true, 1,
                    "getExistingTask: rTaskSchedPtr->Activate('%s') failed with HRESULT '0x80070005' ('Permission "
                    "denied') - most likely tasks exists but we don't have privileges to access it"},
        ActivateRow{"outOfMemory", E_OUTOFMEMORY, Faults::eAUTO, false, false, false, 16,
                    "getExistingTask: rTaskSchedPtr->Activate('%s') failed with documented HRESULT '0x8007000E' "
                    "('Cannot allocate memory')"},
        ActivateRow{"invalidArgument", E_INVALIDARG, Faults::eAUTO, false, false, false, 16,
                    "getExistingTask: rTaskSchedPtr->Activate('%s') failed with documented HRESULT '0x80070057' "
                    "('Invalid argument')"},
        ActivateRow{"unknownVersion", SCHED_E_UNKNOWN_OBJECT_VERSION, Faults::eAUTO, false, false, false, 16,
                    "getExistingTask: rTaskSchedPtr->Activate('%s') failed with documented HRESULT '0x80041313' ('The "
                    "task object version is either unsupported or invalid.')"},
        ActivateRow{"unspecified", E_FAIL, Faults::eAUTO, false, false, false, 16,
                    "getExistingTask: rTaskSchedPtr->Activate('%s') failed with undocumented HRESULT '0x80004005' "
                    "('Unspecified error.')"},
        ActivateRow{"interfaceErrorWithoutText", static_cast<HRESULT>(0x80040250), Faults::eAUTO, false, false,
                    false, 16,
                    "getExistingTask: rTaskSchedPtr->Activate('%s') failed with undocumented HRESULT '0x80040250' "
                    "('IDispatch error #80')"},
        ActivateRow{"unknownCode", static_cast<HRESULT>(0x8FFF1234), Faults::eAUTO, false, false, false, 16,
                    "getExistingTask: rTaskSchedPtr->Activate('%s') failed with undocumented HRESULT '0x8FFF1234' "
                    "('Unknown error 0x8FFF1234')"}),
    [](const auto& info) { return std::string(info.param.name); });

TEST_F(ScheduledTaskFixture, GetExistingTaskReleasesWhatItHeldAndChecksItsInputs)
{
    writeTask(storedName(L"UpdTask"), goodRecord(), user());
    ASSERT_EQ(S_OK, CoInitialize(nullptr));
    {
        void* object = nullptr;
        ASSERT_EQ(S_OK, CoCreateInstance(CLSID_CTaskScheduler, nullptr, CLSCTX_INPROC_SERVER, IID_ITaskScheduler, &object));
        ComPtr<ITaskScheduler> scheduler(static_cast<ITaskScheduler*>(object));
        IUnknown* unknown = nullptr;
        ASSERT_EQ(S_OK, scheduler->Activate(storedName(L"UpdTask").c_str(), IID_ITask, &unknown));
        ITask* held = static_cast<ITask*>(unknown);
        EXPECT_EQ(2u, held->AddRef());

        ITask* slot = held;
        bool denied = true;
        EXPECT_FALSE(getExistingTask(nullptr, standardParams(), slot, denied));
        EXPECT_EQ(nullptr, slot);
        EXPECT_FALSE(denied);
        EXPECT_EQ(0u, held->Release());  // the function released the other reference

        ITask* none = nullptr;
        EXPECT_FALSE(getExistingTask(scheduler.get(), ScheduledTaskParams::s_defaultParams, none, denied));
        EXPECT_EQ((std::vector<std::string>{"getExistingTask: rTaskSchedPtr is NULL", "getExistingTask: rParams is not valid"}),
                  m_log.messages(16));
    }
    CoUninitialize();
}

// ---------------------------------------------------------------- create

struct CreateBranch
{
    const char* name;
    Faults::Call call;
    HRESULT hr;
    Faults::Output output;
    int skip;
    bool existingTask;  // with three triggers
    std::vector<const char*> lines;
};

class CreateFailure : public ScheduledTaskFixture, public ::testing::WithParamInterface<CreateBranch>
{
};

TEST_P(CreateFailure, ReturnsFalseWithItsLine)
{
    const CreateBranch& c = GetParam();
    TaskRecord old = goodRecord();
    old.parameters = L"old";
    old.triggers = {trigger(TASK_TIME_TRIGGER_DAILY, 1, 0), trigger(TASK_TIME_TRIGGER_DAILY, 2, 0),
                    trigger(TASK_TIME_TRIGGER_DAILY, 3, 0)};
    if (c.existingTask)
        writeTask(storedName(L"UpdTask"), old, user());
    const std::string path = TaskFile::pathOf(storedName(L"UpdTask"));
    const std::string before = c.existingTask ? TempDir::read(path) : std::string();

    ScheduledTaskParams params = standardParams();
    Faults::inject(c.call, {c.hr, c.output, c.skip, -1});
    CScheduledTaskHelper helper(params);
    EXPECT_FALSE(helper.createScheduledTask(false));
    EXPECT_EQ(expand(c.lines), m_log.messages(16));
    if (c.existingTask)
        EXPECT_EQ(before, TempDir::read(path));
    else
        EXPECT_FALSE(std::filesystem::exists(path));
    EXPECT_EQ(0, CoGetInitializeCount());
}

const char kPrefix[] = "CScheduledTaskHelper::createScheduledTask: ";
#define CREATE_LINE(text) "CScheduledTaskHelper::createScheduledTask: " text

INSTANTIATE_TEST_SUITE_P(
    Branches, CreateFailure,
    ::testing::Values(
        CreateBranch{"schedulerFails", Faults::eCoCreateInstance, E_FAIL, Faults::eAUTO, 0, false,
                     {CREATE_LINE("CoCreateInstance(CLSID_CTaskScheduler) failed with HRESULT '0x80004005' "
                                  "('Unspecified error.')")}},
        CreateBranch{"schedulerNull", Faults::eCoCreateInstance, S_OK, Faults::eNULL, 0, false,
                     {CREATE_LINE("CoCreateInstance(CLSID_CTaskScheduler) OK but smart pointer is NULL")}},
        CreateBranch{"activateFails", Faults::eActivate, E_FAIL, Faults::eAUTO, 0, true,
                     {"getExistingTask: rTaskSchedPtr->Activate('%s') failed with undocumented HRESULT '0x80004005' "
                      "('Unspecified error.')",
                      CREATE_LINE("getExistingTask('%s') failed")}},
        CreateBranch{"triggerCountFails", Faults::eGetTriggerCount, E_FAIL, Faults::eAUTO, 0, true,
                     {CREATE_LINE("GetTriggerCount failed with HRESULT '0x80004005' ('Unspecified error.')")}},
        CreateBranch{"secondTriggerDeletionFails", Faults::eDeleteTrigger, E_INVALIDARG, Faults::eAUTO, 1, true,
                     {CREATE_LINE("DeleteTrigger('1') failed with HRESULT '0x80070057' ('Invalid argument')")}},
        CreateBranch{"newWorkItemFails", Faults::eNewWorkItem, static_cast<HRESULT>(0x80070050), Faults::eAUTO, 0,
                     false,
                     {CREATE_LINE("NewWorkItem('%s') failed with HRESULT '0x80070050' ('File exists')")}},
        CreateBranch{"newWorkItemNull", Faults::eNewWorkItem, S_OK, Faults::eNULL, 0, false,
                     {CREATE_LINE("NewWorkItem OK but smart pointer is NULL")}},
        CreateBranch{"setApplicationNameFails", Faults::eSetApplicationName, E_OUTOFMEMORY, Faults::eAUTO, 0, false,
                     {CREATE_LINE("SetApplicationName('/opt/agent/UpdaterAgent') failed with HRESULT '0x8007000E' "
                                  "('Cannot allocate memory')")}},
        CreateBranch{"setParametersFails", Faults::eSetParameters, E_FAIL, Faults::eAUTO, 0, true,
                     {CREATE_LINE("SetParameters('preparer') failed with HRESULT '0x80004005' ('Unspecified "
                                  "error.')")}},
        CreateBranch{"userNameFails", Faults::eGetUserName, 1332, Faults::eAUTO, 0, false,
                     {CREATE_LINE("GetUserNameW failed with last error '1332'")}},
        CreateBranch{"accountFails", Faults::eSetAccountInformation, E_ACCESSDENIED, Faults::eAUTO, 0, false,
                     {CREATE_LINE("SetAccountInformation('%u') failed with HRESULT '0x80070005'")}},
        CreateBranch{"setFlagsFails", Faults::eSetFlags, E_FAIL, Faults::eAUTO, 0, false,
                     {CREATE_LINE("SetFlags('8193') failed with HRESULT '0x80004005'")}},
        CreateBranch{"createTriggerFails", Faults::eCreateTrigger, E_OUTOFMEMORY, Faults::eAUTO, 0, false,
                     {CREATE_LINE("createTrigger failed with HRESULT '0x8007000E' ('Cannot allocate memory')")}},
        CreateBranch{"createTriggerNull", Faults::eCreateTrigger, S_OK, Faults::eNULL, 0, false,
                     {CREATE_LINE("CreateTrigger OK but smart pointer is NULL")}},
        CreateBranch{"setTriggerFails", Faults::eTriggerSetTrigger, E_INVALIDARG, Faults::eAUTO, 0, true,
                     {CREATE_LINE("SetTrigger failed with HRESULT '0x80070057' ('Invalid argument')")}},
        CreateBranch{"queryInterfaceFails", Faults::eQueryInterface, E_NOINTERFACE, Faults::eAUTO, 0, false,
                     {CREATE_LINE("QueryInterface(IID_IPersistFile) failed with HRESULT '0x80004002' ('No such "
                                  "interface supported.')")}},
        CreateBranch{"queryInterfaceNull", Faults::eQueryInterface, S_OK, Faults::eNULL, 0, false,
                     {CREATE_LINE("QueryInterface(IID_IPersistFile) OK but smart pointer is NULL")}},
        CreateBranch{"saveFails", Faults::eSave, static_cast<HRESULT>(0x80070070), Faults::eAUTO, 0, true,
                     {CREATE_LINE("persistFilePtr->Save failed with HRESULT '0x80070070' ('No space left on "
                                  "device')")}}),
    [](const auto& info) { return std::string(info.param.name); });

TEST_F(ScheduledTaskFixture, CreateWhileServiceStoppedFailsAtSave)
{
    TaskSchedulerSettings::setServiceState(SERVICE_STOPPED);
    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    EXPECT_FALSE(helper.createScheduledTask(false));
    EXPECT_EQ(std::vector<std::string>{std::string(kPrefix) +
                                       "persistFilePtr->Save failed with HRESULT '0x80041315' ('The Task Scheduler "
                                       "service is not running.')"},
              m_log.messages(16));
}

// ---------------------------------------------------------------- delete, availability

TEST_F(ScheduledTaskFixture, DeleteAndAvailabilitySchedulerFailures)
{
    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    bool exists = false;
    bool denied = false;
    Faults::inject(Faults::eCoCreateInstance, REGDB_E_CLASSNOTREG);
    EXPECT_FALSE(helper.deleteScheduledTask(false));
    EXPECT_FALSE(helper.checkTaskAvailableForCurrentUser(exists, denied));
    Faults::inject(Faults::eCoCreateInstance, S_OK, Faults::eNULL);
    EXPECT_FALSE(helper.deleteScheduledTask(false));
    EXPECT_FALSE(helper.checkTaskAvailableForCurrentUser(exists, denied));
    const std::vector<std::string> expected = {
        "CScheduledTaskHelper::deleteScheduledTask: CoCreateInstance(CLSID_CTaskScheduler) failed with HRESULT "
        "'0x80040154' ('Class not registered.')",
        "CScheduledTaskHelper::checkTaskAvailableForCurrentUser: CoCreateInstance(CLSID_CTaskScheduler) failed with "
        "HRESULT '0x80040154' ('Class not registered.')",
        "CScheduledTaskHelper::deleteScheduledTask:CoCreateInstance(CLSID_CTaskScheduler) was OK but smart pointer is "
        "NULL",
        "CScheduledTaskHelper::checkTaskAvailableForCurrentUser:CoCreateInstance(CLSID_CTaskScheduler) was OK but "
        "smart pointer is NULL"};
    EXPECT_EQ(expected, m_log.messages(16));
}

// ---------------------------------------------------------------- check

struct CheckBranch
{
    const char* name;
    Faults::Call call;
    HRESULT hr;
    Faults::Output output;
    _enum_CheckConfigurationScheduledTaskResult expected;
    std::vector<const char*> lines;
};

class CheckFailure : public ScheduledTaskFixture, public ::testing::WithParamInterface<CheckBranch>
{
};

TEST_P(CheckFailure, ResultAndLines)
{
    const CheckBranch& c = GetParam();
    writeTask(storedName(L"UpdTask"), goodRecord(), user());
    ScheduledTaskParams params = standardParams();
    CScheduledTaskHelper helper(params);
    Faults::inject(c.call, c.hr, c.output);
    EXPECT_EQ(c.expected, helper.checkScheduledTask());
    EXPECT_EQ(expand(c.lines), m_log.messages(16));
    EXPECT_EQ(0, CoGetInitializeCount());
}

#define CHECK_LINE(text) "CScheduledTaskHelper::checkScheduledTask: " text

INSTANTIATE_TEST_SUITE_P(
    Branches, CheckFailure,
    ::testing::Values(
        CheckBranch{"schedulerFails", Faults::eCoCreateInstance, E_OUTOFMEMORY, Faults::eAUTO, eCAN_NOT_ACCESS_SERVICE,
                    {CHECK_LINE("CoCreateInstance(CLSID_CTaskScheduler) failed with HRESULT '0x8007000E' ('Cannot "
                                "allocate memory')")}},
        CheckBranch{"schedulerNull", Faults::eCoCreateInstance, S_OK, Faults::eNULL, eCAN_NOT_ACCESS_SERVICE,
                    {CHECK_LINE("CoCreateInstance(CLSID_CTaskScheduler) OK but smart pointer is NULL")}},
        CheckBranch{"activateFails", Faults::eActivate, SCHED_E_UNKNOWN_OBJECT_VERSION, Faults::eAUTO,
                    eCAN_NOT_ACCESS_SERVICE,
                    {"getExistingTask: rTaskSchedPtr->Activate('%s') failed with documented HRESULT '0x80041313' ('The "
                     "task object version is either unsupported or invalid.')",
                     CHECK_LINE("getExistingTask('%s') failed")}},
        CheckBranch{"statusFails", Faults::eGetStatus, E_FAIL, Faults::eAUTO, eUNKNOWN_ERROR,
                    {CHECK_LINE("GetStatus failed with HRESULT '0x80004005'")}},
        CheckBranch{"statusNotOk", Faults::eGetStatus, S_FALSE, Faults::eAUTO, eUNKNOWN_ERROR,
                    {CHECK_LINE("GetStatus failed with HRESULT '0x1'")}},
        CheckBranch{"flagsFail", Faults::eGetFlags, E_FAIL, Faults::eAUTO, eUNKNOWN_ERROR,
                    {CHECK_LINE("GetFlags failed with HRESULT '0x80004005' ('Unspecified error.')")}},
        CheckBranch{"parametersFail", Faults::eGetParameters, E_OUTOFMEMORY, Faults::eAUTO, eUNKNOWN_ERROR,
                    {CHECK_LINE("GetParameters failed with HRESULT '0x8007000E' ('Cannot allocate memory')")}},
        CheckBranch{"parametersNull", Faults::eGetParameters, S_OK, Faults::eNULL, eUNKNOWN_ERROR,
                    {CHECK_LINE("GetParameters succeeded but returned NULL string")}},
        CheckBranch{"applicationFails", Faults::eGetApplicationName, E_FAIL, Faults::eAUTO, eUNKNOWN_ERROR,
                    {CHECK_LINE("GetApplicationName failed with HRESULT '0x80004005' ('Unspecified error.')")}},
        CheckBranch{"applicationNull", Faults::eGetApplicationName, S_OK, Faults::eNULL, eUNKNOWN_ERROR,
                    {CHECK_LINE("GetApplicationName succeeded but returned NULL string")}},
        CheckBranch{"triggerFails", Faults::eGetTrigger, SCHED_E_TRIGGER_NOT_FOUND, Faults::eAUTO, eUNKNOWN_ERROR,
                    {CHECK_LINE("task->GetTrigger failed with HRESULT '0x80041309' ('A task's trigger is not "
                                "found.')")}},
        CheckBranch{"triggerNull", Faults::eGetTrigger, S_OK, Faults::eNULL, eUNKNOWN_ERROR,
                    {CHECK_LINE("GetTrigger OK but smart pointer is NULL")}},
        // The record read is not examined: a failed read leaves it zero, which is not daily.
        CheckBranch{"triggerRecordFails", Faults::eTriggerGetTrigger, E_FAIL, Faults::eAUTO, eWRONG_SETTINGS,
                    {CHECK_LINE("unexpected (not daily) trigger settings '0'")}}),
    [](const auto& info) { return std::string(info.param.name); });
}
