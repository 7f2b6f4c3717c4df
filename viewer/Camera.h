// A camera that circles around the stage.
#pragma once

#include <vector>

#include <QMatrix4x4>
#include <QVector3D>

namespace viewer {

class Camera {
public:
    // Comes as near as it can with all of these points inside a picture of this shape (width by
    // height), seen from the present angles. `points` is not empty.
    void frame(const std::vector<QVector3D>& points, float aspect);
    // The picture has another shape now.
    void setAspect(float aspect) { fAspect = aspect; }
    // Angles in degrees; the camera stays above the ground and short of the zenith.
    void orbit(float yaw, float pitch);
    // Steps of the wheel, positive to come nearer.
    void zoom(float steps);

    QVector3D eye() const;
    QMatrix4x4 toClip() const; // from the stage

private:
    QMatrix4x4 view() const;

    QVector3D fTarget;
    float fYaw = 28;   // degrees, from the front to the side
    float fPitch = 14; // degrees above the horizon
    float fDistance = 3;
    float fFittingDistance = 3;
    float fAspect = 1;
};

} // namespace viewer
