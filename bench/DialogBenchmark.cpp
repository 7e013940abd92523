// The tool-configuration dialog's operations (open, OK, Cancel, a file-changed event) and the
// typed-value files' load and save, each beside a lower bound doing the same essential work in
// the same binary.
//
// Two modes:
//   DialogBenchmark [Google Benchmark options]      timings of every case
//   DialogBenchmark --count CASE ARG ITERATIONS     runs CASE's operation ITERATIONS times inside
//       ptc_measured_region, after one warm-up run; `valgrind --tool=callgrind
//       --collect-atstart=no --toggle-collect=ptc_measured_region` then counts only those runs.
// ARG is the number of brands for the dialog cases and the file size in KiB for the file cases.

#include "BenchSetup.h"

#include <benchmark/benchmark.h>

#include <QApplication>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <map>
#include <memory>
#include <string>

namespace
{
// One measured operation with its setup: made for an argument, then run again and again.
using Operation = std::function<void()>;
using Maker = std::function<Operation(BenchSetup& setup, int arg)>;

struct Case
{
    const char* name;
    bool dialog; // ARG is a brand count; otherwise a file size in KiB
    Maker make;
};

Operation open(BenchSetup& s, int)
{
    return [&s] { s.openAndClose(); };
}

Operation openLowerBound(BenchSetup& s, int)
{
    return [&s] { s.parseAndPublishLowerBound(); };
}

Operation cancel(BenchSetup& s, int)
{
    s.openKept();
    return [&s] { s.cancel(); };
}

Operation ok(BenchSetup& s, int)
{
    s.openKept();
    return [&s] { s.ok(); };
}

Operation okLowerBound(BenchSetup& s, int)
{
    return [&s] { s.serialiseLowerBound(false); };
}

Operation okLowerBoundWithIo(BenchSetup& s, int)
{
    return [&s] { s.serialiseLowerBound(true); };
}

Operation changed(BenchSetup& s, BenchSetup::File file)
{
    s.openKept();
    return [&s, file] { s.fileChanged(file); };
}

Operation typedLoad(BenchSetup& s, int kib)
{
    s.writeTypedValueFile(kib);
    return [&s] { s.loadTypedValueFile(); };
}

Operation typedLoadLowerBound(BenchSetup& s, int kib)
{
    s.writeTypedValueFile(kib);
    return [&s] { s.parseTypedValueFileLowerBound(); };
}

Operation typedSave(BenchSetup& s, int kib)
{
    s.writeTypedValueFile(kib);
    s.loadTypedValueFile();
    return [&s] { s.saveTypedValueFile(); };
}

Operation typedSaveLowerBound(BenchSetup& s, int kib)
{
    s.writeTypedValueFile(kib);
    return [&s] { s.serialiseTypedValueFileLowerBound(); };
}

const Case kCases[] = {
    {"Open", true, open},
    {"Open_LowerBound", true, openLowerBound},
    {"Cancel", true, cancel},
    {"Cancel_LowerBound", true, openLowerBound},
    {"OK", true, ok},
    {"OK_LowerBound", true, okLowerBound},
    {"OK_LowerBoundWithIo", true, okLowerBoundWithIo},
    {"ChangedWorkshop", true, [](BenchSetup& s, int) { return changed(s, BenchSetup::File::Workshop); }},
    {"ChangedUsers", true, [](BenchSetup& s, int) { return changed(s, BenchSetup::File::Users); }},
    {"ChangedUpdate", true, [](BenchSetup& s, int) { return changed(s, BenchSetup::File::Update); }},
    {"Changed_LowerBound", true, openLowerBound},
    {"TypedLoad", false, typedLoad},
    {"TypedLoad_LowerBound", false, typedLoadLowerBound},
    {"TypedSave", false, typedSave},
    {"TypedSave_LowerBound", false, typedSaveLowerBound},
};

const int kBrandCounts[] = {20, 200, 2000};
// The largest is 1 MiB, under the settings-file size limit (4 MiB).
const int kFileKiB[] = {2, 100, 1024};

const Case* findCase(const char* name)
{
    for (const Case& c : kCases)
        if (std::strcmp(c.name, name) == 0)
            return &c;
    return nullptr;
}

std::unique_ptr<BenchSetup> makeSetup(const Case& c, int arg)
{
    return std::make_unique<BenchSetup>(c.dialog ? arg : 20);
}

void runCase(benchmark::State& state, const Case* c)
{
    const int arg = static_cast<int>(state.range(0));
    std::unique_ptr<BenchSetup> setup = makeSetup(*c, arg);
    Operation operation = c->make(*setup, arg);
    for (auto _ : state)
        operation();
}

void registerAll()
{
    for (const Case& c : kCases)
    {
        benchmark::internal::Benchmark* b =
            benchmark::RegisterBenchmark((std::string("BM_") + c.name).c_str(), runCase, &c);
        if (c.dialog)
            for (int brands : kBrandCounts)
                b->Arg(brands);
        else
            for (int kib : kFileKiB)
                b->Arg(kib);
        b->Unit(benchmark::kMicrosecond);
    }
}
}

// Only the calls made in here are counted under callgrind (see the top of the file).
extern "C" __attribute__((noinline)) void ptc_measured_region(const Operation* operation, int iterations)
{
    for (int i = 0; i < iterations; ++i)
        (*operation)();
    __asm__ volatile("" ::: "memory");
}

int main(int argc, char** argv)
{
    if (!qEnvironmentVariableIsSet("QT_QPA_PLATFORM"))
        qputenv("QT_QPA_PLATFORM", "offscreen");
    QApplication application(argc, argv);
    if (argc == 5 && std::strcmp(argv[1], "--count") == 0)
    {
        const Case* c = findCase(argv[2]);
        const int arg = std::atoi(argv[3]);
        const int iterations = std::atoi(argv[4]);
        if (c == nullptr || arg <= 0 || iterations <= 0)
        {
            std::fprintf(stderr, "usage: %s --count CASE ARG ITERATIONS\n", argv[0]);
            return 2;
        }
        std::unique_ptr<BenchSetup> setup = makeSetup(*c, arg);
        Operation operation = c->make(*setup, arg);
        operation();
        ptc_measured_region(&operation, iterations);
        return 0;
    }
    registerAll();
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
