// The baseline of start-up.
#pragma once

#include "harness/Timing.h"

// Makes the OpenCL calls of start-up directly: platform, device, context that shares with the
// current OpenGL context, two queues, and the queries. Returns their duration, without the release
// of the objects. `graphicsContext` is the native handle. Throws std::runtime_error if an object
// cannot be created.
[[nodiscard]] Nanoseconds startDirectly(void* graphicsContext);
