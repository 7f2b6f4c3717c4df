#include "viewer/Camera.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include <QtMath>

namespace viewer {
namespace {

// A portrait lens: little distortion.
constexpr float kVerticalFieldOfView = 30.0f; // degrees
// Air around what is framed.
constexpr float kMargin = 1.15f;
constexpr float kLowest = std::numeric_limits<float>::lowest();
constexpr float kLowestPitch = 2.0f;
constexpr float kHighestPitch = 85.0f;
constexpr float kZoomPerStep = 0.9f;
// Limits of zooming, in parts of the distance that shows everything.
constexpr float kNearest = 0.25f;
constexpr float kFarthest = 4.0f;

} // namespace

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

// With the camera at (x, y) in its own plane, a point is inside the picture as long as the distance
// is at least z + |px - x| / tangent, and likewise for y. The x at which the farthest points on
// both sides ask for the same distance is the best one.
void Camera::frame(const std::vector<QVector3D>& points, float aspect)
{
    fAspect = aspect;
    fTarget = {};
    const QMatrix4x4 rotation = view();
    const float tangentY = std::tan(qDegreesToRadians(kVerticalFieldOfView / 2)) / kMargin;
    const float tangentX = tangentY * fAspect;
    float right = kLowest, left = kLowest, top = kLowest, bottom = kLowest;
    for (const QVector3D& point : points) {
        const QVector3D seen = rotation.mapVector(point); // the camera looks along -z
        right = std::max(right, seen.z() + seen.x() / tangentX);
        left = std::max(left, seen.z() - seen.x() / tangentX);
        top = std::max(top, seen.z() + seen.y() / tangentY);
        bottom = std::max(bottom, seen.z() - seen.y() / tangentY);
    }
    const QVector3D middle(tangentX * (right - left) / 2, tangentY * (top - bottom) / 2, 0);
    fTarget = rotation.transposed().mapVector(middle); // a rotation's inverse
    fFittingDistance = std::max(right + left, top + bottom) / 2;
    fDistance = fFittingDistance;
}

} // namespace viewer
