// A camera that circles around the stage and keeps it in the picture.
#pragma once

#include <vector>

#include <QMatrix4x4>
#include <QVector3D>

namespace viewer {

class Camera {
public:
    // Comes as near as it can with all of these points inside a picture of this shape (width by
    // height), seen from the present angles, and keeps them inside from then on, unless zoom or pan
    // leave that view. `points` is not empty.
    void frame(std::vector<QVector3D> points, float aspect);
    // Sets the shape of the picture.
    void setAspect(float aspect);
    // Angles in degrees; the camera stays above the ground and short of the zenith.
    void orbit(float yaw, float pitch);
    // Steps of the wheel, positive to come nearer.
    void zoom(float steps);
    // Moves the picture by parts of its height, to the right and up.
    void pan(float right, float up);
    // Returns to the angles of the start, with everything in the picture.
    void reset();

    QVector3D eye() const;
    QMatrix4x4 toClip() const; // from the stage

private:
    static constexpr float kFirstYaw = 28;
    static constexpr float kFirstPitch = 14;

    float distance() const { return fZoom * fFittingDistance; }
    QVector3D target() const;
    QVector3D direction() const; // to the camera
    void fit();

    std::vector<QVector3D> fPoints; // that are kept in the picture
    QVector3D fFittingTarget;
    float fFittingDistance = 3;
    float fAspect = 1;
    float fYaw = kFirstYaw;     // degrees, from the front to the side
    float fPitch = kFirstPitch; // degrees above the horizon
    float fZoom = 1;            // distance, in parts of the fitting one
    QVector3D fPan;             // of the target, in parts of the fitting distance
};

} // namespace viewer
