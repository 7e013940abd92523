#include "ScheduledTaskTestSupport.h"

#include <filesystem>
#include <tuple>

namespace
{
using F = Faults;

// One call of the COM, scheduler or user layer fails, or succeeds handing out null, during one
// operation on a saved task with three triggers (none for eNewWorkItem): the operation, the call,
// its answer (S_OK: null handed out, unless `output` says otherwise), the operation's result (see
// ScheduledTaskTest::run), a fragment of a line logged, the output and the calls passed over.
const auto kNoService = eCAN_NOT_ACCESS_SERVICE;
const auto kUnknown = eUNKNOWN_ERROR;
const std::tuple<Op, F::Call, HRESULT, int, const char*, F::Output, int> kCases[] = {
    {kCreate, F::eCoCreateInstance, E_FAIL, 0, "CoCreateInstance(CLSID_CTaskScheduler) failed", F::eAUTO, 0},
    {kCreate, F::eCoCreateInstance, S_OK, 0, "CoCreateInstance(CLSID_CTaskScheduler) OK but", F::eAUTO, 0},
    {kCreate, F::eActivate, E_FAIL, 0, "createScheduledTask: getExistingTask('", F::eAUTO, 0},
    {kCreate, F::eGetTriggerCount, E_FAIL, 0, "GetTriggerCount failed", F::eAUTO, 0},
    {kCreate, F::eDeleteTrigger, E_INVALIDARG, 0, "DeleteTrigger('1') failed", F::eAUTO, 1},
    {kCreate, F::eNewWorkItem, E_FAIL, 0, "NewWorkItem('", F::eAUTO, 0},
    {kCreate, F::eNewWorkItem, S_OK, 0, "NewWorkItem OK but", F::eAUTO, 0},
    {kCreate, F::eSetApplicationName, E_FAIL, 0, "SetApplicationName('/opt/agent/UpdaterAgent') failed", F::eAUTO, 0},
    {kCreate, F::eSetParameters, E_FAIL, 0, "SetParameters('preparer') failed", F::eAUTO, 0},
    {kCreate, F::eGetUserName, 1332, 0, "GetUserNameW failed with last error '1332'", F::eAUTO, 0},
    {kCreate, F::eSetAccountInformation, E_ACCESSDENIED, 0, "SetAccountInformation('", F::eAUTO, 0},
    {kCreate, F::eSetFlags, E_FAIL, 0, "SetFlags('8193') failed", F::eAUTO, 0},
    {kCreate, F::eCreateTrigger, E_OUTOFMEMORY, 0, "createTrigger failed", F::eAUTO, 0},
    {kCreate, F::eCreateTrigger, S_OK, 0, "CreateTrigger OK but", F::eAUTO, 0},
    {kCreate, F::eTriggerSetTrigger, E_INVALIDARG, 0, "SetTrigger failed", F::eAUTO, 0},
    {kCreate, F::eQueryInterface, E_NOINTERFACE, 0, "QueryInterface(IID_IPersistFile) failed", F::eAUTO, 0},
    {kCreate, F::eQueryInterface, S_OK, 0, "QueryInterface(IID_IPersistFile) OK but", F::eAUTO, 0},
    {kCreate, F::eSave, static_cast<HRESULT>(0x80070070), 0, "Save failed with HRESULT '0x80070070' ('No space left",
     F::eAUTO, 0},
    {kDelete, F::eCoCreateInstance, E_FAIL, 0, "deleteScheduledTask: CoCreateInstance(CLSID_CTaskScheduler) failed",
     F::eAUTO, 0},
    {kDelete, F::eCoCreateInstance, S_OK, 0, "deleteScheduledTask:CoCreateInstance(CLSID_CTaskScheduler) was OK",
     F::eAUTO, 0},
    {kAvailable, F::eCoCreateInstance, E_FAIL, 0, "CoCreateInstance(CLSID_CTaskScheduler) failed", F::eAUTO, 0},
    {kAvailable, F::eCoCreateInstance, S_OK, 0, "CoCreateInstance(CLSID_CTaskScheduler) was OK but", F::eAUTO, 0},
    {kCheck, F::eCoInitialize, RPC_E_CHANGED_MODE, kNoService,
     "HRESULT '0x800401F0' ('CoInitialize has not been called.')", F::eAUTO, 0},
    {kCheck, F::eCoCreateInstance, S_OK, kNoService, "CoCreateInstance(CLSID_CTaskScheduler) OK but", F::eAUTO, 0},
    {kCheck, F::eActivate, S_OK, kNoService, "returns S_OK but rTaskPtr is NULL", F::eAUTO, 0},
    {kCheck, F::eActivate, static_cast<HRESULT>(0x80070002), kNoService, "COR_E_FILENOTFOUND but rTaskPtr is not NULL",
     F::eOBJECT, 0},
    {kCheck, F::eActivate, E_ACCESSDENIED, eOK, "most likely tasks exists", F::eOBJECT,
     0}, // the task handed out is checked
    {kCheck, F::eActivate, SCHED_E_UNKNOWN_OBJECT_VERSION, kNoService, "failed with documented HRESULT '0x80041313'",
     F::eAUTO, 0},
    {kCheck, F::eActivate, E_FAIL, kNoService, "failed with undocumented HRESULT '0x80004005' ('Unspecified error.')",
     F::eAUTO, 0},
    {kCheck, F::eGetStatus, S_FALSE, kUnknown, "GetStatus failed with HRESULT '0x1'", F::eAUTO, 0},
    {kCheck, F::eGetFlags, E_FAIL, kUnknown, "GetFlags failed", F::eAUTO, 0},
    {kCheck, F::eGetParameters, E_FAIL, kUnknown, "GetParameters failed", F::eAUTO, 0},
    {kCheck, F::eGetParameters, S_OK, kUnknown, "GetParameters succeeded but returned NULL", F::eAUTO, 0},
    {kCheck, F::eGetApplicationName, E_FAIL, kUnknown, "GetApplicationName failed", F::eAUTO, 0},
    {kCheck, F::eGetApplicationName, S_OK, kUnknown, "GetApplicationName succeeded but returned NULL", F::eAUTO, 0},
    {kCheck, F::eGetTrigger, SCHED_E_TRIGGER_NOT_FOUND, kUnknown, "task->GetTrigger failed", F::eAUTO, 0},
    {kCheck, F::eGetTrigger, S_OK, kUnknown, "GetTrigger OK but", F::eAUTO, 0},
    // The record read is not examined: a failed read leaves it zero, which is not daily.
    {kCheck, F::eTriggerGetTrigger, E_FAIL, eWRONG_SETTINGS, "unexpected (not daily) trigger settings '0'", F::eAUTO,
     0},
};

TEST_F(ScheduledTaskTest, EachFaultGivesItsResultAndLineAndLeavesTheTaskAsItWas)
{
    TaskRecord record = goodRecord();
    record.triggers.push_back(trigger(TASK_TIME_TRIGGER_DAILY, 9, 0));
    record.triggers.push_back(trigger(TASK_TIME_TRIGGER_DAILY, 10, 0));
    for (const auto& [op, call, hr, expected, fragment, output, skip] : kCases)
    {
        SCOPED_TRACE(fragment);
        F::clear();
        std::filesystem::remove(taskPath());
        if (call != F::eNewWorkItem)
            writeTask(record);
        const std::string before = TempDir::read(taskPath());
        m_log.clear();
        F::inject(call, {hr, hr == S_OK && output == F::eAUTO ? F::eNULL : output, skip, -1});
        EXPECT_EQ(run(m_helper, op), expected);
        EXPECT_TRUE(m_log.containsSubstring(fragment)) << ::testing::PrintToString(m_log.messages());
        EXPECT_EQ(TempDir::read(taskPath()), before);
    }
}

// The exported lookup checks its inputs and releases what the caller's pointer held.
TEST_F(ScheduledTaskTest, GetExistingTaskReleasesWhatItHeldAndChecksItsInputs)
{
    writeTask(goodRecord());
    ASSERT_EQ(CoInitialize(nullptr), S_OK);
    void* scheduler = nullptr;
    IUnknown* held = nullptr;
    ASSERT_EQ(CoCreateInstance(CLSID_CTaskScheduler, nullptr, CLSCTX_INPROC_SERVER, IID_ITaskScheduler, &scheduler),
              S_OK);
    ComPtr<ITaskScheduler> owner(static_cast<ITaskScheduler*>(scheduler));
    ASSERT_EQ(owner->Activate(storedName().c_str(), IID_ITask, &held), S_OK);
    held->AddRef();
    ITask* task = static_cast<ITask*>(held);
    bool denied = true;
    EXPECT_FALSE(getExistingTask(nullptr, m_params, task, denied));
    EXPECT_TRUE(task == nullptr && !denied);
    EXPECT_EQ(held->Release(), 0u); // the function released the other reference
    EXPECT_FALSE(getExistingTask(owner.get(), ScheduledTaskParams::s_defaultParams, task, denied));
    EXPECT_EQ(m_log.messages(16),
              (Lines{"getExistingTask: rTaskSchedPtr is NULL", "getExistingTask: rParams is not valid"}));
    owner.reset(), CoUninitialize();
}
}
