#include "viewer/render/Camera.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <utility>

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
// How far the target may be moved away, in the same parts.
constexpr float kFarthestPan = 1.0f;
// The camera stays away from the nearest point by this part of the radius of all.
constexpr float kLeastGap = 0.1f;
// Each step of centring halves the error: after these nothing is seen of it.
constexpr int kCentringSteps = 16;

// One axis of the picture, across the axis z that points to the camera.
class PictureAxis {
public:
    // `tangent` is that of half the picture. On the axis, a camera at (c, d) has a point (p, z) in
    // the picture if |p - c| <= (d - z) tangent, so that d tangent + c and d tangent - c each have
    // a least value.
    PictureAxis(const std::vector<QVector3D>& points, int axis, float tangent)
        : fPoints(points), fAxis(axis), fTangent(tangent)
    {
        for (const QVector3D& point : points) {
            fLeastPlus = std::max(fLeastPlus, point.z() * tangent + point[axis]);
            fLeastMinus = std::max(fLeastMinus, point.z() * tangent - point[axis]);
        }
    }

    float leastDistance() const { return (fLeastPlus + fLeastMinus) / (2 * fTangent); }

    // The place of the camera from which the points reach as far to both sides of the picture.
    float centre(float distance) const
    {
        float low = fLeastPlus - distance * fTangent;
        float high = distance * fTangent - fLeastMinus;
        for (int i = 0; i < kCentringSteps; ++i) {
            const float middle = (low + high) / 2;
            (imbalance(middle, distance) > 0 ? low : high) = middle;
        }
        return (low + high) / 2;
    }

private:
    static constexpr float kLargest = std::numeric_limits<float>::max();

    // How much farther the points reach to the positive side than to the other, as tangents.
    float imbalance(float place, float distance) const
    {
        float most = -kLargest;
        float least = kLargest;
        for (const QVector3D& point : fPoints) {
            const float tangent = (point[fAxis] - place) / (distance - point.z());
            most = std::max(most, tangent);
            least = std::min(least, tangent);
        }
        return most + least;
    }

    const std::vector<QVector3D>& fPoints;
    int fAxis;
    float fTangent;
    float fLeastPlus = -kLargest;
    float fLeastMinus = -kLargest;
};

// From where the points may be seen at all.
float leastDistance(const std::vector<QVector3D>& points)
{
    float nearest = 0;
    float radius = 0;
    for (const QVector3D& point : points) {
        nearest = std::max(nearest, point.z());
        radius = std::max(radius, point.length());
    }
    return nearest + kLeastGap * radius;
}

} // namespace

void Camera::frame(std::vector<QVector3D> points, float aspect)
{
    fPoints = std::move(points);
    fZoom = 1;
    fPan = {};
    setAspect(aspect);
}

void Camera::setAspect(float aspect)
{
    fAspect = aspect;
    fit();
}

void Camera::orbit(float yaw, float pitch)
{
    fYaw += yaw;
    fPitch = std::clamp(fPitch + pitch, kLowestPitch, kHighestPitch);
    fit();
}

void Camera::zoom(float steps)
{
    fZoom = std::clamp(fZoom * std::pow(kZoomPerStep, steps), kNearest, kFarthest);
}

void Camera::pan(float right, float up)
{
    QMatrix4x4 toStage;
    toStage.lookAt(direction(), {}, {0, 1, 0});
    toStage = toStage.transposed(); // the inverse of a rotation
    const float height = 2 * fZoom * std::tan(qDegreesToRadians(kVerticalFieldOfView / 2));
    fPan += toStage.mapVector({-right * height, -up * height, 0});
    if (fPan.length() > kFarthestPan)
        fPan *= kFarthestPan / fPan.length();
}

void Camera::reset()
{
    fYaw = kFirstYaw;
    fPitch = kFirstPitch;
    fZoom = 1;
    fPan = {};
    fit();
}

QVector3D Camera::direction() const
{
    const float yaw = qDegreesToRadians(fYaw);
    const float pitch = qDegreesToRadians(fPitch);
    return {std::sin(yaw) * std::cos(pitch), std::sin(pitch), std::cos(yaw) * std::cos(pitch)};
}

// Not below the ground, where a camera that looks at it would be, too.
QVector3D Camera::target() const
{
    QVector3D target = fFittingTarget + fPan * fFittingDistance;
    target.setY(std::max(target.y(), std::min(fFittingTarget.y(), 0.0f)));
    return target;
}

QVector3D Camera::eye() const
{
    return target() + distance() * direction();
}

QMatrix4x4 Camera::toClip() const
{
    QMatrix4x4 matrix;
    matrix.perspective(kVerticalFieldOfView, fAspect, 0.02f * distance(),
                       8.0f * (distance() + fFittingDistance));
    matrix.lookAt(eye(), target(), {0, 1, 0});
    return matrix;
}

void Camera::fit()
{
    if (fPoints.empty())
        return;
    QVector3D middle;
    for (const QVector3D& point : fPoints)
        middle += point / static_cast<float>(fPoints.size());
    QMatrix4x4 toView;
    toView.lookAt(direction(), {}, {0, 1, 0});
    // As seen from the middle; the camera looks along -z.
    std::vector<QVector3D> seen;
    seen.reserve(fPoints.size());
    for (const QVector3D& point : fPoints)
        seen.push_back(toView.mapVector(point - middle));

    const float tangentY = std::tan(qDegreesToRadians(kVerticalFieldOfView / 2)) / kMargin;
    const PictureAxis across(seen, 0, tangentY * fAspect);
    const PictureAxis upwards(seen, 1, tangentY);
    fFittingDistance =
        std::max({leastDistance(seen), across.leastDistance(), upwards.leastDistance()});
    const QVector3D shift(across.centre(fFittingDistance), upwards.centre(fFittingDistance), 0);
    fFittingTarget = middle + toView.transposed().mapVector(shift);
}

} // namespace viewer
