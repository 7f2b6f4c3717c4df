#include "viewer/app/ViewerWindow.h"

#include "viewer/app/Controls.h"
#include "viewer/app/Player.h"
#include "viewer/app/Session.h"

#include <QElapsedTimer>
#include <QGuiApplication>
#include <QKeyEvent>
#include <QMouseEvent>
#include <QOpenGLContext>
#include <QWheelEvent>

namespace viewer {
namespace {

constexpr qint64 kOpenTimeoutMs = 10000;
constexpr int kEventSliceMs = 10;
// Pixels that the first lines of the overlay need.
constexpr QSize kSmallestSize(160, 90);
constexpr float kDegreesPerPixel = 0.4f;
// Qt measures eighths of a degree; a wheel step is usually 15 degrees.
constexpr float kUnitsPerStep = 120.0f;

// Must be checked first: Qt ends the process if a window cannot create its context.
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

ViewerWindow::ViewerWindow() = default;
ViewerWindow::~ViewerWindow() = default;

Status ViewerWindow::open(const QSize& size)
{
    if (!openGLIsUsable())
        return noOpenGL();
    setTitle("vyra-viewer");
    setMinimumSize(kSmallestSize);
    resize(size);
    show();
    QElapsedTimer timer;
    timer.start();
    // A Wayland compositor ends a program that draws into a window before it is exposed.
    while (!(isValid() && isExposed()) && timer.elapsed() < kOpenTimeoutMs)
        QGuiApplication::processEvents(QEventLoop::WaitForMoreEvents | QEventLoop::AllEvents,
                                       kEventSliceMs);
    return isValid() ? Status{} : noOpenGL();
}

void ViewerWindow::play(Session& session)
{
    makeCurrent();
    fPlayer = std::make_unique<Player>(session);
    connect(this, &QOpenGLWindow::frameSwapped, this, [this] { update(); });
    update();
}

void ViewerWindow::stop()
{
    makeCurrent();
    fPlayer.reset();
}

void ViewerWindow::present(Session& session)
{
    if (!isExposed())
        return;
    session.canvas().showIn(defaultFramebufferObject(), pixelSize());
    context()->swapBuffers(this);
}

QSize ViewerWindow::pixelSize() const
{
    return size() * devicePixelRatio();
}

void ViewerWindow::resizeGL(int, int)
{
    // A window manager may ignore the minimum size, and without one nothing enforces it.
    if (fPlayer)
        fPlayer->session().resize(pixelSize().expandedTo(kSmallestSize * devicePixelRatio()));
}

void ViewerWindow::paintGL()
{
    if (!fPlayer)
        return;
    fFailure = fPlayer->renderFrame();
    if (fFailure) {
        stop();
        QGuiApplication::exit();
        return;
    }
    fPlayer->showIn(defaultFramebufferObject(), pixelSize(), devicePixelRatio());
}

// Qt sends events without a current context, which the player requires.
void ViewerWindow::keyPressEvent(QKeyEvent* event)
{
    const std::optional<Action> action = actionOfKey(event->key());
    if (action == Action::kQuit) {
        close();
    } else if (action && fPlayer) {
        makeCurrent();
        fPlayer->act(*action);
    } else if (const auto index = deformerOfKey(event->key()); index && fPlayer) {
        makeCurrent();
        fPlayer->toggleDeformer(*index);
    }
}

void ViewerWindow::mousePressEvent(QMouseEvent* event)
{
    fLastPosition = event->position();
}

void ViewerWindow::mouseMoveEvent(QMouseEvent* event)
{
    const QPointF moved = event->position() - fLastPosition;
    fLastPosition = event->position();
    if (!fPlayer || event->buttons() == Qt::NoButton)
        return;
    Camera& camera = fPlayer->session().camera();
    const bool pans = event->buttons().testFlag(Qt::RightButton) ||
                      event->modifiers().testFlag(Qt::ShiftModifier);
    const auto windowHeight = static_cast<float>(height());
    if (pans)
        camera.pan(static_cast<float>(moved.x()) / windowHeight,
                   static_cast<float>(-moved.y()) / windowHeight);
    else
        camera.orbit(-kDegreesPerPixel * static_cast<float>(moved.x()),
                     kDegreesPerPixel * static_cast<float>(moved.y()));
}

void ViewerWindow::wheelEvent(QWheelEvent* event)
{
    if (fPlayer)
        fPlayer->session().camera().zoom(static_cast<float>(event->angleDelta().y()) /
                                         kUnitsPerStep);
}

} // namespace viewer
