// Waits between OpenCL and the OpenGL stream, if the sharing extension does not order them.
// Internal.
#pragma once

#include <CL/cl.h>

// Replaces the pending fence by a new one after all OpenGL commands so far. Called on the
// renderer's thread. Does nothing if sync objects are not usable.
void SetGraphicsFence();

// Blocks until the pending fence, if there is one, is signalled, and deletes it. Safe from any
// thread: one thread waits and deletes, the others return after that. Makes the resource window's
// context current if the host has one for the calling thread.
void WaitForGraphicsFence();

// Makes the OpenGL stream of the calling thread's current context wait for `event`. Does not block.
// Does nothing if no sync object can be created from the event.
void GraphicsWaitForCLEvent(cl_event event);
