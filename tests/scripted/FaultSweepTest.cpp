// Every public operation with every one of its OpenCL and OpenGL calls failing in turn, once and
// from there on: the stated result, the stated reports, nothing lost, and it works when tried
// again.
#include "FaultBench.h"

#include <functional>
#include <set>

using namespace scripted;

namespace {

constexpr int kTheStatus = 1000; // stands for the status of the failing call

struct Row {
    const char* name;
    std::function<void(Bench&)> prepare;
    std::function<int(Bench&)> run; // the operation's result as a number
    // Results other than that of a run without faults, by the function that fails.
    std::map<std::string, int> results{};
    // Numbers of warnings other than one for a function of OpenCL and none for OpenGL's.
    std::map<std::string, std::size_t> reports{};
    // Wrong use that the rules prescribe after a failure.
    std::set<std::string> prescribed{};
    // The first attempt used its subject up: prepare it once more before trying again.
    bool fresh = false;
};
void PrintTo(const Row& row, std::ostream* out)
{
    *out << row.name;
}

std::string functionOf(const std::string& line)
{
    return line.substr(0, line.find('('));
}

// The calls that can fail, by name.
Lines functionsOf(const Lines& lines)
{
    Lines functions;
    for (const std::string& line : lines) {
        if (line.starts_with("cl") || line.starts_with("gl"))
            functions.push_back(functionOf(line));
    }
    return functions;
}

class FaultSweep : public ScriptedTest, public ::testing::WithParamInterface<Row> {
protected:
    void SetUp() override
    {
        setEnvironment("VYRA_GRAPHICSTOOPENCL_SYNC_MODE", "2");
        setEnvironment("VYRA_OPENCLTOGRAPHICS_SYNC_MODE", "3");
        ASSERT_TRUE(start());
    }

    // The functions that a run without faults calls, and its result.
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

    // What the result has to be: the last function that fails decides.
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
        EXPECT_TRUE(text.starts_with("OpenCL error: CL_") || text == world.buildLog) << text;
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
        EXPECT_EQ(row.run(bench), fResult) << "tried again";
    }
    EXPECT_EQ(runtime().balance(), before);
    EXPECT_EQ(deviceMemory(), 0U);
    for (const std::string& note : runtime().takeMisuse())
        EXPECT_TRUE(row.prescribed.contains(note)) << note;
    warnings();
}

TEST_P(FaultSweep, EveryCallFailsInTurn)
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
const std::string kAcquireGL = "clEnqueueAcquireGLObjects";
const std::string kReleaseGL = "clEnqueueReleaseGLObjects";
const std::string kNoMemory = kWrite + ": null";
const std::string kNotAcquired = kReleaseGL + ": not acquired";
const std::string kAlreadyAcquired = kAcquireGL + ": already acquired";

