// Window of the viewer.
#pragma once

#include "viewer/Failure.h"

#include <memory>

#include <QOpenGLWindow>
#include <QPoint>

namespace viewer {

class Player;
class Session;

// Shows the frames of a session. While it plays, the mouse orbits and pans, the wheel zooms, and
// Controls.h lists the keys.
class ViewerWindow : public QOpenGLWindow {
public:
    ViewerWindow();
    ~ViewerWindow() override;

    // Shows the window and waits until it is exposed and has an OpenGL context. Fails without
    // OpenGL 3.3.
    [[nodiscard]] Status open(const QSize& size);

    // Starts playing. The session is borrowed until stop(), which makes the context current.
    void play(Session& session);
    void stop();
    // Returns the failure that ended playing, if any.
    [[nodiscard]] const Status& failure() const noexcept { return fFailure; }

    // Shows the last frame of a session that does not play.
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

    std::unique_ptr<Player> fPlayer; // null if nothing plays
    Status fFailure;
    QPointF fLastPosition; // of the mouse
};

} // namespace viewer
