// The fixture of all tests on the scripted runtime.
//
// Start-up happens once per process, so each test is a process of its own: run them through CTest.
// When a test ends, every object must be released, every misuse declared and every warning read.
#pragma once

#include "Platform.h"
#include "fake/FakeHost.h"
#include "fake/FakeRuntime.h"

#include <ostream>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace scripted {

using Lines = std::vector<std::string>;

// The arguments of TopenCLInfo::initialize.
struct StartArguments {
    std::uintptr_t window = 3;
    std::uintptr_t graphicsContext = 5;
    bool usingDX = false;
    bool usingGLCoreProfile = true;
    unsigned vendorId = 0x8086;
};

// A row of a table of tests is derived from its name, which is its first initialiser.
struct Named {
    // Implicit, so that a row begins with the text.
    Named(const char* text) : name(text) {}

    const char* name;
    friend std::ostream& operator<<(std::ostream& out, const Named& row) { return out << row.name; }
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
        Lines lines = calls();
        std::erase_if(lines,
                      [&](const auto& line) { return !(line.starts_with(prefixes) || ...); });
        return lines;
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
    Lines leftByStart;         // objects that start-up left, except platforms and devices

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
