// The one Qt function that the library calls, for a machine without Qt for Windows. Without Qt
// there are no Qt windows, so the function is never called.
#include <cstdlib>

class __declspec(dllexport) QOpenGLWindow {
public:
    void makeCurrent();
};

void QOpenGLWindow::makeCurrent()
{
    std::abort();
}
