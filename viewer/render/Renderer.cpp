#include "viewer/render/Renderer.h"

#include <algorithm>
#include <initializer_list>

#include <QByteArray>
#include <QFile>

namespace viewer {
namespace {

// Width of the soft edges of shadows, in largest extents of a character.
constexpr float kPenumbra = 0.02f;
// Distance that the ground extends beyond the scene, in the same unit, and the fraction of the
// ground that does not fade.
constexpr float kGroundReach = 5.0f;
constexpr float kClearGround = 0.45f;
constexpr GLuint kShadowUnit = 0;

QByteArray shaderText(std::initializer_list<const char*> parts)
{
    QByteArray text;
    for (const char* part : parts) {
        QFile file(QString(":/shaders/") + part);
        if (file.open(QIODevice::ReadOnly))
            text += file.readAll();
    }
    return text;
}

[[nodiscard]] bool build(QOpenGLShaderProgram& program, const char* vertexShader,
                         std::initializer_list<const char*> fragmentShader)
{
    return program.addShaderFromSourceCode(QOpenGLShader::Vertex, shaderText({vertexShader})) &&
           program.addShaderFromSourceCode(QOpenGLShader::Fragment, shaderText(fragmentShader)) &&
           program.link();
}

} // namespace

Renderer::Renderer(QOpenGLFunctions_3_3_Core& gl) : fGL(gl), fShadowMap(gl)
{
    fGL.glGenVertexArrays(1, &fNoVertices);
}

Renderer::~Renderer()
{
    fGL.glDeleteVertexArrays(1, &fNoVertices);
}

Status Renderer::initialize()
{
    const bool built =
        build(fDepth, "depth.vert", {"depth.frag"}) &&
        build(fBackdrop, "backdrop.vert", {"version.glsl", "backdrop.glsl", "backdrop.frag"}) &&
        build(fGround, "ground.vert",
              {"version.glsl", "lighting.glsl", "backdrop.glsl", "ground.frag"}) &&
        build(fCharacter, "character.vert", {"version.glsl", "lighting.glsl", "character.frag"});
    if (built)
        return {};
    return Failure{ExitCode::kNoGraphics,
                   "the OpenGL driver does not compile the shaders; update the graphics driver"};
}

void Renderer::draw(const Scene& scene, const Camera& camera, Canvas& canvas, const QRect& area)
{
    fGL.glEnable(GL_DEPTH_TEST);
    fGL.glDisable(GL_BLEND);
    fShadowMap.aim(scene.size());
    drawShadows(scene);
    fShadowMap.bindTexture(kShadowUnit);

    canvas.bind();
    fGL.glViewport(area.x(), area.y(), area.width(), area.height());
    fGL.glScissor(area.x(), area.y(), area.width(), area.height());
    fGL.glEnable(GL_SCISSOR_TEST);
    fGL.glClear(GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT);
    drawBackdrop(camera);
    drawGround(scene, camera);
    drawCharacters(scene, camera);
    fGL.glDisable(GL_SCISSOR_TEST);
    fGL.glBindVertexArray(0);
}

void Renderer::drawShadows(const Scene& scene)
{
    fShadowMap.bind();
    fDepth.bind();
    fDepth.setUniformValue("toLight", fShadowMap.fromWorld());
    for (const Character& character : scene.characters()) {
        for (const auto& mesh : character.meshes) {
            fDepth.setUniformValue("toWorld", character.placement * mesh->pose.geometryMatrix);
            drawMesh(*mesh);
        }
    }
}

void Renderer::drawBackdrop(const Camera& camera)
{
    fGL.glDepthMask(GL_FALSE);
    fGL.glDepthFunc(GL_LEQUAL);
    fBackdrop.bind();
    fBackdrop.setUniformValue("fromClip", camera.toClip().inverted());
    fBackdrop.setUniformValue("eye", camera.eye());
    fGL.glBindVertexArray(fNoVertices);
    fGL.glDrawArrays(GL_TRIANGLES, 0, 3);
    fGL.glDepthMask(GL_TRUE);
}

void Renderer::drawGround(const Scene& scene, const Camera& camera)
{
    const float reach = kGroundReach + std::max(scene.size().x(), scene.size().z());
    fGround.bind();
    setLight(fGround);
    fGround.setUniformValue("toClip", camera.toClip());
    fGround.setUniformValue("halfSize", reach);
    fGround.setUniformValue("clearRadius", kClearGround * reach);
    fGL.glBindVertexArray(fNoVertices);
    fGL.glDrawArrays(GL_TRIANGLE_STRIP, 0, 4);
}

void Renderer::drawCharacters(const Scene& scene, const Camera& camera)
{
    fCharacter.bind();
    setLight(fCharacter);
    fCharacter.setUniformValue("toClip", camera.toClip());
    fCharacter.setUniformValue("eye", camera.eye());
    for (const Character& character : scene.characters()) {
        for (const auto& mesh : character.meshes) {
            const QMatrix4x4 toWorld = character.placement * mesh->pose.geometryMatrix;
            fCharacter.setUniformValue("toWorld", toWorld);
            fCharacter.setUniformValue("normalToWorld", toWorld.normalMatrix());
            fCharacter.setUniformValue("albedo", mesh->mesh().colour * character.tint);
            drawMesh(*mesh);
        }
    }
}

void Renderer::setLight(QOpenGLShaderProgram& program)
{
    program.setUniformValue("lightDirection", fShadowMap.towardsLight());
    program.setUniformValue("toLight", fShadowMap.fromWorld());
    program.setUniformValue("shadowBlur", fShadowMap.toTextureLength(kPenumbra));
    program.setUniformValue("shadowMap", kShadowUnit);
}

void Renderer::drawMesh(const CharacterMesh& mesh)
{
    fGL.glBindVertexArray(mesh.vertexArray);
    fGL.glDrawElements(GL_TRIANGLES, static_cast<GLsizei>(mesh.mesh().triangles.size()),
                       GL_UNSIGNED_INT, nullptr);
}

} // namespace viewer
