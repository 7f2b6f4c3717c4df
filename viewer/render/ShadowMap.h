// Shadow map of the key light.
#pragma once

#include <QMatrix4x4>
#include <QOpenGLFunctions_3_3_Core>
#include <QVector3D>

namespace viewer {

// Depth texture with comparison on sampling, and its framebuffer. The OpenGL context must be
// current in all operations and the destructor.
class ShadowMap {
public:
    // Borrows the OpenGL functions.
    explicit ShadowMap(QOpenGLFunctions_3_3_Core& gl);
    ~ShadowMap();
    ShadowMap(const ShadowMap&) = delete;
    ShadowMap& operator=(const ShadowMap&) = delete;

    // Sets the projection for a scene of this size, see Scene::size.
    void aim(const QVector3D& sceneSize);
    // Clears the map and makes it the render target.
    void bind();
    // Ends drawing into the map and binds it to this texture unit.
    void bindTexture(GLuint unit);

    // Transform from world space to the clip space of the map.
    [[nodiscard]] const QMatrix4x4& fromWorld() const noexcept { return fFromWorld; }
    // Direction of length 1 to the light.
    [[nodiscard]] QVector3D towardsLight() const;
    // Converts a length in world space to texture coordinates of the map.
    [[nodiscard]] float toTextureLength(float worldLength) const noexcept
    {
        return worldLength / (2 * fRadius);
    }

private:
    QOpenGLFunctions_3_3_Core& fGL;
    GLuint fTexture = 0;
    GLuint fFramebuffer = 0;
    QMatrix4x4 fFromWorld;
    float fRadius = 1; // half of the side of the map in world space
};

} // namespace viewer
