// Instruction counts, which repeat to the digit where times do not: the program runs under
// callgrind
// (--instr-atstart=no --collect-atstart=no), which counts what is enclosed here and writes one file
// per case.
#pragma once

#include <filesystem>
#include <map>
#include <string>

// Whether the program runs under a tool that counts. Without the tool's header it never does.
bool countsInstructions();

// Counted from construction to destruction. Scopes do not nest, and only one thread opens them.
class CountedScope {
public:
    CountedScope();
    ~CountedScope();
    CountedScope(const CountedScope&) = delete;
    CountedScope& operator=(const CountedScope&) = delete;
};

// From here on the tool counts; before, the program runs faster under it. Forgets what was counted
// so far.
void startInstructionCount();
// Writes what was counted since the start, as that of `operations` operations of the case `name`,
// and counts no more.
void writeInstructionCount(const std::string& name, double operations);

// The instructions per operation, by the name of the case, from callgrind's files in `folder`.
// Files that hold no case's count are skipped.
std::map<std::string, double> readInstructionCounts(const std::filesystem::path& folder);
