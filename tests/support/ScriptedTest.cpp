#include "ScriptedTest.h"

#include "diagnostics/CLWarningSink.h"
#include "runtime/TopenCLInfo.h"

#include <mutex>
#include <utility>

namespace scripted {
namespace {

std::mutex warningsLock;
Lines pendingWarnings;

void keepWarning(const char* text)
{
    const InsideRuntime notTheLibrarys;
    const std::scoped_lock guard(warningsLock);
    pendingWarnings.emplace_back(text);
}

void* opaque(std::uintptr_t number)
{
    // NOLINTNEXTLINE(performance-no-int-to-ptr): the host's handles are never dereferenced.
    return reinterpret_cast<void*>(number);
}

Lines livingObjects()
{
    Lines objects = runtime().balance();
    std::erase_if(objects, [](const std::string& line) {
        return line.starts_with("platform") || line.starts_with("device");
    });
    return objects;
}

} // namespace

ScriptedTest::ScriptedTest()
{
    setCLWarningSink(keepWarning);
    installFunctionTable(true, true);
}

void ScriptedTest::TearDown()
{
    Lines expected = leftByStart;
    expected.insert(expected.end(), fExpectedLeft.begin(), fExpectedLeft.end());
    EXPECT_EQ(livingObjects(), expected) << "objects left alive";
    EXPECT_EQ(runtime().takeMisuse(), fExpectedMisuse) << "misuse of the runtime";
    EXPECT_EQ(warnings(), Lines{}) << "warnings that the test did not read";
}

bool ScriptedTest::startWatched()
{
    runtime().describe(machine);
    for (const Fault& fault : faults)
        runtime().plan(fault);
    testing::internal::CaptureStderr();
    testing::internal::CaptureStdout();
    const bool valid = TopenCLInfo::initialize(
        opaque(arguments.window), opaque(arguments.graphicsContext), nullptr, arguments.usingDX,
        arguments.usingGLCoreProfile, arguments.vendorId);
    printedError = testing::internal::GetCapturedStderr();
    printedOutput = testing::internal::GetCapturedStdout();
    leftByStart = livingObjects();
    runtime().clearFaults();
    return valid;
}

bool ScriptedTest::start()
{
    const bool valid = startWatched();
    calls();
    return valid;
}

void ScriptedTest::startInModes(int graphicsToCL, int clToGraphics)
{
    setEnvironment("VYRA_GRAPHICSTOOPENCL_SYNC_MODE", std::to_string(graphicsToCL).c_str());
    setEnvironment("VYRA_OPENCLTOGRAPHICS_SYNC_MODE", std::to_string(clToGraphics).c_str());
    ASSERT_TRUE(start());
}

Lines ScriptedTest::warnings()
{
    const std::scoped_lock guard(warningsLock);
    return std::exchange(pendingWarnings, {});
}

} // namespace scripted
