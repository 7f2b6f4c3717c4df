// The library at work: one shared buffer through whole evaluations.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

namespace info {

class RenderWindow;
class WarningLog;

// OpenGL writes vertices, OpenCL deforms them in the modes that start-up chose, OpenGL reads them,
// and every number is compared. After start-up succeeded, the window's context current. What it
// makes is gone afterwards.
SelfTest runSelfTest(RenderWindow& window, WarningLog& warnings);

} // namespace info
