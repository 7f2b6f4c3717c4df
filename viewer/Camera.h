// A camera that circles around the stage.
#pragma once

#include <QMatrix4x4>
#include <QVector3D>

namespace viewer {

class Camera {
public:
    // Looks at the middle of a stage of this size (feet at y = 0), from a distance that shows all
    // of it in a picture of this shape (width by height).
    void frame(const QVector3D& stageSize, float aspect);
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
    float fittingDistance(const QVector3D& stageSize) const;

    QVector3D fTarget;
    float fYaw = 28;   // degrees, from the front to the side
    float fPitch = 14; // degrees above the horizon
    float fDistance = 3;
    float fFittingDistance = 3;
    float fAspect = 1;
};

} // namespace viewer
