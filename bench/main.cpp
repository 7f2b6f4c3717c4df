// Measures the library relative to the direct OpenCL calls that it must make.
#include "cases/Cases.h"
#include "fixtures/Runtime.h"
#include "harness/CommandLine.h"
#include "harness/InstructionCount.h"
#include "harness/Report.h"
#include "startup/Startup.h"

#include <cstdio>
#include <exception>
#include <iostream>
#include <regex>

namespace {

constexpr const char* kDescription =
    R"(Measures the library relative to the direct OpenCL calls that each operation must make, and prints
a table. Under valgrind --tool=callgrind --instr-atstart=no --collect-atstart=no it counts
instructions instead.)";

constexpr Effort kQuickEffort{7, std::chrono::milliseconds(1)};

struct Options {
    std::regex only;
    Effort effort;
    std::filesystem::path json;
    std::filesystem::path instructions;
    std::filesystem::path against;
    std::string start;
    bool list = false;
};

void addOptions(QCommandLineParser& parser)
{
    parser.setApplicationDescription(kDescription);
    parser.addOptions({
        {"only", "Measure only the groups whose names match.", "REGEX"},
        {"quick", "Take fewer and shorter samples."},
        {"json", "Also write the results as JSON.", "FILE"},
        {"instructions", "Also print the instruction counts that callgrind wrote to DIR.", "DIR"},
        {"against", "Also compare with the JSON of an earlier run.", "FILE"},
        {"start",
         "Print only the milliseconds of a start, which is possible once per process: 'library', or "
         "'direct' for the same OpenCL calls made directly.",
         "WHICH"},
        {"list", "Print only the names of the groups."},
    });
}

Options readOptions(const QCommandLineParser& parser)
{
    const auto value = [&parser](const char* name) { return parser.value(name).toStdString(); };
    return {std::regex(value("only")),
            parser.isSet("quick") ? kQuickEffort : Effort{},
            value("json"),
            value("instructions"),
            value("against"),
            value("start"),
            parser.isSet("list")};
}

std::vector<GroupFactory> chosenGroups(const std::regex& only, Runtime* runtime)
{
    std::vector<GroupFactory> chosen;
    for (GroupFactory& factory : allGroups(runtime)) {
        if (std::regex_search(factory.name, only))
            chosen.push_back(std::move(factory));
    }
    return chosen;
}

std::vector<GroupResult> measureAll(const std::vector<GroupFactory>& factories,
                                    const Effort& effort)
{
    std::mt19937 random(1); // the order of the cases is the same in every run
    std::vector<GroupResult> results;
    for (const GroupFactory& factory : factories) {
        std::fprintf(stderr, "[%zu/%zu] %s\n", results.size() + 1, factories.size(),
                     factory.name.c_str());
        results.push_back(compare(factory.make(), effort, random));
    }
    return results;
}

void report(const Options& options, std::vector<GroupResult> results)
{
    if (!options.instructions.empty())
        addInstructionCounts(results, readInstructionCounts(options.instructions));
    const RunDescription run{cpuName(), Runtime::platformName(), Runtime::deviceName(),
                             options.effort};
    std::cout << run.cpu << "; " << run.platform << "; " << run.device << "\n\n";
    writeTable(std::cout, results);
    if (!options.against.empty()) {
        std::cout << "\nCompared with " << options.against.string() << ":\n\n";
        writeChanges(std::cout, results, readRatios(options.against));
    }
    if (!options.json.empty() && !writeJson(options.json, toJson(run, results)))
        throw std::runtime_error(options.json.string() + " cannot be written");
}

void run(const Options& options, int& argumentCount, char** arguments)
{
    Runtime runtime(argumentCount, arguments);
    const std::vector<GroupFactory> factories = chosenGroups(options.only, &runtime);
    if (factories.empty())
        throw std::runtime_error("no group has such a name; see --list");
    if (!countsInstructions()) {
        report(options, measureAll(factories, options.effort));
        return;
    }
    for (const GroupFactory& factory : factories) {
        std::fprintf(stderr, "counting: %s\n", factory.name.c_str());
        count(factory.make());
    }
}

void printStartTime(const std::string& which, int& argumentCount, char** arguments)
{
    if (which != "library" && which != "direct")
        throw std::runtime_error("--start requires library or direct");
    Nanoseconds direct{0};
    const Runtime::BeforeStart measureDirectStart = [&](void* graphicsContext) {
        direct = startDirectly(graphicsContext);
    };
    const bool isDirect = which == "direct";
    const Runtime runtime(argumentCount, arguments, isDirect ? measureDirectStart : nullptr);
    const std::chrono::duration<double, std::milli> time = isDirect ? direct : runtime.startTime();
    std::printf("%.3f\n", time.count());
}

} // namespace

int main(int argumentCount, char** arguments)
{
    try {
        QCommandLineParser parser;
        addOptions(parser);
        parseCommandLine(parser, argumentCount, arguments);
        if (printHelp(parser, argumentCount, arguments))
            return 0;
        const Options options = readOptions(parser);
        if (options.list) {
            for (const GroupFactory& factory : chosenGroups(options.only, nullptr))
                std::cout << factory.name << '\n';
        } else if (!options.start.empty()) {
            printStartTime(options.start, argumentCount, arguments);
        } else {
            run(options, argumentCount, arguments);
        }
        return 0;
    } catch (const std::exception& error) {
        std::fprintf(stderr, "vyra-opencl-bench: %s\n", error.what());
        return 1;
    }
}
