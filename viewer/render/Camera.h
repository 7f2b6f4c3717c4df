// Orbit camera that keeps the scene in the picture.
#pragma once

#include <vector>

#include <QMatrix4x4>
#include <QVector3D>

namespace viewer {

// World space: y is up, the ground is y = 0, lengths are in largest extents of a character.
class Camera {
public:
    // Moves as near as possible with all `points` inside a picture of this aspect ratio (width /
    // height) at the current angles, and resets zoom and pan. Later calls of setAspect and orbit
    // keep the points inside. `points` is not empty.
    void frame(std::vector<QVector3D> points, float aspect);
    // Sets the aspect ratio, width / height.
    void setAspect(float aspect);
    // Rotates by angles in degrees. The pitch is limited: the camera stays above the ground and
    // below the zenith.
    void orbit(float yaw, float pitch);
    // Zooms by wheel steps, in if positive.
    void zoom(float steps);
    // Moves the picture to the right and up, in fractions of its height.
    void pan(float right, float up);
    // Restores the initial angles, zoom and pan.
    void reset();

    // Position in world space.
    [[nodiscard]] QVector3D eye() const;
    // Transform from world space to clip space.
    [[nodiscard]] QMatrix4x4 toClip() const;

private:
    static constexpr float kFirstYaw = 28;
    static constexpr float kFirstPitch = 14;

    float distance() const { return fZoom * fFittingDistance; }
    QVector3D target() const;
    QVector3D direction() const; // from the target to the camera
    void fit();

    std::vector<QVector3D> fPoints; // kept in the picture
    QVector3D fFittingTarget;
    float fFittingDistance = 3;
    float fAspect = 1;
    float fYaw = kFirstYaw;     // degrees, from the front to the side
    float fPitch = kFirstPitch; // degrees above the horizon
    float fZoom = 1;            // distance / fFittingDistance
    QVector3D fPan;             // offset of the target / fFittingDistance
};

} // namespace viewer
