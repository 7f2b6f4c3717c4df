#include "harness/InstructionCount.h"

#include <charconv>
#include <fstream>
#include <optional>
#include <string_view>

#if __has_include(<valgrind/callgrind.h>)
#include <valgrind/callgrind.h>
#else
#define RUNNING_ON_VALGRIND 0
#define CALLGRIND_TOGGLE_COLLECT
#define CALLGRIND_ZERO_STATS
#define CALLGRIND_START_INSTRUMENTATION
#define CALLGRIND_STOP_INSTRUMENTATION
#define CALLGRIND_DUMP_STATS_AT(name) static_cast<void>(name)
#endif

namespace {

constexpr std::string_view kTriggerPrefix = "desc: Trigger: Client Request: ";
constexpr std::string_view kTotalPrefix = "summary: ";
// Between the number of operations and the name of the case.
constexpr char kSeparator = ' ';

std::optional<double> numberAt(std::string_view text)
{
    double value = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    return error == std::errc() ? std::optional(value) : std::nullopt;
}

void readFile(const std::filesystem::path& path, std::map<std::string, double>& counts)
{
    std::ifstream file(path);
    std::string trigger;
    for (std::string line; std::getline(file, line);) {
        if (line.starts_with(kTriggerPrefix))
            trigger = line.substr(kTriggerPrefix.size());
        if (!line.starts_with(kTotalPrefix))
            continue;
        const auto operations = numberAt(trigger);
        const auto total = numberAt(std::string_view(line).substr(line.find(' ') + 1));
        if (operations && *operations > 0 && total)
            counts[trigger.substr(trigger.find(kSeparator) + 1)] = *total / *operations;
        return;
    }
}

} // namespace

bool countsInstructions() noexcept
{
    return RUNNING_ON_VALGRIND != 0;
}

CountedScope::CountedScope()
{
    CALLGRIND_TOGGLE_COLLECT;
}

CountedScope::~CountedScope()
{
    CALLGRIND_TOGGLE_COLLECT;
}

void startInstructionCount()
{
    CALLGRIND_START_INSTRUMENTATION;
    CALLGRIND_ZERO_STATS;
}

void writeInstructionCount(const std::string& name, double operations)
{
    const std::string trigger =
        std::to_string(static_cast<unsigned long long>(operations)) + kSeparator + name;
    CALLGRIND_DUMP_STATS_AT(trigger.c_str());
    CALLGRIND_STOP_INSTRUMENTATION;
}

std::map<std::string, double> readInstructionCounts(const std::filesystem::path& folder)
{
    std::map<std::string, double> counts;
    for (const auto& entry : std::filesystem::directory_iterator(folder)) {
        if (entry.is_regular_file())
            readFile(entry.path(), counts);
    }
    return counts;
}
