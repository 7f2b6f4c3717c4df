// One look at this machine, from the environment to the self-test.
#pragma once

#include "tools/Facts.h"
#include "tools/Options.h"

namespace info {

// Once in a process, on the main thread.
Facts gatherFacts(const Options& options);

} // namespace info
