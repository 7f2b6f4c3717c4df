// Counts the allocations of the code under test, and makes some fail. Programs that link
// vyra-failing-allocations have their operators new and delete replaced.
#pragma once

namespace scripted {

// Of this thread, without those of the scripted runtime and host.
extern thread_local unsigned allocations;     // so far
extern thread_local unsigned allocationsLeft; // until one fails; 0: none fails
extern thread_local bool allLaterFail;        // or only that one
extern thread_local unsigned failures;        // so far

} // namespace scripted
