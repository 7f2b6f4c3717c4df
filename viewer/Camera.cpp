#include "viewer/Camera.h"

#include <algorithm>
#include <cmath>

#include <QtMath>

namespace viewer {
namespace {

// A portrait lens: little distortion.
constexpr float kVerticalFieldOfView = 30.0f; // degrees
// Air around what is framed.
constexpr float kMargin = 1.15f;
constexpr float kLowestPitch = 2.0f;
constexpr float kHighestPitch = 85.0f;
constexpr float kZoomPerStep = 0.9f;
// Limits of zooming, in parts of the distance that shows everything.
constexpr float kNearest = 0.25f;
constexpr float kFarthest = 4.0f;
// Each step of framing leaves a fraction of the error: after these nothing is seen of it.
constexpr int kFramingSteps = 8;

// The smallest distance at which all points, as seen from a camera shifted by `shift`, are within
// the tangents.
float fittingDistance(const std::vector<QVector3D>& seen, const QVector3D& shift, float tangentX,
                      float tangentY)
{
    float distance = 0;
    for (const QVector3D& point : seen) {
        const QVector3D offset = point - shift;
        distance = std::max({distance, point.z() + std::abs(offset.x()) / tangentX,
                             point.z() + std::abs(offset.y()) / tangentY});
    }
    return distance;
}

// How much farther the points reach to the right than to the left, and up than down, as tangents.
QVector3D imbalance(const std::vector<QVector3D>& seen, const QVector3D& shift, float distance)
{
    QVector3D most;
    QVector3D least;
    for (const QVector3D& point : seen) {
        const QVector3D tangent = (point - shift) / (distance - point.z());
        for (int axis = 0; axis < 2; ++axis) {
            most[axis] = std::max(most[axis], tangent[axis]);
            least[axis] = std::min(least[axis], tangent[axis]);
        }
    }
    return most + least;
}

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

// In turn: the distance at which everything is inside, then the shift that leaves the same room on
// opposite sides of the picture.
void Camera::frame(const std::vector<QVector3D>& points, float aspect)
{
    fAspect = aspect;
    QVector3D middle;
    for (const QVector3D& point : points)
        middle += point / static_cast<float>(points.size());
    fTarget = middle;
    const QMatrix4x4 toView = view();
    const QMatrix4x4 fromView = toView.inverted();
    // As seen from the middle; the camera looks along -z.
    std::vector<QVector3D> seen;
    seen.reserve(points.size());
    for (const QVector3D& point : points)
        seen.push_back(toView.mapVector(point - middle));

    const float tangentY = std::tan(qDegreesToRadians(kVerticalFieldOfView / 2)) / kMargin;
    QVector3D shift;
    for (int i = 0; i < kFramingSteps; ++i) {
        fFittingDistance = fittingDistance(seen, shift, tangentY * fAspect, tangentY);
        shift += imbalance(seen, shift, fFittingDistance) * fFittingDistance / 2;
    }
    fFittingDistance = fittingDistance(seen, shift, tangentY * fAspect, tangentY);
    fDistance = fFittingDistance;
    fTarget = middle + fromView.mapVector(shift);
}

} // namespace viewer
