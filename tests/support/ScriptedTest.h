// The fixture of all tests on the scripted runtime.
//
// Start-up happens once per process, so each test is a process of its own: run them through CTest.
// When a test ends, every object must be released, no device memory counted, every misuse declared
// and every warning read.
#pragma once

#include "Named.h"
#include "Platform.h"
#include "fake/FakeHost.h"
#include "fake/FakeRuntime.h"
#include "runtime/TopenCLInfo.h"

#include <functional>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace scripted {

using Lines = std::vector<std::string>;

// The library's runtime object, its context and the queue of its own commands.
inline TopenCLInfo& info()
{
    return TopenCLInfo::theOne();
}
inline cl_context context()
{
    return info().openCLContext();
}
inline cl_command_queue queue()
{
    return info().openCLCommandQueue();
}

// Return the lines that begin with one of the prefixes, and their number.
template <typename... Prefixes>
Lines linesOf(Lines lines, const Prefixes&... prefixes)
{
    std::erase_if(lines, [&](const auto& line) { return !(line.starts_with(prefixes) || ...); });
    return lines;
}
inline std::size_t countOf(const Lines& lines, const std::string& prefix)
{
    return linesOf(lines, prefix).size();
}

// Runs `body` on this number of threads, which start together; the argument is the thread's number.
void onThreads(int count, const std::function<void(int)>& body);

// Returns the name of the function that a line of the log calls.
std::string functionOf(const std::string& line);
// Returns the names in the brackets that open at `begin`: "[event#1, event#2]".
Lines namesAt(const std::string& line, std::size_t begin);
// Returns the names of the OpenCL and OpenGL functions, which can fail, in these lines.
Lines functionsOf(const Lines& lines);

// The arguments of TopenCLInfo::initialize, besides the window 3 and the graphics context 5.
struct StartArguments {
    bool usingDX = false;
    bool usingGLCoreProfile = true;
    unsigned vendorId = 0x8086;
};

class ScriptedTest : public ::testing::Test {
protected:
    ScriptedTest();
    void TearDown() override;

    // Describes `machine` to the runtime and starts the library; returns whether it is valid. The
    // output, calls and objects of start-up are dropped.
    bool start();
    // The same, but keeps the output and calls of start-up for the test.
    bool startWatched();

    // Starts in these synchronisation modes, set by environment variables.
    void startInModes(int graphicsToCL, int clToGraphics);

    // Since the last reading: all calls, those whose text begins with a prefix, and the warnings.
    Lines calls() { return runtime().takeCalls(); }
    template <typename... Prefixes>
    Lines callsOf(const Prefixes&... prefixes)
    {
        return linesOf(calls(), prefixes...);
    }
    static Lines warnings();

    // Declares misuse, which some rules require after a failure; in order.
    void expectMisuse(const std::string& note) { fExpectedMisuse.push_back(note); }
    // Declares objects that remain at the end, besides those of start-up.
    void expectLeft(const Lines& objects) { fExpectedLeft = objects; }

    Machine machine;
    StartArguments arguments;
    std::vector<Fault> faults; // of start-up
    std::string printedError;  // what start-up wrote to standard error
    std::string printedOutput; // and to standard output
    Lines leftByStart;         // objects that start-up left

private:
    Lines fExpectedMisuse;
    Lines fExpectedLeft;
};

// The fixture of tests that start the library without a change of the machine.
class StartedTest : public ScriptedTest {
protected:
    void SetUp() override { ASSERT_TRUE(start()); }
};

} // namespace scripted
