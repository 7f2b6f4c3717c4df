// The report for machines.
#pragma once

#include "tools/info/rules/Explanation.h"

#include <string>

namespace info {

// One JSON object, described by info.schema.json, with a line break at its end. Members may be
// added while kJsonFormat stays; it counts up when one changes or goes.
inline constexpr int kJsonFormat = 1;
std::string jsonReport(const Explanation& explanation);

} // namespace info
