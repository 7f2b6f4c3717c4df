// Draws a scene from the vertex buffers that the deformers wrote.
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

// Uses OpenGL 3.3, core profile. The context must be current in all operations and the destructor.
class Renderer {
public:
    // Borrows the OpenGL functions.
    explicit Renderer(QOpenGLFunctions_3_3_Core& gl);
    ~Renderer();
    Renderer(const Renderer&) = delete;
    Renderer& operator=(const Renderer&) = delete;

    // Compiles the shaders. Must succeed before draw().
    [[nodiscard]] Status initialize();
    // Draws into the rectangle `area` of the canvas, in pixels. Pixels outside it do not change.
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
    GLuint fNoVertices = 0; // vertex array without buffers, for the backdrop and the ground
};

} // namespace viewer
