// Why OpenCL is off: the first step of start-up that stopped, and what would make it go on.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <optional>
#include <span>
#include <string>

namespace info {

// In the order in which start-up takes them.
enum class Step {
    kRenderer,
    kSwitch,
    kLoader,
    kVendor,
    kPlatform,
    kDevice,
    kDriver,
    kContext,
    kSharingFunctions,
    kAvailability,
    kDoublePrecision,
    kQueue,
};

struct StepName {
    Step step;
    const char* id;      // in JSON
    const char* title;   // what the step needs to go on
    const char* failure; // what is wrong when it stops
};

// All steps, in order.
std::span<const StepName> stepNames();
const StepName& stepName(Step step);

struct Stop {
    Step step;
    std::optional<int> status; // of the OpenCL call that failed
    std::string reason;        // whole sentences
    std::string remedy;        // whole sentences
};

// Empty when OpenCL is on.
std::optional<Stop> findStop(const Facts& facts);

} // namespace info
