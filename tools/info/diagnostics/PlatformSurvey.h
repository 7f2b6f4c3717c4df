// What OpenCL there is on this machine. Asks only; makes nothing.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

namespace info {

class RenderWindow;

// The OpenCL library, loaded as start-up loads it.
Loader surveyLoader();

// Fills the platforms and devices of `facts`, and marks what start-up chose: loader, wanted vendor
// and start-up are known, the window's context is current.
void surveyPlatforms(RenderWindow& window, Facts& facts);

} // namespace info
