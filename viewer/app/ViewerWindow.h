// The window that plays.
#pragma once

#include "viewer/Failure.h"

#include <memory>

#include <QOpenGLWindow>
#include <QPoint>

namespace viewer {

class Player;
class Session;

// Without a session it stays empty. With one it draws frame after frame; the mouse orbits and
// pans, the wheel zooms; Controls.h lists the keys.
class ViewerWindow : public QOpenGLWindow {
public:
    ViewerWindow();
    ~ViewerWindow() override;

    // Shows the window and waits until its OpenGL context is there.
    Status open(const QSize& size);

    // Starts to play. The session is borrowed until stop(), which leaves the context current.
    void play(Session& session);
    void stop();
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

    std::unique_ptr<Player> fPlayer; // null: nothing plays
    Status fFailure;
    QPointF fLastPosition; // of the mouse
};

} // namespace viewer
