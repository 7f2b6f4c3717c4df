#include "viewer/render/ShadowMap.h"

#include <algorithm>

namespace viewer {
namespace {

constexpr int kTexels = 2048;
// Depth offsets that keep surfaces from shading themselves: one by slope, for grazing light, and a
// constant one.
constexpr float kSlopeBias = 1.5f;
constexpr float kConstantBias = 4.0f;
// Length of shadows beyond the scene, relative to its height.
constexpr float kShadowReach = 1.0f;

} // namespace

ShadowMap::ShadowMap(QOpenGLFunctions_3_3_Core& gl) : fGL(gl)
{
    fGL.glGenTextures(1, &fTexture);
    fGL.glBindTexture(GL_TEXTURE_2D, fTexture);
    fGL.glTexImage2D(GL_TEXTURE_2D, 0, GL_DEPTH_COMPONENT24, kTexels, kTexels, 0,
                     GL_DEPTH_COMPONENT, GL_UNSIGNED_INT, nullptr);
    const std::pair<GLenum, GLint> parameters[] = {
        {GL_TEXTURE_MIN_FILTER, GL_LINEAR},
        {GL_TEXTURE_MAG_FILTER, GL_LINEAR},
        {GL_TEXTURE_WRAP_S, GL_CLAMP_TO_EDGE},
        {GL_TEXTURE_WRAP_T, GL_CLAMP_TO_EDGE},
        {GL_TEXTURE_COMPARE_MODE, GL_COMPARE_REF_TO_TEXTURE},
        {GL_TEXTURE_COMPARE_FUNC, GL_LEQUAL},
    };
    for (const auto& [name, value] : parameters)
        fGL.glTexParameteri(GL_TEXTURE_2D, name, value);

    fGL.glGenFramebuffers(1, &fFramebuffer);
    fGL.glBindFramebuffer(GL_FRAMEBUFFER, fFramebuffer);
    fGL.glFramebufferTexture2D(GL_FRAMEBUFFER, GL_DEPTH_ATTACHMENT, GL_TEXTURE_2D, fTexture, 0);
    fGL.glDrawBuffer(GL_NONE);
    fGL.glReadBuffer(GL_NONE);
}

ShadowMap::~ShadowMap()
{
    fGL.glDeleteFramebuffers(1, &fFramebuffer);
    fGL.glDeleteTextures(1, &fTexture);
}

QVector3D ShadowMap::towardsLight() const
{
    // From the camera's left, high.
    return QVector3D(-0.25f, 0.85f, 0.60f).normalized();
}

void ShadowMap::aim(const QVector3D& sceneSize)
{
    fRadius = sceneSize.length() / 2 + kShadowReach * sceneSize.y();
    const QVector3D middle(0, sceneSize.y() / 2, 0);
    QMatrix4x4 projection;
    projection.ortho(-fRadius, fRadius, -fRadius, fRadius, -fRadius, fRadius);
    QMatrix4x4 view;
    view.lookAt(middle, middle - towardsLight(), {0, 0, -1});
    fFromWorld = projection * view;
}

void ShadowMap::bind()
{
    fGL.glBindFramebuffer(GL_FRAMEBUFFER, fFramebuffer);
    fGL.glViewport(0, 0, kTexels, kTexels);
    fGL.glEnable(GL_POLYGON_OFFSET_FILL);
    fGL.glPolygonOffset(kSlopeBias, kConstantBias);
    fGL.glClear(GL_DEPTH_BUFFER_BIT);
}

void ShadowMap::bindTexture(GLuint unit)
{
    fGL.glDisable(GL_POLYGON_OFFSET_FILL);
    fGL.glActiveTexture(GL_TEXTURE0 + unit);
    fGL.glBindTexture(GL_TEXTURE_2D, fTexture);
}

} // namespace viewer
