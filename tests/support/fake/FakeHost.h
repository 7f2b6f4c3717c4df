// A scripted host, which replaces the parts of the stand-in host that need a window, a GPU or a
// clock.
//
// These definitions take precedence over those of the stand-in host, because the tests' executables
// contain the library's objects, which bind to the executable's symbols first. Strings,
// plugs and the trace channel remain the stand-in's. Every call of the library is a line in the
// runtime's log.
#pragma once

#include "host/GLDisplay.h"

#include <atomic>
#include <cstddef>
#include <functional>
#include <memory>

class QOpenGLWindow;

namespace scripted {

struct HostScript {
    GLDisplayProperty display{0x200A, 77}; // CL_GLX_DISPLAY_KHR
    bool sampling = false;                 // the profiler records
    QOpenGLWindow* resourceWindow = nullptr;
    std::function<void()> duringFenceWait; // runs once, at the next wait of an OpenGL client
    bool makeCurrentThrows = false;        // std::bad_alloc
    // The bytes that the memory monitor counts.
    std::atomic<std::size_t> deviceMemory = 0;
};
HostScript& host();

// Provides a resource window while the result exists.
[[nodiscard]] std::shared_ptr<void> makeResourceWindow();

// Installs or removes the renderer's OpenGL function table.
void installFunctionTable(bool syncObjects, bool syncFromCLEvent);
void removeFunctionTable();

} // namespace scripted
