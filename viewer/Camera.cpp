#include "viewer/Camera.h"

#include <algorithm>
#include <cmath>

#include <QtMath>

namespace viewer {
namespace {

// A portrait lens: little distortion.
constexpr float kVerticalFieldOfView = 30.0f; // degrees
// Air around what is framed.
constexpr float kMargin = 1.12f;
constexpr float kLowestPitch = 2.0f;
constexpr float kHighestPitch = 85.0f;
constexpr float kZoomPerStep = 0.9f;
// Limits of zooming, in parts of the distance that shows everything.
constexpr float kNearest = 0.25f;
constexpr float kFarthest = 4.0f;

} // namespace

void Camera::frame(const QVector3D& stageSize, float aspect)
{
    fAspect = aspect;
    fTarget = {0, stageSize.y() / 2, 0};
    fFittingDistance = fittingDistance(stageSize);
    fDistance = fFittingDistance;
}

void Camera::orbit(float yaw, float pitch)
{
    fYaw += yaw;
    fPitch = std::clamp(fPitch + pitch, kLowestPitch, kHighestPitch);
}

void Camera::zoom(float steps)
{
    fDistance = std::clamp(fDistance * std::pow(kZoomPerStep, steps), kNearest * fFittingDistance,
                           kFarthest * fFittingDistance);
}

QVector3D Camera::eye() const
{
    const float yaw = qDegreesToRadians(fYaw);
    const float pitch = qDegreesToRadians(fPitch);
    const QVector3D direction(std::sin(yaw) * std::cos(pitch), std::sin(pitch),
                              std::cos(yaw) * std::cos(pitch));
    return fTarget + fDistance * direction;
}

QMatrix4x4 Camera::view() const
{
    QMatrix4x4 view;
    view.lookAt(eye(), fTarget, {0, 1, 0});
    return view;
}

QMatrix4x4 Camera::toClip() const
{
    QMatrix4x4 projection;
    projection.perspective(kVerticalFieldOfView, fAspect, 0.02f * fDistance,
                           8.0f * (fDistance + fFittingDistance));
    return projection * view();
}

// The smallest distance at which every corner of the stage is inside the picture.
float Camera::fittingDistance(const QVector3D& stageSize) const
{
    const float tangentY = std::tan(qDegreesToRadians(kVerticalFieldOfView / 2)) / kMargin;
    const float tangentX = tangentY * fAspect;
    const QMatrix4x4 rotation = view();
    float distance = 0;
    for (int corner = 0; corner < 8; ++corner) {
        const QVector3D offset((corner & 1 ? 0.5f : -0.5f) * stageSize.x(),
                               (corner & 2 ? 0.5f : -0.5f) * stageSize.y(),
                               (corner & 4 ? 0.5f : -0.5f) * stageSize.z());
        const QVector3D seen = rotation.mapVector(offset); // the camera looks along -z
        distance = std::max({distance, std::abs(seen.x()) / tangentX + seen.z(),
                             std::abs(seen.y()) / tangentY + seen.z()});
    }
    return distance;
}

} // namespace viewer
