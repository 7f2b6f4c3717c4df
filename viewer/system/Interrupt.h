// Ctrl-C, which ends the viewer after the frame in progress.
#pragma once

namespace viewer {

// Makes the first Ctrl-C count as a request to end. The second one ends the process at once.
void catchInterrupt();

// Whether Ctrl-C was pressed since. Safe from any thread.
bool interrupted();

} // namespace viewer
