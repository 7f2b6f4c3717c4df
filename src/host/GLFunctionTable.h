// The host's table of OpenGL functions: the part that the library calls.
#pragma once

#include "host/HostExport.h"

#include <CL/cl.h>

#include <cstdint>

// The type of the OpenGL headers, without including them.
using GLsync = struct __GLsync*;

// The functions of the renderer's context, or wrappers that work on any thread. The library calls
// an entry only if the query that covers it returns true.
struct VYRA_HOST_API GLFunctionTable {
    // The renderer's table; null before the renderer has started.
    static GLFunctionTable* fpGlobalFunctionTable;

    // GL_ARB_sync: glFenceSync, glDeleteSync, glClientWaitSync and glWaitSync are usable.
    bool syncObjectsUsable() const { return fSyncObjectsUsable; }
    // glCreateSyncFromCLeventARB is usable.
    bool syncFromCLEventUsable() const { return fSyncFromCLEventUsable; }

    GLsync (*glFenceSync)(unsigned int condition, unsigned int flags) = nullptr;
    void (*glDeleteSync)(GLsync sync) = nullptr;
    unsigned int (*glClientWaitSync)(GLsync sync, unsigned int flags,
                                     std::uint64_t timeoutNanoseconds) = nullptr;
    void (*glWaitSync)(GLsync sync, unsigned int flags, std::uint64_t timeout) = nullptr;
    GLsync (*glCreateSyncFromCLeventARB)(cl_context context, cl_event event,
                                         unsigned int flags) = nullptr;

    bool fSyncObjectsUsable = false;
    bool fSyncFromCLEventUsable = false;
};
