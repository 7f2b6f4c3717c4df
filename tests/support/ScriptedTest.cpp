#include "ScriptedTest.h"

#include "diagnostics/CLWarningSink.h"

#include <algorithm>
#include <atomic>
#include <mutex>
#include <sstream>
#include <thread>
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

} // namespace

void onThreads(int count, const std::function<void(int)>& body)
{
    std::atomic<int> arrived = 0;
    std::vector<std::jthread> threads;
    threads.reserve(static_cast<std::size_t>(count));
    for (int thread = 0; thread < count; ++thread) {
        threads.emplace_back([&, thread] {
            ++arrived;
            while (arrived < count)
                std::this_thread::yield();
            body(thread);
        });
    }
}

std::string functionOf(const std::string& line)
{
    return line.substr(0, line.find('('));
}

Lines namesAt(const std::string& line, std::size_t begin)
{
    std::istringstream text(line.substr(begin + 1, line.find(']', begin) - begin - 1));
    Lines names;
    for (std::string name; std::getline(text >> std::ws, name, ',');)
        names.push_back(name);
    return names;
}

Lines functionsOf(const Lines& lines)
{
    Lines functions = linesOf(lines, "cl", "gl");
    std::ranges::transform(functions, functions.begin(), functionOf);
    return functions;
}

ScriptedTest::ScriptedTest()
{
    setCLWarningSink(keepWarning);
    installFunctionTable(true, true);
}

void ScriptedTest::TearDown()
{
    Lines expected = leftByStart;
    expected.insert(expected.end(), fExpectedLeft.begin(), fExpectedLeft.end());
    EXPECT_EQ(runtime().balance(), expected) << "objects left alive";
    EXPECT_EQ(host().deviceMemory, 0U) << "memory that the library counts";
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
    // NOLINTBEGIN(performance-no-int-to-ptr): the host's handles are never dereferenced.
    const bool valid = TopenCLInfo::initialize(
        reinterpret_cast<void*>(3), reinterpret_cast<void*>(5), nullptr, arguments.usingDX,
        arguments.usingGLCoreProfile, arguments.vendorId);
    // NOLINTEND(performance-no-int-to-ptr)
    printedError = testing::internal::GetCapturedStderr();
    printedOutput = testing::internal::GetCapturedStdout();
    leftByStart = runtime().balance();
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
