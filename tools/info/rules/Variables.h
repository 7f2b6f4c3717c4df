// The environment variables that are set, and what each of them did.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <string>
#include <vector>

namespace info {

enum class Effect {
    kChanged, // start-up decided otherwise because of it
    kNone,    // the library knows it, and it made no difference
    kUnknown, // no variable of the library's, probably misspelt
    kNoted,   // not the library's, but it steers what the library finds
};

struct VariableReport {
    std::string name;
    std::string value;
    Effect effect;
    std::string explanation;
    std::string suggestion; // the known name that is probably meant; empty: none
};

std::vector<VariableReport> explainVariables(const Facts& facts);

// "changed", "none", "unknown", "noted": as in JSON.
const char* effectId(Effect effect);

} // namespace info
