#include "LogCapture.h"
#include "TempDir.h"
#include "TestText.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cctype>
#include <memory>
#include <sstream>
#include <thread>
#include <tuple>

namespace
{
// The log's lines without their time stamps ("YYYY-MM-DD hh:mm:ss.mmm "); a line without one is
// kept whole, so a missing stamp shows in the comparison.
std::string withoutStamps(const std::string& log)
{
    std::string result, line;
    for (std::istringstream lines(log); std::getline(lines, line);)
    {
        std::string shape = line.substr(0, 24);
        for (char& c : shape)
            c = std::isdigit(static_cast<unsigned char>(c)) != 0 ? 'd' : c == 'd' ? 'x' : c; // a letter d is no digit
        result += (shape == "dddd-dd-dd dd:dd:dd.ddd " ? line.substr(24) : line) + "\n";
    }
    return result;
}

TEST(Logger, FileGetsAllLinesInRecordingModeAndOnlyProblemsOtherwise)
{
    TempDir dir;
    const std::string path = dir.file("sub folder/ünï.log");
    std::filesystem::create_directories(dir.file("sub folder"));
    ASSERT_TRUE(TesselLog_Static::setLogFile(wide(path)));
    EXPECT_TRUE(utf8(TesselLog_Static::getLogFile()) == path && TesselLog_Static::getLevel_static() == 10);
    const auto logOneOfEach = [] {
        TesselLog_Static::logTrace_static("Comp", "Comp.dll", "Trace", L"[A::b] : started");
        TesselLog_Static::logInformation_static("Comp", "Comp.dll", "Info", L"100% done");
        TesselLog_Static::logWarning_static("Comp", "Comp.dll", "Warn", L"Żółć");
        TesselLog_Static::logError_static("Comp", "Comp.dll", "ErrN", -1, "id %S failed '%i'", L"王", 5);
        TesselLog_Static::log_static(16, 0, "Comp", "Comp.dll", "Fail", L"hr 0x%lX: %S", 0x80070005UL, "denied");
        TesselLog_Static::log_static(3, 2, "Comp", "Comp.dll", nullptr, L"level %d", 3);
    };
    const std::string problems = "WARNING Comp Comp.dll Warn [0]: Żółć\n"
                                 "ERROR Comp Comp.dll ErrN [-1]: id 王 failed '5'\n"
                                 "ERROR Comp Comp.dll Fail [0]: hr 0x80070005: denied\n";
    const std::string all = "TRACE Comp Comp.dll Trace [0]: [A::b] : started\n"
                            "INFORMATION Comp Comp.dll Info [0]: 100% done\n" +
                            problems + "LEVEL3 Comp Comp.dll - [2]: level 3\n";
    TesselLog_Static::setLevel_static(0);
    logOneOfEach();
    TesselLog_Static::setLevel_static(10);
    logOneOfEach();
    ASSERT_TRUE(TesselLog_Static::setLogFile(ACE_WString()));
    logOneOfEach(); // goes to no file
    EXPECT_FALSE(TesselLog_Static::setLogFile(wide(dir.file("missing/x.log"))));
    EXPECT_EQ(withoutStamps(TempDir::read(path)), problems + all);
}

// Sinks may log and remove themselves; removal waits for calls running on other threads,
// and no call starts after it.
TEST(Logger, RemovedSinkIsNeverCalledAgainWhileOthersLog)
{
    LogCapture log;
    int handle = 0;
    handle = TesselLog_Static::addSink([&handle](const TesselLog_Static::Record& record) {
        if (record.className == "outer")
        {
            TesselLog_Static::logError_static("c", "f", "inner", 0, L"from a %s", L"sink");
            TesselLog_Static::removeSink(handle);
        }
    });
    TesselLog_Static::logTrace_static("c", "f", "outer", L"first");
    TesselLog_Static::logTrace_static("c", "f", "outer", L"second");
    EXPECT_EQ(log.messages(), (std::vector<std::string>{"first", "from a sink", "second"}));
    TesselLog_Static::removeSink(handle); // a second removal is harmless

    std::atomic<bool> stop{false};
    std::thread writer([&stop] {
        while (!stop)
            TesselLog_Static::logTrace_static("c", "f", "k", L"busy");
    });
    int failures = 0;
    for (int round = 0; round < 50; ++round)
    {
        std::atomic<int> calls{0};
        std::atomic<bool> inside{false};
        handle = TesselLog_Static::addSink([&](const TesselLog_Static::Record&) {
            inside = true;
            ++calls;
            std::this_thread::yield();
            inside = false;
        });
        while (calls == 0)
            std::this_thread::yield();
        TesselLog_Static::removeSink(handle);
        const int afterRemoval = calls;
        TesselLog_Static::logTrace_static("c", "f", "k", L"after");
        failures += inside || calls != afterRemoval;
    }
    stop = true;
    writer.join();
    EXPECT_EQ(failures, 0);
}

// The entry points drop a line before formatting it when neither the file (at its verbosity)
// nor a sink takes it.
TEST(Logger, LineIsRecordedOnlyWhenTheFileOrASinkTakesIt)
{
    TempDir dir;
    const std::string path = dir.file("levels.log");
    const int trace = TesselLog_Static::eTRACE, warning = TesselLog_Static::eWARNING;
    // to a file, the sink's level (0: no sink), the verbosity, the line's level, recorded
    const std::tuple<bool, int, int, int, bool> cases[] = {
        {false, 0, 10, TesselLog_Static::eERROR, false},
        {true, 0, 10, trace, true},
        {true, 0, 0, trace, false},
        {true, 0, 0, TesselLog_Static::eINFORMATION, false},
        {true, 0, 0, warning, true},
        {true, 0, 0, TesselLog_Static::eERROR, true},
        {false, trace, 0, trace, true},
        {true, trace, 0, trace, true},
        {false, warning, 10, trace, false},
        {false, warning, 0, warning, true},
    };
    for (const auto& [file, sinkLevel, verbosity, level, recorded] : cases)
    {
        ASSERT_TRUE(TesselLog_Static::setLogFile(file ? wide(path) : ACE_WString()));
        TesselLog_Static::setLevel_static(verbosity);
        int received = 0;
        const int sink =
            sinkLevel == 0
                ? 0
                : TesselLog_Static::addSink([&received](const TesselLog_Static::Record&) { ++received; }, sinkLevel);
        EXPECT_EQ(TesselLog_Static::isRecorded_static(level), recorded)
            << file << sinkLevel << " verbosity " << verbosity << " level " << level;
        TesselLog_Static::log_static(level, 0, "c", "f", "k", L"line");
        EXPECT_EQ(received, sinkLevel != 0 && level >= sinkLevel ? 1 : 0) << "sink of level " << sinkLevel;
        TesselLog_Static::removeSink(sink);
    }
    TesselLog_Static::setLevel_static(10); // the last case left no file
}
}
