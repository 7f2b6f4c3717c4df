// What start-up decided, and why.
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
    std::string variable; // the environment variable that made the difference; empty: none did
};

// All that start-up came to, in its order.
std::vector<Decision> explainDecisions(const Facts& facts);

} // namespace info
