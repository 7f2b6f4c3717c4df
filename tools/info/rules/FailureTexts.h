// The sentences that go with each step at which start-up can stop.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"
#include "tools/info/rules/StartUpFailure.h"

namespace info {

// Fills reason and remedy of `stop`, whose step and status are known.
void explainStop(const Facts& facts, Stop& stop);

} // namespace info
