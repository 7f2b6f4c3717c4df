// The one function of Qt's that the library calls, for a machine without Qt for Windows. There are
// no windows of Qt's there, so nobody gets this far.
#include <cstdlib>

class __declspec(dllexport) QOpenGLWindow {
public:
    void makeCurrent();
};

void QOpenGLWindow::makeCurrent()
{
    std::abort();
}
