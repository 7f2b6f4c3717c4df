// Measures the library beside the bare OpenCL calls that it must make.
#include "cases/Cases.h"
#include "fixtures/Runtime.h"
#include "harness/InstructionCount.h"
#include "harness/Report.h"
#include "startup/Startup.h"

#include <cstdio>
#include <exception>
#include <iostream>
#include <regex>
#include <string_view>

namespace {

constexpr const char* kUsage = R"(Usage: vyra-opencl-bench [OPTION...]

Measures the library beside the bare OpenCL calls that it must make, and prints a table.

  --only REGEX         the groups whose names match
  --quick              fewer and shorter samples
  --json FILE          also writes the results as JSON
  --instructions DIR   also shows the instruction counts that callgrind wrote to DIR
  --against FILE       also compares with the JSON of an earlier run
  --start WHICH        only the milliseconds that a start takes, which is once per process: of the
                       library, or of the bare OpenCL calls that it makes (bare)
  --list               the names of the groups, and nothing else
  --help               this text

Under valgrind --tool=callgrind --instr-atstart=no --collect-atstart=no it counts instructions and
takes no times.
)";

constexpr Effort kQuickEffort{7, std::chrono::milliseconds(1)};

struct Options {
    std::regex only{""};
    Effort effort;
    std::filesystem::path json;
    std::filesystem::path instructions;
    std::filesystem::path against;
    std::string start;
    bool list = false;
    bool help = false;
};

Options parse(int count, char** arguments)
{
    Options options;
    for (int index = 1; index < count; ++index) {
        const std::string_view argument = arguments[index];
        const auto value = [&] {
            if (++index == count)
                throw std::runtime_error(std::string(argument) + " needs a value");
            return arguments[index];
        };
        if (argument == "--only")
            options.only = std::regex(value());
        else if (argument == "--quick")
            options.effort = kQuickEffort;
        else if (argument == "--json")
            options.json = value();
        else if (argument == "--instructions")
            options.instructions = value();
        else if (argument == "--against")
            options.against = value();
        else if (argument == "--start")
            options.start = value();
        else if (argument == "--list")
            options.list = true;
        else if (argument == "--help")
            options.help = true;
        else
            throw std::runtime_error("unknown argument " + std::string(argument) +
                                     "; --help tells all");
    }
    return options;
}

std::vector<GroupMaker> chosenGroups(const std::regex& only, Runtime* runtime)
{
    std::vector<GroupMaker> chosen;
    for (GroupMaker& maker : allGroups(runtime)) {
        if (std::regex_search(maker.name, only))
            chosen.push_back(std::move(maker));
    }
    return chosen;
}

std::vector<GroupResult> measureAll(const std::vector<GroupMaker>& makers, const Effort& effort)
{
    std::mt19937 random(1); // the order of the cases is the same in every run
    std::vector<GroupResult> results;
    for (const GroupMaker& maker : makers) {
        std::fprintf(stderr, "[%zu/%zu] %s\n", results.size() + 1, makers.size(),
                     maker.name.c_str());
        results.push_back(compare(maker.make(), effort, random));
    }
    return results;
}

void report(const Options& options, std::vector<GroupResult> results)
{
    if (!options.instructions.empty())
        addInstructionCounts(results, readInstructionCounts(options.instructions));
    const RunDescription run{processorName(), Runtime::platformName(), Runtime::deviceName(),
                             options.effort};
    std::cout << run.processor << "; " << run.platform << "; " << run.device << "\n\n";
    writeTable(std::cout, results);
    if (!options.against.empty()) {
        std::cout << "\nBeside " << options.against.string() << ":\n\n";
        writeChanges(std::cout, results, readRatios(options.against));
    }
    if (!options.json.empty() && !writeJson(options.json, toJson(run, results)))
        throw std::runtime_error(options.json.string() + " cannot be written");
}

void run(const Options& options, int& argumentCount, char** arguments)
{
    Runtime runtime(argumentCount, arguments);
    const std::vector<GroupMaker> makers = chosenGroups(options.only, &runtime);
    if (makers.empty())
        throw std::runtime_error("no group has such a name; --list tells them");
    if (!countsInstructions()) {
        report(options, measureAll(makers, options.effort));
        return;
    }
    for (const GroupMaker& maker : makers) {
        std::fprintf(stderr, "counting: %s\n", maker.name.c_str());
        count(maker.make());
    }
}

void tellStart(const std::string& which, int& argumentCount, char** arguments)
{
    if (which != "library" && which != "bare")
        throw std::runtime_error("--start takes library or bare");
    Nanoseconds bare{0};
    const Runtime::BeforeStart startBare = [&](void* graphicsContext) {
        bare = startByHand(graphicsContext);
    };
    const bool isBare = which == "bare";
    const Runtime runtime(argumentCount, arguments, isBare ? startBare : nullptr);
    const std::chrono::duration<double, std::milli> time = isBare ? bare : runtime.startTime();
    std::printf("%.3f\n", time.count());
}

} // namespace

int main(int argumentCount, char** arguments)
{
    try {
        const Options options = parse(argumentCount, arguments);
        if (options.help) {
            std::cout << kUsage;
        } else if (options.list) {
            for (const GroupMaker& maker : chosenGroups(options.only, nullptr))
                std::cout << maker.name << '\n';
        } else if (!options.start.empty()) {
            tellStart(options.start, argumentCount, arguments);
        } else {
            run(options, argumentCount, arguments);
        }
        return 0;
    } catch (const std::exception& error) {
        std::fprintf(stderr, "vyra-opencl-bench: %s\n", error.what());
        return 1;
    }
}
