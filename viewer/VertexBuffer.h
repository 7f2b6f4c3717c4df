// A vertex buffer of the renderer that OpenCL may write into.
#pragma once

#include <vector>

#include <QOpenGLFunctions_3_3_Core>
#include <QVector3D>

struct TopenCLSharedBuffer;

namespace viewer {

// Whether a buffer is given up while an evaluation is open (its batch is acquired) or not.
enum class EvaluationState { kClosed, kOpen };

// Owns an OpenGL buffer of packed vectors and, once share() was called, its record in the library's
// shared-buffer manager. All operations need the renderer's context to be current.
class VertexBuffer {
public:
    VertexBuffer() = default;
    // Not shared any more by then, and released.
    ~VertexBuffer() = default;
    VertexBuffer(const VertexBuffer&) = delete;
    VertexBuffer& operator=(const VertexBuffer&) = delete;

    // Makes the OpenGL buffer and fills it.
    void create(QOpenGLFunctions_3_3_Core& gl, const std::vector<QVector3D>& contents);
    // Makes it known to OpenCL. A status of OpenCL.
    int share();
    // Takes it from OpenCL, then deletes it. Does nothing when there is none.
    void destroy(QOpenGLFunctions_3_3_Core& gl, EvaluationState state);

    void write(QOpenGLFunctions_3_3_Core& gl, const std::vector<QVector3D>& contents) const;
    std::vector<QVector3D> read(QOpenGLFunctions_3_3_Core& gl) const;

    GLuint name() const { return fName; }
    // Null when it is not shared.
    const TopenCLSharedBuffer* shared() const { return fShared; }

private:
    GLuint fName = 0;
    std::size_t fCount = 0;                       // vectors
    const TopenCLSharedBuffer* fShared = nullptr; // the manager's
};

} // namespace viewer
