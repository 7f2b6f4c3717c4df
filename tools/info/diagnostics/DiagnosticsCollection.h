// One look at this machine, from the environment to the self-test.
#pragma once

#include "tools/info/Options.h"
#include "tools/info/diagnostics/Diagnostics.h"

namespace info {

// Once in a process, on the main thread.
Facts gatherFacts(const Options& options);

} // namespace info
