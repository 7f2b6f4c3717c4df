// The devices of one platform.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <CL/cl.h>

namespace info {

class RenderWindow;

// Fills the devices of `platform`, which has the id `id`, and their relation to the OpenGL context
// of `window`, which is current.
void surveyDevices(cl_platform_id id, RenderWindow& window, Platform& platform);

} // namespace info
