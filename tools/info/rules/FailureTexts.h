// The sentences for each step at which start-up can stop.
#pragma once

#include "tools/info/rules/StartUpFailure.h"

namespace info {

// Sets reason and remedy of `failure`, whose step and status are set.
void explainFailure(const Diagnostics& diagnostics, StartUpFailure& failure);

} // namespace info
