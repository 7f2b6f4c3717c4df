#include "viewer/ViewerWindow.h"

#include "viewer/Session.h"

#include <QGuiApplication>
#include <QKeyEvent>
#include <QMouseEvent>
#include <QOpenGLContext>
#include <QWheelEvent>

namespace viewer {
namespace {

constexpr qint64 kOpenTimeoutMs = 10000;
constexpr int kEventSliceMs = 10;
constexpr float kDegreesPerPixel = 0.4f;
// Qt counts eighths of a degree, and a notch of a usual wheel is 15 degrees.
constexpr float kUnitsPerNotch = 120.0f;

// A window whose context cannot be made ends the process, so this is asked first.
bool openGLIsUsable()
{
    QOpenGLContext context;
    return context.create() &&
           context.format().version() >= QSurfaceFormat::defaultFormat().version();
}

Status noOpenGL()
{
    return Failure{ExitCode::kNoGraphics, "there is no OpenGL 3.3 on this display; install a "
                                          "graphics driver, or Mesa's software renderer"};
}

} // namespace

Status ViewerWindow::open(const QSize& size)
{
    if (!openGLIsUsable())
        return noOpenGL();
    setTitle("vyra-viewer");
    resize(size);
    show();
    QElapsedTimer timer;
    timer.start();
    while (!isValid() && !isExposed() && timer.elapsed() < kOpenTimeoutMs)
        QGuiApplication::processEvents(QEventLoop::WaitForMoreEvents | QEventLoop::AllEvents,
                                       kEventSliceMs);
    return isValid() ? Status{} : noOpenGL();
}

void ViewerWindow::play(Session& session)
{
    fSession = &session;
    fClock.start();
    connect(this, &QOpenGLWindow::frameSwapped, this, [this] { update(); });
    update();
}

void ViewerWindow::present(Session& session)
{
    session.canvas().showIn(defaultFramebufferObject(), pixelSize());
    context()->swapBuffers(this);
}

QSize ViewerWindow::pixelSize() const
{
    return size() * devicePixelRatio();
}

void ViewerWindow::resizeGL(int, int)
{
    if (fSession)
        fSession->resize(pixelSize());
}

void ViewerWindow::paintGL()
{
    if (!fSession)
        return;
    constexpr double kMsPerSecond = 1000.0;
    fFailure = fSession->renderFrame(static_cast<double>(fClock.elapsed()) / kMsPerSecond);
    if (fFailure) {
        stop();
        QGuiApplication::exit();
        return;
    }
    fSession->canvas().showIn(defaultFramebufferObject(), pixelSize());
}

void ViewerWindow::keyPressEvent(QKeyEvent* event)
{
    if (event->key() == Qt::Key_Escape)
        close();
    else if (event->key() == Qt::Key_D && fSession)
        fSession->changeDetail();
}

void ViewerWindow::mousePressEvent(QMouseEvent* event)
{
    fLastPosition = event->position();
}

void ViewerWindow::mouseMoveEvent(QMouseEvent* event)
{
    const QPointF moved = event->position() - fLastPosition;
    fLastPosition = event->position();
    if (fSession && event->buttons() != Qt::NoButton)
        fSession->camera().orbit(-kDegreesPerPixel * static_cast<float>(moved.x()),
                                 kDegreesPerPixel * static_cast<float>(moved.y()));
}

void ViewerWindow::wheelEvent(QWheelEvent* event)
{
    if (fSession)
        fSession->camera().zoom(static_cast<float>(event->angleDelta().y()) / kUnitsPerNotch);
}

} // namespace viewer
