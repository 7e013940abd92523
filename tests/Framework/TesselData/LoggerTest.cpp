#include "LogCapture.h"
#include "TempDir.h"
#include "TesselLog_Static.h"
#include "WideString.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cctype>
#include <sstream>
#include <thread>

namespace
{
// Restores the logger's process-wide settings after each test.
class Logger : public ::testing::Test
{
protected:
    void TearDown() override
    {
        TesselLog_Static::setLogFile(ACE_WString());
        TesselLog_Static::setLevel_static(10);
    }
};

void logOneOfEach()
{
    TesselLog_Static::logTrace_static("Comp", "Comp.dll", "Trace", L"[A::b] : Method started");
    TesselLog_Static::logInformation_static("Comp", "Comp.dll", "Info", L"100% done");
    TesselLog_Static::logWarning_static("Comp", "Comp.dll", "Warn", L"Żółć");
    TesselLog_Static::logError_static("Comp", "Comp.dll", "ErrN", -1, "id %S failed '%i'", L"王", 5);
    TesselLog_Static::logError_static("Comp", "Comp.dll", "ErrW", 7, L"%s / %S", L"wide", "narrow");
    TesselLog_Static::log_static(16, 0, "Comp", "Comp.dll", "Fail", L"hr 0x%lX: %S", 0x80070005UL, "denied");
    TesselLog_Static::log_static(1, 0, "Comp", "Comp.dll", "Tol", L"task %s", L"T_user");
}

TEST_F(Logger, SinksReceiveEveryRecordWithLevelCodeAndExactMessage)
{
    TesselLog_Static::setLevel_static(0); // the file's verbosity does not limit sinks
    LogCapture log;
    logOneOfEach();
    const struct
    {
        int level;
        int code;
        const char* className;
        const char* message;
    } expected[] = {
        {TesselLog_Static::eTRACE, 0, "Trace", "[A::b] : Method started"},
        {TesselLog_Static::eINFORMATION, 0, "Info", "100% done"},
        {TesselLog_Static::eWARNING, 0, "Warn", "Żółć"},
        {TesselLog_Static::eERROR, -1, "ErrN", "id 王 failed '5'"},
        {TesselLog_Static::eERROR, 7, "ErrW", "wide / narrow"},
        {16, 0, "Fail", "hr 0x80070005: denied"},
        {1, 0, "Tol", "task T_user"},
    };
    const auto records = log.records();
    ASSERT_EQ(records.size(), sizeof expected / sizeof expected[0]);
    for (std::size_t i = 0; i < records.size(); ++i)
    {
        EXPECT_EQ(records[i].level, expected[i].level) << i;
        EXPECT_EQ(records[i].code, expected[i].code) << i;
        EXPECT_EQ(records[i].component, "Comp");
        EXPECT_EQ(records[i].file, "Comp.dll");
        EXPECT_EQ(records[i].className, expected[i].className);
        EXPECT_EQ(WideString::toUtf8(records[i].message), expected[i].message) << i;
    }
}

// "YYYY-MM-DD HH:MM:SS.mmm " at the start of a line.
bool hasTimestamp(const std::string& line)
{
    const std::string shape = "dddd-dd-dd dd:dd:dd.ddd ";
    if (line.size() < shape.size())
        return false;
    for (std::size_t i = 0; i < shape.size(); ++i)
        if (shape[i] == 'd' ? !std::isdigit(static_cast<unsigned char>(line[i])) : line[i] != shape[i])
            return false;
    return true;
}

std::vector<std::string> lines(const std::string& text)
{
    std::vector<std::string> result;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);)
        result.push_back(line);
    return result;
}

