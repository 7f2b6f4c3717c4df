// Vertex buffer of the renderer.
#pragma once

#include "evaluator/Geometry.h"

#include <vector>

#include <QOpenGLFunctions_3_3_Core>

namespace viewer {

// OpenGL buffer of packed vectors. The OpenGL context must be current in all operations; the
// destructor does not delete the buffer, destroy() does.
class VertexBuffer {
public:
    VertexBuffer() = default;
    // destroy() must have been called.
    ~VertexBuffer() = default;
    VertexBuffer(const VertexBuffer&) = delete;
    VertexBuffer& operator=(const VertexBuffer&) = delete;

    // Creates the OpenGL buffer with these contents.
    void create(QOpenGLFunctions_3_3_Core& gl, const std::vector<vyra::Vector3>& contents);
    // Deletes the OpenGL buffer, if there is one.
    void destroy(QOpenGLFunctions_3_3_Core& gl);

    // Replaces the contents. `contents` has as many elements as in create().
    void write(QOpenGLFunctions_3_3_Core& gl, const std::vector<vyra::Vector3>& contents) const;
    // Reads the contents back. Waits for OpenGL.
    [[nodiscard]] std::vector<vyra::Vector3> read(QOpenGLFunctions_3_3_Core& gl) const;

    // Name of the OpenGL buffer, 0 if there is none.
    [[nodiscard]] GLuint name() const noexcept { return fName; }

private:
    GLuint fName = 0;
    std::size_t fCount = 0; // vectors
};

} // namespace viewer
