// The report as JSON.
#pragma once

#include "tools/info/rules/Explanation.h"

#include <string>

namespace info {

// The version of the format. Adding a member keeps it; changing or removing one increments it.
inline constexpr int kJsonFormat = 1;

// Returns one JSON object, described by info.schema.json, and a line break.
[[nodiscard]] std::string jsonReport(const Explanation& explanation);

} // namespace info
