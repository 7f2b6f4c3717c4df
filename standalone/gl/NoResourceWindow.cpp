// For a build without Qt: the application sets the function table itself, and there is no Qt window
// for the library to make current.
#include "host/ResourceWindow.h"

QOpenGLWindow* Q3dPort::resourceWindow()
{
    return nullptr;
}
