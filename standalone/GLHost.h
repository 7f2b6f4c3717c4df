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

// While an object lives, GLFunctionTable::fpGlobalFunctionTable is its table, and the table's sync
// functions work on any thread: a thread whose current Qt context shares with the renderer's calls
// the driver itself, any other goes through a hidden context of the same share group. There the
// functions wait on the CPU, since a wait of the hidden context would hold back no drawing.
//
// glCreateSyncFromCLeventARB is the driver's where it has it. Otherwise the host's own waits for
// the OpenCL event on the calling thread and inserts a fence.
//
// Constructed and destroyed on the application's GUI thread, at most one at a time, and destroyed
// before the OpenGL context and after the last call of the table by another thread.
class VYRA_HOST_API GLHost {
public:
    // `window`'s context is current. Q3dPort::resourceWindow() answers with the window on the
    // calling thread, and with null on all others, because Qt makes a context current on its own
    // thread only.
    explicit GLHost(QOpenGLWindow& window);
    // For drawing without a window: `context` is current; there is no resource window.
    explicit GLHost(QOpenGLContext& context);
    ~GLHost();
    GLHost(const GLHost&) = delete;
    GLHost& operator=(const GLHost&) = delete;

    // The driver has sync objects, and the hidden context could be made.
    bool syncObjectsUsable() const;
    bool syncFromCLEventUsable() const;

private:
    std::unique_ptr<vyra::host::GLHostState> fState;
};
