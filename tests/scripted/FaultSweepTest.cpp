// Makes each OpenCL and OpenGL call of the operations on buffers, kernels and shared buffers fail,
// once and permanently: the result and the reports are as documented, nothing leaks, and a retry
// succeeds.
#include "FaultBench.h"

#include <functional>
#include <set>

using namespace scripted;

namespace {

constexpr int kTheStatus = 1000; // stands for the status of the failing call

struct Row : Named {
    std::function<void(Bench&)> prepare;
    std::function<int(Bench&)> run; // the operation's result as a number
    // Results that differ from a run without faults, by failing function.
    std::map<std::string, int> results{};
    // Numbers of warnings, if not one for an OpenCL function and none for an OpenGL function.
    std::map<std::string, std::size_t> reports{};
    // Misuse that the rules require after a failure.
    std::set<std::string> prescribed{};
    // The first attempt consumed its subject: prepare it again before the retry.
    bool fresh = false;
};

class FaultSweep : public ScriptedTest, public ::testing::WithParamInterface<Row> {
protected:
    void SetUp() override { startInModes(2, 3); }

    // Returns the functions that a run without faults calls, and stores its result.
    Lines runWithout()
    {
        Bench bench;
        GetParam().prepare(bench);
        calls();
        fResult = GetParam().run(bench);
        return functionsOf(calls());
    }
    void runWith(const Fault& fault, const Lines& functions);
    void checkReports(const Fault& fault, const Lines& functions);

    // Returns the expected result: that of the last function that fails.
    int resultWith(const Fault& fault, const Lines& functions) const
    {
        int result = fResult;
        const std::size_t first = fault.nth - 1;
        const std::size_t last = fault.onwards ? functions.size() : fault.nth;
        for (std::size_t i = first; i < last; ++i) {
            const auto stated = GetParam().results.find(functions[i]);
            if (stated != GetParam().results.end())
                result = stated->second == kTheStatus ? fault.status : stated->second;
        }
        return result;
    }

