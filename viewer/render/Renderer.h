// Draws the characters on their stage, from the vertex buffers that the deformers filled.
#pragma once

#include "viewer/Failure.h"
#include "viewer/render/Camera.h"
#include "viewer/render/Canvas.h"
#include "viewer/render/Scene.h"
#include "viewer/render/ShadowMap.h"

#include <QOpenGLFunctions_3_3_Core>
#include <QOpenGLShaderProgram>
#include <QRect>

namespace viewer {

// OpenGL 3.3, core profile. All operations need the context to be current.
class Renderer {
public:
    explicit Renderer(QOpenGLFunctions_3_3_Core& gl);
    ~Renderer();
    Renderer(const Renderer&) = delete;
    Renderer& operator=(const Renderer&) = delete;

    // Compiles the shaders.
    Status initialize();
    // Fills `area` of the canvas, in pixels; what is beside it stays.
    void draw(const Scene& scene, const Camera& camera, Canvas& canvas, const QRect& area);

private:
    void drawShadows(const Scene& scene);
    void drawBackdrop(const Camera& camera);
    void drawGround(const Scene& scene, const Camera& camera);
    void drawCharacters(const Scene& scene, const Camera& camera);
    void setLight(QOpenGLShaderProgram& program);
    void drawMesh(const CharacterMesh& mesh);

    QOpenGLFunctions_3_3_Core& fGL;
    ShadowMap fShadowMap;
    QOpenGLShaderProgram fDepth;
    QOpenGLShaderProgram fBackdrop;
    QOpenGLShaderProgram fGround;
    QOpenGLShaderProgram fCharacter;
    GLuint fNoVertices = 0; // the vertex array of what has no vertex buffers
};

} // namespace viewer
