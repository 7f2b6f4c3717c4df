// The report for people.
#pragma once

#include "tools/info/rules/Explanation.h"

#include <string>

namespace info {

std::string textReport(const Explanation& explanation);

} // namespace info
