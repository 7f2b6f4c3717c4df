#include "cases/SharedBuffers.h"

#include "Runtime.h"

GLBuffers::GLBuffers(Runtime& runtime, std::size_t count, std::size_t bytes)
    : fRuntime(runtime), fNames(count)
{
    QOpenGLExtraFunctions& gl = fRuntime.gl();
    gl.glGenBuffers(static_cast<GLsizei>(count), fNames.data());
    for (const unsigned name : fNames) {
        gl.glBindBuffer(GL_ARRAY_BUFFER, name);
        gl.glBufferData(GL_ARRAY_BUFFER, static_cast<GLsizeiptr>(bytes), nullptr, GL_DYNAMIC_DRAW);
    }
    gl.glFinish();
}

GLBuffers::~GLBuffers()
{
    fRuntime.gl().glDeleteBuffers(static_cast<GLsizei>(fNames.size()), fNames.data());
}
