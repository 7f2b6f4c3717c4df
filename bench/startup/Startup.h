// What starting the library costs beside the OpenCL calls that start-up must make.
#pragma once

#include "harness/Timing.h"

// The calls made bare: platform, device, context that shares with the current OpenGL context, two
// queues, and the queries that start-up decides by. `graphicsContext` is the native handle. All
// that is made is released outside of the time. Throws std::runtime_error where it cannot be made.
Nanoseconds startByHand(void* graphicsContext);