const Row kBufferRows[] = {
    {"EnsureEmpty",
     [](Bench& b) { b.makeBuffer(0); },
     [](Bench& b) { return b.buffer->ensureBufferCapacity(64); },
     {{kCreate, kTheStatus}, {kMap, kTheStatus}},
     {{kCreate, 0}, {kMap, 0}},
     {},
     true},
    {"EnsureGrows",
     [](Bench& b) { b.makeBuffer(64); },
     [](Bench& b) { return b.buffer->ensureBufferCapacity(65); },
     {{kCreate, kTheStatus}, {kMap, kTheStatus}},
     {{kCreate, 0}, {kMap, 0}},
     {},
     true},
    {"EnsurePending",
     [](Bench& b) { b.makeBuffer(64, true); },
     [](Bench& b) { return b.buffer->ensureBufferCapacity(64); },
     {{kWait, kTheStatus}},
     {},
     {}},
    {"UploadFitting",
     [](Bench& b) { b.makeBuffer(64, true); },
     [](Bench& b) { return b.upload(0, 64); },
     {{kWrite, kTheStatus}},
     {{kWrite, 0}},
     {}},
    {"UploadGrowsAtTheStart",
     [](Bench& b) { b.makeBuffer(64, true); },
     [](Bench& b) { return b.upload(0, 65); },
     {{kCreate, kTheStatus}},
     {{kCreate, 0}},
     {},
     true},
    {"UploadGrowsElsewhere",
     [](Bench& b) { b.makeBuffer(64, true); },
     [](Bench& b) { return b.upload(8, 64); },
     {{kCreate, CL_INVALID_MEM_OBJECT}, {kWrite, kTheStatus}},
     {{kCreate, 2}},
     {kNoMemory},
     true},
    {"ReadBack",
     [](Bench& b) { b.makeBuffer(64, true); },
     [](Bench& b) { return b.readBack(); },
     {{"clEnqueueReadBuffer", kTheStatus}},
     {{"clEnqueueReadBuffer", 0}},
     {}},
    {"Reset",
     [](Bench& b) { b.makeBuffer(64, true); },
     [](Bench& b) {
         b.buffer->reset();
         return static_cast<int>(b.buffer->capacityInBytes());
     },
     {},
     {},
     {},
     true},
    {"WrapAndCopy", [](Bench& b) { b.makeBuffer(64, true); }, [](Bench& b) { return b.wrap(); }},
    {"PoolCreates",
     [](Bench& b) { b.makePool(0); },
     [](Bench& b) { return b.fromPool(64); },
     {{kCreate, 0}},
     {{kCreate, 0}},
     {}},
    {"PoolReuses",
     [](Bench& b) { b.makePool(64); },
     [](Bench& b) { return b.fromPool(64); },
     {},
     {},
     {},
     true},
    {"PoolTakesBack",
     [](Bench& b) {
         b.makePool(64);
         b.fromPool(64);
     },
     [](Bench& b) {
         b.pool->releaseBuffers();
         return 0;
     },
     {},
     {},
     {},
     true},
    {"PoolOutputInPlace", [](Bench& b) { b.makePool(64); }, [](Bench& b) { return b.output(); }},
    {"DataMap", [](Bench& b) { b.makePool(64); }, [](Bench& b) { return b.mapTwice(); }},
};
INSTANTIATE_TEST_SUITE_P(Buffers, FaultSweep, ::testing::ValuesIn(kBufferRows),
                         ::testing::PrintToStringParamName());

const std::string kBuild = "clBuildProgram";
const std::string kMakeKernel = "clCreateKernel";

const Row kRuntimeRows[] = {
    {"KernelBuilt",
     [](Bench& b) { b.makeStore(); },
     [](Bench& b) { return b.getKernel(); },
     {{"clCreateProgramWithSource", 0},
      {kBuild, 0},
      {"clGetProgramBuildInfo", 0},
      {kMakeKernel, 0}},
     {{kBuild, 2}, {"clGetProgramBuildInfo", 2}},
     {}},
    {"KernelFromTheCache",
     [](Bench& b) {
         b.makeStore();
         b.getKernel();
     },
     [](Bench& b) { return b.getKernel(); },
     {{kMakeKernel, 0}},
     {},
     {}},
    {"KernelGivenBack",
     [](Bench& b) {
         b.makeStore();
         b.getKernel();
     },
     [](Bench& b) { return static_cast<int>(b.store->freeKernel(b.kernel)); },
     {},
     {},
     {},
     true},
    {"StoreGoes",
     [](Bench& b) {
         b.makeStore();
         b.getKernel();
     },
     [](Bench& b) {
         b.store.reset();
         return 0;
     },
     {},
     {},
     {},
     true},
    {"WorkGroupSizes",
     [](Bench& b) {
         b.makeStore();
         b.getKernel();
     },
     [](Bench& b) { return b.workGroupSizes(); },
     {{"clGetKernelWorkGroupInfo", kTheStatus}},
     {},
     {}},
    {"EventQuery", [](Bench& b) { b.makeBuffer(64, true); },
     [](Bench& b) {
         return static_cast<int>(TopenCLInfo::IsEventComplete(b.buffer->bufferReadyEvent().get()));
     }},
    {"FinishAndFlush",
     [](Bench&) {},
     [](Bench&) {
         TopenCLInfo::finish();
         TopenCLInfo::flush();
         return 0;
     },
     {},
     {{"clFinish", 0}, {"clFlush", 0}},
     {}},
    {"Queue",
     [](Bench&) {},
     [](Bench& b) { return b.makeQueue(); },
     {{"clGetDeviceInfo", 0}, {"clCreateCommandQueue", 0}},
     {},
     {}},
};
INSTANTIATE_TEST_SUITE_P(Runtime, FaultSweep, ::testing::ValuesIn(kRuntimeRows),
                         ::testing::PrintToStringParamName());

