// A vertex buffer of the renderer, with the class that owns it.
#pragma once

#include "evaluator/Geometry.h"

#include <cstddef>
#include <vector>

class QOpenGLExtraFunctions;

namespace info {

// Owns an OpenGL buffer of packed vectors. The OpenGL context is current during each operation.
class RendererVertices {
public:
    RendererVertices(QOpenGLExtraFunctions& gl, std::size_t vertexCount);
    ~RendererVertices();
    RendererVertices(const RendererVertices&) = delete;
    RendererVertices& operator=(const RendererVertices&) = delete;

    unsigned name() const noexcept { return fName; }
    // Replace and return the whole contents. read() returns an empty vector if the buffer cannot be
    // mapped.
    void write(const std::vector<vyra::Vector3>& values);
    [[nodiscard]] std::vector<vyra::Vector3> read();

private:
    QOpenGLExtraFunctions& fGL;
    std::size_t fCount;
    unsigned fName = 0;
};

} // namespace info
