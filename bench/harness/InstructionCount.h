// Instruction counts, which are exactly repeatable, unlike times. The program runs under callgrind
// (--instr-atstart=no --collect-atstart=no), which counts the enclosed scopes and writes one file
// per case.
#pragma once

#include <filesystem>
#include <map>
#include <string>

// Returns whether the program runs under a tool that counts. False if it was built without the
// tool's header.
[[nodiscard]] bool countsInstructions() noexcept;

// Counts instructions from construction to destruction. Scopes must not be nested, and only one
// thread may open them.
class CountedScope {
public:
    CountedScope();
    ~CountedScope();
    CountedScope(const CountedScope&) = delete;
    CountedScope& operator=(const CountedScope&) = delete;
};

// Starts counting from 0. Before the start, the program runs faster under the tool.
void startInstructionCount();
// Writes the count since the start for `operations` operations of the case `name`, and stops
// counting.
void writeInstructionCount(const std::string& name, double operations);

// Returns the instructions per operation, by the name of the case, from callgrind's files in
// `folder`. Skips files without a count.
std::map<std::string, double> readInstructionCounts(const std::filesystem::path& folder);
