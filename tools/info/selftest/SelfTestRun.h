// The self-test of buffer sharing.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

namespace info {

class RenderWindow;
class WarningLog;

// Runs whole evaluations of shared buffers: OpenGL writes vertices, OpenCL deforms them in the
// modes that start-up chose, OpenGL reads them, and every number is compared. Requires that
// start-up has succeeded and that the context of `window` is current. Releases all that it creates.
[[nodiscard]] SelfTest runSelfTest(RenderWindow& window, WarningLog& warnings);

} // namespace info
