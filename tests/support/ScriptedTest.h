// The fixture of all tests on the scripted runtime.
//
// Start-up happens once per process, so each test is a process of its own: run them through CTest.
// A test ends with every object accounted for, every wrong use declared and every warning read.
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

// What the host passes to start-up.
struct StartArguments {
    std::uintptr_t window = 3;
    std::uintptr_t graphicsContext = 5;
    bool usingDX = false;
    bool usingGLCoreProfile = true;
    unsigned vendorId = 0x8086;
};

// A row of a table of tests is derived from its name, which is its first initialiser.
struct Named {
    // Implicit: a row begins with the bare text.
    Named(const char* text) : name(text) {}

    const char* name;
    friend std::ostream& operator<<(std::ostream& out, const Named& row) { return out << row.name; }
};

class ScriptedTest : public ::testing::Test {
protected:
    ScriptedTest();
    void TearDown() override;

    // Describes `world` to the runtime and starts the library; returns whether it is valid. What
    // start-up prints, logs and leaves alive is taken as given from here on.
    bool start();
    // The same, keeping what start-up prints and logs for the test to read.
    bool startWatched();

    // Starts in these synchronisation modes, which the environment demands.
    void startInModes(int graphicsToCL, int clToGraphics);

    // Since the last reading: all calls, those whose text begins with `prefix`, and the warnings.
    Lines calls() { return runtime().takeCalls(); }
    Lines callsOf(const std::string& prefix);
    static Lines warnings();

    // The test leaves wrong use, which some rules prescribe after a failure; in order.
    void expectMisuse(const std::string& note) { fExpectedMisuse.push_back(note); }
    // Objects that stay alive beyond those of start-up.
    void expectLeft(const Lines& objects) { fExpectedLeft = objects; }

    World world;
    StartArguments arguments;
    std::vector<Fault> faults; // of start-up
    std::string printedError;  // what start-up wrote to standard error
    std::string printedOutput; // and to standard output
    Lines leftByStart;         // what start-up left alive, besides platforms and devices

private:
    Lines fExpectedMisuse;
    Lines fExpectedLeft;
};

} // namespace scripted