TEST_F(Logger, FileGetsAllLinesInRecordingModeAndOnlyProblemsOtherwise)
{
    TempDir dir;
    const std::string path = dir.file("sub folder/ünï.log");
    std::filesystem::create_directories(dir.file("sub folder"));
    ASSERT_TRUE(TesselLog_Static::setLogFile(WideString::fromUtf8(path)));
    EXPECT_EQ(WideString::toUtf8(TesselLog_Static::getLogFile()), path);
    EXPECT_EQ(TesselLog_Static::getLevel_static(), 10);

    TesselLog_Static::setLevel_static(0);
    logOneOfEach();
    const auto quiet = lines(TempDir::read(path));
    ASSERT_EQ(quiet.size(), 4u);
    for (const auto& line : quiet)
        EXPECT_TRUE(hasTimestamp(line)) << line;
    EXPECT_NE(quiet[0].find(" WARNING Comp Comp.dll Warn [0]: Żółć"), std::string::npos) << quiet[0];
    EXPECT_NE(quiet[1].find(" ERROR Comp Comp.dll ErrN [-1]: id 王 failed '5'"), std::string::npos) << quiet[1];
    EXPECT_NE(quiet[3].find("Fail [0]: hr 0x80070005: denied"), std::string::npos) << quiet[3];

    TesselLog_Static::setLevel_static(10);
    logOneOfEach();
    const auto all = lines(TempDir::read(path));
    ASSERT_EQ(all.size(), 4u + 7u);
    EXPECT_NE(all[4].find(" TRACE Comp Comp.dll Trace [0]: [A::b] : Method started"), std::string::npos);
    EXPECT_NE(all[10].find("Tol [0]: task T_user"), std::string::npos);

    ASSERT_TRUE(TesselLog_Static::setLogFile(ACE_WString()));
    logOneOfEach();
    EXPECT_EQ(lines(TempDir::read(path)).size(), 11u);
    EXPECT_FALSE(TesselLog_Static::setLogFile(WideString::fromUtf8(dir.file("missing/x.log"))));
}

TEST_F(Logger, SinksMayLogAndRemoveSinksWithoutDeadlock)
{
    LogCapture log;
    int handle = 0;
    int calls = 0;
    handle = TesselLog_Static::addSink([&](const TesselLog_Static::Record& record) {
        ++calls;
        if (record.className == "outer")
        {
            TesselLog_Static::logWarning_static("c", "f", "inner", L"from a sink");
            TesselLog_Static::removeSink(handle);
        }
    });
    TesselLog_Static::logTrace_static("c", "f", "outer", L"first");
    TesselLog_Static::logTrace_static("c", "f", "outer", L"second");
    EXPECT_EQ(calls, 2); // "first", then "from a sink" reached it before it removed itself
    EXPECT_EQ(log.messages(), (std::vector<std::string>{"first", "from a sink", "second"}));
    TesselLog_Static::removeSink(handle); // a second removal is harmless
}

TEST_F(Logger, RemovedSinkIsNeverCalledAgainWhileOthersLog)
{
    std::atomic<bool> stop{false};
    std::vector<std::thread> writers;
    for (int t = 0; t < 2; ++t)
        writers.emplace_back([&stop] {
            while (!stop.load())
                TesselLog_Static::logTrace_static("c", "f", "k", L"busy");
        });
    for (int round = 0; round < 100; ++round)
    {
        std::atomic<int> calls{0};
        std::atomic<int> inside{0};
        const int handle = TesselLog_Static::addSink([&](const TesselLog_Static::Record&) {
            ++inside;
            ++calls;
            for (int i = 0; i < 200; ++i) // stay a while, so removal often meets a running call
                std::this_thread::yield();
            --inside;
        });
        while (calls.load() == 0)
            std::this_thread::yield();
        TesselLog_Static::removeSink(handle);
        // Removal waits for running calls, and no call starts after it.
        ASSERT_EQ(inside.load(), 0) << "round " << round;
        const int afterRemoval = calls.load();
        TesselLog_Static::logTrace_static("c", "f", "k", L"after");
        ASSERT_EQ(calls.load(), afterRemoval) << "round " << round;
    }
    stop = true;
    for (auto& writer : writers)
        writer.join();
}
}
