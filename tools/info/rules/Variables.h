// The effects of the environment variables that are set.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <string>
#include <vector>

namespace info {

enum class Effect {
    kChanged, // it changed a decision of start-up
    kNone,    // a variable of the library that made no difference
    kUnknown, // begins with a prefix of this project and is not a variable: probably misspelt
    kNoted,   // of another component; selects the OpenCL or the OpenGL in use
};

struct VariableReport {
    std::string name;
    std::string value;
    Effect effect;
    std::string explanation;
    std::string suggestion; // the nearest known name; empty if none is near
};

[[nodiscard]] std::vector<VariableReport> explainVariables(const Diagnostics& diagnostics);

// Returns the name in JSON: "changed", "none", "unknown" or "noted".
const char* effectId(Effect effect) noexcept;

} // namespace info
