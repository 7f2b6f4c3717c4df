// A vertex buffer of the renderer.
#pragma once

#include "evaluator/Geometry.h"

#include <vector>

#include <QOpenGLFunctions_3_3_Core>

namespace viewer {

// Owns an OpenGL buffer of packed vectors. All operations need the renderer's context to be
// current.
class VertexBuffer {
public:
    VertexBuffer() = default;
    // destroy() was called before.
    ~VertexBuffer() = default;
    VertexBuffer(const VertexBuffer&) = delete;
    VertexBuffer& operator=(const VertexBuffer&) = delete;

    // Creates the OpenGL buffer and fills it.
    void create(QOpenGLFunctions_3_3_Core& gl, const std::vector<vyra::Vector3>& contents);
    // Deletes it. Does nothing if there is none.
    void destroy(QOpenGLFunctions_3_3_Core& gl);

    void write(QOpenGLFunctions_3_3_Core& gl, const std::vector<vyra::Vector3>& contents) const;
    std::vector<vyra::Vector3> read(QOpenGLFunctions_3_3_Core& gl) const;

    GLuint name() const { return fName; }

private:
    GLuint fName = 0;
    std::size_t fCount = 0; // vectors
};

} // namespace viewer
