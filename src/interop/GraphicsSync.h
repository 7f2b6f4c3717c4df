// How OpenCL and the OpenGL stream wait for each other where the sharing extension does not see to
// it. Internal.
#pragma once

#include <CL/cl.h>

// Replaces the pending fence by a new one behind all OpenGL commands so far. On the renderer's
// thread. Does nothing when sync objects are not usable.
void SetGraphicsFence();

// Blocks until the pending fence, if there is one, is signalled, and removes it. From any thread:
// one waits and removes, the others go on only when that wait has ended. Makes the resource
// window's context current where the host offers one for the calling thread.
void WaitForGraphicsFence();

// Makes the OpenGL stream of the context that is current on the calling thread wait for `event`;
// the thread itself does not. Does nothing where no sync object can be made from it.
void GraphicsWaitForCLEvent(cl_event event);
