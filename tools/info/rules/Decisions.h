// The decisions of start-up, with their reasons.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <string>
#include <vector>

namespace info {

struct Decision {
    std::string id; // in JSON
    std::string title;
    std::string value;
    std::string reason;
    std::string variable; // the environment variable that changed it; empty if none did
};

// Returns the decisions that start-up reached, in its order.
[[nodiscard]] std::vector<Decision> explainDecisions(const Diagnostics& diagnostics);

} // namespace info
