// For a build without Qt: the application sets the function table itself, and there is no window of
// Qt's that the library could make current.
#include "host/ResourceWindow.h"

QOpenGLWindow* Q3dPort::resourceWindow()
{
    return nullptr;
}
