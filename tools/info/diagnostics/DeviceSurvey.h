// The devices of one platform.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <CL/cl.h>

namespace info {

class RenderWindow;

// Fills the devices of `platform`, whose id is `id`, and how they stand to the renderer's context.
void surveyDevices(cl_platform_id id, RenderWindow& window, Platform& platform);

} // namespace info
