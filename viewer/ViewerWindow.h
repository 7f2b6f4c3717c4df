// The window that plays.
#pragma once

#include "viewer/Failure.h"

#include <QElapsedTimer>
#include <QOpenGLWindow>
#include <QPoint>

namespace viewer {

class Session;

// Without a session it stays empty. With one it draws frame after frame; the mouse orbits, the
// wheel zooms, D changes the level of detail, Escape quits.
class ViewerWindow : public QOpenGLWindow {
public:
    // Shows the window and waits until its OpenGL context is there.
    Status open(const QSize& size);

    // Starts to play. The session is borrowed until stop().
    void play(Session& session);
    void stop() { fSession = nullptr; }
    // Why playing ended by itself.
    const Status& failure() const { return fFailure; }

    // Shows what the session has drawn; for a caller that draws by itself.
    void present(Session& session);

protected:
    void resizeGL(int width, int height) override;
    void paintGL() override;
    void keyPressEvent(QKeyEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;
    void mouseMoveEvent(QMouseEvent* event) override;
    void wheelEvent(QWheelEvent* event) override;

private:
    QSize pixelSize() const;

    Session* fSession = nullptr;
    Status fFailure;
    QElapsedTimer fClock;
    QPointF fLastPosition; // of the mouse
};

} // namespace viewer