const std::string kFromGL = "clCreateFromGLBuffer";
const std::set<std::string> kAfterFailedAcquire = {kNotAcquired};
const std::set<std::string> kAfterFailedRelease = {kAlreadyAcquired, kNotAcquired};

const Row kSharedRows[] = {
    {"Create",
     [](Bench& b) { b.makeManager(0); },
     [](Bench& b) { return b.createShared(); },
     {{kFromGL, 0}},
     {{kFromGL, 0}},
     {}},
    {"DestroyAlone",
     [](Bench& b) { b.makeManager(2); },
     [](Bench& b) { return b.destroy(); },
     {},
     {},
     {},
     true},
    {"DestroyBatched",
     [](Bench& b) {
         b.makeManager(2);
         b.evaluate();
     },
     [](Bench& b) { return b.destroy(); },
     {{kWait, kTheStatus}},
     {},
     {},
     true},
    {"DestroyAcquired",
     [](Bench& b) {
         b.makeManager(2);
         b.open();
     },
     [](Bench& b) { return b.destroy(); },
     {},
     {},
     {},
     true},
    {"LeaveTheBatch",
     [](Bench& b) {
         b.makeManager(2);
         b.evaluate();
     },
     [](Bench& b) { return b.leaveBatch(); },
     {},
     {},
     {},
     true},
    {"LeaveTheAcquiredBatch",
     [](Bench& b) {
         b.makeManager(2);
         b.open();
     },
     [](Bench& b) { return b.leaveBatch(); },
     {},
     {},
     kAfterFailedRelease,
     true},
    {"PreEvaluate",
     [](Bench& b) {
         b.makeManager(2);
         b.manager->RenderingComplete();
     },
     [](Bench& b) { return b.open(); },
     {},
     {{"clRetainEvent", 0}},
     kAfterFailedAcquire,
     true},
    {"AcquireBatched",
     [](Bench& b) {
         b.makeManager(2);
         b.open();
     },
     [](Bench& b) { return b.acquire(); },
     {},
     {{"clRetainEvent", 0}},
     {}},
    {"AcquireAlone",
     [](Bench& b) {
         b.makeManager(1);
         b.manager->RenderingComplete();
     },
     [](Bench& b) { return b.acquire(); },
     {{kAcquireGL, kTheStatus}},
     {{kAcquireGL, 0}},
     {},
     true},
    {"ReleaseAlone",
     [](Bench& b) {
         b.makeManager(1);
         b.acquire();
     },
     [](Bench& b) { return b.release(); },
     {{kReleaseGL, kTheStatus}},
     {{kReleaseGL, 0}},
     {},
     true},
    {"HandOver",
     [](Bench& b) {
         b.makeManager(2);
         b.open();
         b.acquire();
     },
     [](Bench& b) { return b.handOver(); }},
    {"PostEvaluate",
     [](Bench& b) {
         b.makeManager(2);
         b.open();
         b.createShared();
     },
     [](Bench& b) { return b.close(); },
     {},
     {},
     kAfterFailedRelease,
     true},
    {"RenderingComplete",
     [](Bench& b) {
         b.makeManager(1);
         b.manager->RenderingComplete();
     },
     [](Bench& b) {
         b.manager->RenderingComplete();
         return 0;
     }},
    {"Copy",
     [](Bench& b) {
         b.makeManager(2);
         b.open();
     },
     [](Bench& b) { return b.copyManager(); }},
};
INSTANTIATE_TEST_SUITE_P(Shared, FaultSweep, ::testing::ValuesIn(kSharedRows),
                         ::testing::PrintToStringParamName());

} // namespace
