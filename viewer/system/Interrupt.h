// Ctrl-C, which ends the viewer after the current frame.
#pragma once

namespace viewer {

// Installs a handler for SIGINT. The first Ctrl-C requests the end, the second one ends the process
// at once.
void catchInterrupt() noexcept;

// Returns whether Ctrl-C was pressed after catchInterrupt(). Any thread may call it.
[[nodiscard]] bool interrupted() noexcept;

} // namespace viewer
