// The host that a scripted test describes, in place of the parts of the stand-in host that would
// need a window, a GPU or a clock.
//
// What is defined here takes the place of the stand-in's own definition, since the tests'
// executables contain the library's objects and so bind to the executable's symbols first. Strings,
// plugs and the trace channel remain the stand-in's. Every call of the library is a line in the
// runtime's log.
#pragma once

#include "host/GLDisplay.h"

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
};
HostScript& host();

// While it lives, there is a resource window.
class ResourceWindow {
public:
    ResourceWindow();
    ~ResourceWindow();

private:
    struct Window;
    std::unique_ptr<Window> fWindow;
};

// What the memory monitor counts at present, in bytes.
std::size_t deviceMemory();

// The renderer's OpenGL function table.
void installFunctionTable(bool syncObjects, bool syncFromCLEvent);
void removeFunctionTable();

} // namespace scripted
