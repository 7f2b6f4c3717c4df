// The OpenCL library, the platforms and the devices of this machine. Queries only.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

namespace info {

class RenderWindow;

// Loads the OpenCL library as start-up does.
[[nodiscard]] Loader surveyLoader();

// Fills the platforms and devices of `diagnostics`, and marks the chosen ones. Requires the members
// loader, wantedVendor and startUp, and the window's context to be current.
void surveyPlatforms(RenderWindow& window, Diagnostics& diagnostics);

} // namespace info
