// The OpenGL side of the host: the function table, the resource window, and sync functions that
// work on every thread.
#pragma once

#include "host/HostExport.h"

#include <memory>

class QOpenGLContext;
class QOpenGLWindow;

namespace vyra::host {
struct GLHostState;
}

// The owner of the function table: during its lifetime GLFunctionTable::fpGlobalFunctionTable is
// its table. The table's sync functions work on any thread. On a thread whose current Qt context
// shares with the renderer's they call the driver, on others they use a hidden context of the same
// share group. There they wait on the CPU, since a GPU wait in the hidden context delays no
// drawing.
//
// glCreateSyncFromCLeventARB is the driver's if it has one. Otherwise the host waits for the OpenCL
// event on the calling thread and inserts a fence.
//
// Constructed and destroyed on the application's GUI thread, at most one at a time. Destroyed
// before the OpenGL context, and after the last call of the table by another thread.
class VYRA_HOST_API GLHost {
public:
    // Requires that the context of `window` is current. Q3dPort::resourceWindow() returns the
    // window on the calling thread and null on others, because Qt makes a context current only on
    // its own thread.
    explicit GLHost(QOpenGLWindow& window);
    // For drawing without a window. Requires that `context` is current; there is no resource
    // window.
    explicit GLHost(QOpenGLContext& context);
    ~GLHost();
    GLHost(const GLHost&) = delete;
    GLHost& operator=(const GLHost&) = delete;

    // Returns whether the driver has sync objects and the hidden context exists.
    bool syncObjectsUsable() const;
    bool syncFromCLEventUsable() const;

private:
    std::unique_ptr<vyra::host::GLHostState> fState;
};
