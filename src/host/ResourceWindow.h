// The renderer's window.
#pragma once

#include "host/HostExport.h"

class QOpenGLWindow;

class VYRA_HOST_API Q3dPort {
public:
    // The window whose OpenGL context shares objects with the viewport's and may be made current on
    // the calling thread, or null when there is none for this thread. Borrowed.
    static QOpenGLWindow* resourceWindow();
};