    int fResult = 0;
};

void FaultSweep::checkReports(const Fault& fault, const Lines& functions)
{
    const Lines reported = warnings();
    for (const std::string& text : reported)
        EXPECT_TRUE(text.starts_with("OpenCL error: CL_") || text == machine.buildLog) << text;
    if (fault.onwards)
        return;
    const std::string& function = functions[fault.nth - 1];
    const auto stated = GetParam().reports.find(function);
    const std::size_t usual = function.starts_with("cl") ? 1 : 0;
    EXPECT_EQ(reported.size(), stated != GetParam().reports.end() ? stated->second : usual);
}

void FaultSweep::runWith(const Fault& fault, const Lines& functions)
{
    const Row& row = GetParam();
    SCOPED_TRACE(functions[fault.nth - 1] + ", call " + std::to_string(fault.nth) +
                 (fault.onwards ? " and all later" : "") + ", status " +
                 std::to_string(fault.status));
    const Lines before = runtime().balance();
    {
        Bench bench;
        row.prepare(bench);
        runtime().plan(fault);
        EXPECT_EQ(row.run(bench), resultWith(fault, functions));
        runtime().clearFaults();
        checkReports(fault, functions);

        if (row.fresh)
            row.prepare(bench);
        EXPECT_EQ(row.run(bench), fResult) << "retry";
    }
    EXPECT_EQ(runtime().balance(), before);
    EXPECT_EQ(host().deviceMemory, 0U);
    for (const std::string& note : runtime().takeMisuse())
        EXPECT_TRUE(row.prescribed.contains(note)) << note;
    warnings();
}

TEST_P(FaultSweep, EachFailingCallIsReportedAndRetrySucceeds)
{
    const Lines functions = runWithout();
    ASSERT_FALSE(functions.empty());
    for (unsigned nth = 1; nth <= functions.size(); ++nth) {
        for (const bool onwards : {false, true}) {
            for (const cl_int status : {CL_OUT_OF_RESOURCES, CL_OUT_OF_HOST_MEMORY})
                runWith({.function = "*", .status = status, .nth = nth, .onwards = onwards},
                        functions);
        }
    }
}

const std::string kCreate = "clCreateBuffer";
const std::string kMap = "clEnqueueMapBuffer";
const std::string kWait = "clWaitForEvents";
const std::string kWrite = "clEnqueueWriteBuffer";
const std::string kRead = "clEnqueueReadBuffer";
const std::string kBuild = "clBuildProgram";
const std::string kBuilt = "clGetProgramBuildInfo";
const std::string kFromGL = "clCreateFromGLBuffer";
const std::string kAcquire = "clEnqueueAcquireGLObjects";
const std::string kRelease = "clEnqueueReleaseGLObjects";
const std::string kRetainEvent = "clRetainEvent";
const std::string kNoMemory = kWrite + ": null";
const std::set<std::string> kNotAcquired = {kRelease + ": not acquired"};
const std::set<std::string> kNotReleased = {kAcquire + ": already acquired",
                                            kRelease + ": not acquired"};
using B = Bench;

// Rows are kept on one line.
// clang-format off
const Row kBufferRows[] = {
    {"EnsureEmpty", [](B& b) { b.makeBuffer(0); }, [](B& b) { return b.buffer->ensureBufferCapacity(64); },
     {{kCreate, kTheStatus}, {kMap, kTheStatus}}, {{kCreate, 0}, {kMap, 0}}, {}, true},
    {"EnsureGrows", [](B& b) { b.makeBuffer(64); }, [](B& b) { return b.buffer->ensureBufferCapacity(65); },
     {{kCreate, kTheStatus}, {kMap, kTheStatus}}, {{kCreate, 0}, {kMap, 0}}, {}, true},
    {"EnsurePending", [](B& b) { b.makeBuffer(64, true); }, [](B& b) { return b.buffer->ensureBufferCapacity(64); }, {{kWait, kTheStatus}}},
    {"UploadFitting", [](B& b) { b.makeBuffer(64, true); }, [](B& b) { return b.upload(0, 64); }, {{kWrite, kTheStatus}}, {{kWrite, 0}}},
    {"UploadGrowsAtTheStart", [](B& b) { b.makeBuffer(64, true); }, [](B& b) { return b.upload(0, 65); },
     {{kCreate, kTheStatus}}, {{kCreate, 0}}, {}, true},
    {"UploadGrowsElsewhere", [](B& b) { b.makeBuffer(64, true); }, [](B& b) { return b.upload(8, 64); },
     {{kCreate, CL_INVALID_MEM_OBJECT}, {kWrite, kTheStatus}}, {{kCreate, 2}}, {kNoMemory}, true},
    {"ReadBack", [](B& b) { b.makeBuffer(64, true); }, [](B& b) { return b.readBack(); }, {{kRead, kTheStatus}}, {{kRead, 0}}},
    {"Reset", [](B& b) { b.makeBuffer(64, true); }, [](B& b) { b.buffer->reset(); return int(b.buffer->capacityInBytes()); }, {}, {}, {}, true},
    {"PoolCreates", [](B& b) { b.makePool(0); }, [](B& b) { return b.fromPool(64); }, {{kCreate, 0}}, {{kCreate, 0}}},
    {"PoolReuses", [](B& b) { b.makePool(64); }, [](B& b) { return b.fromPool(64); }, {}, {}, {}, true},
    {"DataMap", [](B& b) { b.makePool(64); }, [](B& b) { return b.mapTwice(); }},
};
const Row kRuntimeRows[] = {
    {"KernelBuilt", [](B& b) { b.makeStore(); }, [](B& b) { return b.getKernel(); },
     {{"clCreateProgramWithSource", 0}, {kBuild, 0}, {kBuilt, 0}, {"clCreateKernel", 0}}, {{kBuild, 2}, {kBuilt, 2}}},
    {"KernelFreed", [](B& b) { b.makeStore(); b.getKernel(); }, [](B& b) { return int{b.store->freeKernel(b.kernel)}; }, {}, {}, {}, true},
    {"StoreDestroyed", [](B& b) { b.makeStore(); b.getKernel(); }, [](B& b) { b.store.reset(); return 0; }, {}, {}, {}, true},
};
const Row kSharedRows[] = {
    {"Create", [](B& b) { b.makeManager(0); }, [](B& b) { return b.createShared(); }, {{kFromGL, 0}}, {{kFromGL, 0}}},
    {"DestroyUnbatched", [](B& b) { b.makeManager(2); }, [](B& b) { return b.destroy(); }, {}, {}, {}, true},
    {"DestroyBatched", [](B& b) { b.makeManager(2); b.evaluate(); }, [](B& b) { return b.destroy(); }, {{kWait, kTheStatus}}, {}, {}, true},
    {"DestroyAcquired", [](B& b) { b.makeManager(2); b.open(); }, [](B& b) { return b.destroy(); }, {}, {}, {}, true},
    {"LeaveBatch", [](B& b) { b.makeManager(2); b.evaluate(); }, [](B& b) { return b.leaveBatch(); }, {}, {}, {}, true},
    {"LeaveAcquiredBatch", [](B& b) { b.makeManager(2); b.open(); }, [](B& b) { return b.leaveBatch(); }, {}, {}, kNotReleased, true},
    {"PreEvaluate", [](B& b) { b.makeManager(2); b.manager->RenderingComplete(); }, [](B& b) { b.open(); return 0; },
     {}, {{kRetainEvent, 0}}, kNotAcquired, true},
    {"AcquireBatched", [](B& b) { b.makeManager(2); b.open(); }, [](B& b) { return b.acquire(); }, {}, {{kRetainEvent, 0}}},
    {"AcquireUnbatched", [](B& b) { b.makeManager(1); b.manager->RenderingComplete(); }, [](B& b) { return b.acquire(); },
     {{kAcquire, kTheStatus}}, {{kAcquire, 0}}, {}, true},
    {"ReleaseUnbatched", [](B& b) { b.makeManager(1); b.acquire(); }, [](B& b) { return b.release(); },
     {{kRelease, kTheStatus}}, {{kRelease, 0}}, {}, true},
    {"ReportEvent", [](B& b) { b.makeManager(2); b.open(); b.acquire(); }, [](B& b) { return b.reportEvent(); }},
    {"PostEvaluate", [](B& b) { b.makeManager(2); b.open(); b.createShared(); }, [](B& b) { b.close(); return 0; }, {}, {}, kNotReleased, true},
    {"RenderingComplete", [](B& b) { b.makeManager(1); b.manager->RenderingComplete(); }, [](B& b) { b.manager->RenderingComplete(); return 0; }},
};
// clang-format on

const auto kName = ::testing::PrintToStringParamName();
INSTANTIATE_TEST_SUITE_P(Buffers, FaultSweep, ::testing::ValuesIn(kBufferRows), kName);
INSTANTIATE_TEST_SUITE_P(Runtime, FaultSweep, ::testing::ValuesIn(kRuntimeRows), kName);
INSTANTIATE_TEST_SUITE_P(Shared, FaultSweep, ::testing::ValuesIn(kSharedRows), kName);

} // namespace
