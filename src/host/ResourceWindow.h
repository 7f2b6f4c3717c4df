// The renderer's window.
#pragma once

#include "host/HostExport.h"

class QOpenGLWindow;

class VYRA_HOST_API Q3dPort {
public:
    // Returns the window whose OpenGL context shares objects with the viewport's and may be made
    // current on the calling thread, or null if this thread has none. Borrowed.
    static QOpenGLWindow* resourceWindow();
};
