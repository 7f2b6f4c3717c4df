// What the key light sees.
#pragma once

#include <QMatrix4x4>
#include <QOpenGLFunctions_3_3_Core>
#include <QVector3D>

namespace viewer {

// A depth texture that is compared when it is sampled. All operations need the context to be
// current.
class ShadowMap {
public:
    explicit ShadowMap(QOpenGLFunctions_3_3_Core& gl);
    ~ShadowMap();
    ShadowMap(const ShadowMap&) = delete;
    ShadowMap& operator=(const ShadowMap&) = delete;

    // Aims the light at a stage of this size.
    void aim(const QVector3D& stageSize);
    // Directs drawing into the map, emptied.
    void bind();
    // Makes the texture readable in this texture unit.
    void bindTexture(GLuint unit);

    const QMatrix4x4& fromStage() const { return fFromStage; }
    QVector3D towardsLight() const;
    // From a length on the stage to parts of the map.
    float partOf(float stageLength) const { return stageLength / (2 * fRadius); }

private:
    QOpenGLFunctions_3_3_Core& fGL;
    GLuint fTexture = 0;
    GLuint fFramebuffer = 0;
    QMatrix4x4 fFromStage;
    float fRadius = 1; // of the lit part of the stage
};

} // namespace viewer
