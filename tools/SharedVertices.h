// A vertex buffer of the renderer that OpenCL shares.
#pragma once

#include <cstddef>
#include <vector>

class QOpenGLExtraFunctions;
struct TopenCLSharedBuffer;

namespace info {

// The buffer at the renderer and its record at the library's manager, both gone with the object.
// The OpenGL context is current during each operation.
class SharedVertices {
public:
    // `floats` is the size.
    SharedVertices(QOpenGLExtraFunctions& gl, std::size_t floats);
    ~SharedVertices();
    SharedVertices(const SharedVertices&) = delete;
    SharedVertices& operator=(const SharedVertices&) = delete;

    // Null when OpenCL refuses the buffer; status() then says why.
    const TopenCLSharedBuffer* record() const { return fRecord; }
    int status() const { return fStatus; }

    // Through OpenGL, the whole buffer. An empty result: OpenGL does not let it be read.
    void write(const std::vector<float>& values);
    std::vector<float> read();

private:
    QOpenGLExtraFunctions& fGL;
    std::size_t fFloats;
    unsigned fName = 0;
    int fStatus = 0;
    const TopenCLSharedBuffer* fRecord = nullptr;
};

} // namespace info
