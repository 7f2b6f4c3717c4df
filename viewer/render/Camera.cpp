#include "viewer/render/Camera.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <utility>

#include <QtMath>

namespace viewer {
namespace {

// That of a portrait lens: little distortion.
constexpr float kVerticalFieldOfView = 30.0f; // degrees
// Factor of the extent of the picture relative to that of the framed points.
constexpr float kMargin = 1.15f;
constexpr float kLowestPitch = 2.0f;
constexpr float kHighestPitch = 85.0f;
constexpr float kZoomPerStep = 0.9f;
// Limits of the zoom, relative to the distance that shows all points.
constexpr float kNearest = 0.25f;
constexpr float kFarthest = 4.0f;
// Limit of the pan, relative to the same distance.
constexpr float kFarthestPan = 1.0f;
// Least distance from the nearest point, relative to the radius of all points.
constexpr float kLeastGap = 0.1f;
// Each step of centring halves the error; after these it is below a pixel.
constexpr int kCentringSteps = 16;

// One axis of the picture. The axis z points to the camera.
class PictureAxis {
public:
    // `tangent` is that of half the angle of view. A camera at the coordinate c on the axis and the
    // distance d sees a point (p, z) if |p - c| <= (d - z) tangent. So each of d tangent + c and
    // d tangent - c has a least value.
    PictureAxis(const std::vector<QVector3D>& points, int axis, float tangent)
        : fPoints(points), fAxis(axis), fTangent(tangent)
    {
        for (const QVector3D& point : points) {
            fLeastPlus = std::max(fLeastPlus, point.z() * tangent + point[axis]);
            fLeastMinus = std::max(fLeastMinus, point.z() * tangent - point[axis]);
        }
    }

    float leastDistance() const { return (fLeastPlus + fLeastMinus) / (2 * fTangent); }

    // Returns the coordinate of the camera that centres the points in the picture.
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

    // Returns the sum of the greatest and the least tangent, 0 if the points are centred.
    float imbalance(float camera, float distance) const
    {
        float most = -kLargest;
        float least = kLargest;
        for (const QVector3D& point : fPoints) {
            const float tangent = (point[fAxis] - camera) / (distance - point.z());
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

// Returns the least distance at which the camera is in front of all points.
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
    QMatrix4x4 toWorld;
    toWorld.lookAt(direction(), {}, {0, 1, 0});
    toWorld = toWorld.transposed(); // the inverse of a rotation
    const float height = 2 * fZoom * std::tan(qDegreesToRadians(kVerticalFieldOfView / 2));
    fPan += toWorld.mapVector({-right * height, -up * height, 0});
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

// Limited to the ground and above: a camera that looks at a target below it could be below it, too.
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
    // Relative to the middle, in view space; the camera looks along -z.
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
