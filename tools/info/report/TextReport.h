// The report as text.
#pragma once

#include "tools/info/rules/Explanation.h"

#include <string>

namespace info {

[[nodiscard]] std::string textReport(const Explanation& explanation);

} // namespace info
