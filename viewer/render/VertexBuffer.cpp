#include "viewer/render/VertexBuffer.h"

namespace viewer {
namespace {

GLsizeiptr bytesOf(std::size_t vectors)
{
    return static_cast<GLsizeiptr>(vectors * sizeof(vyra::Vector3));
}

} // namespace

void VertexBuffer::create(QOpenGLFunctions_3_3_Core& gl, const std::vector<vyra::Vector3>& contents)
{
    fCount = contents.size();
    gl.glGenBuffers(1, &fName);
    gl.glBindBuffer(GL_ARRAY_BUFFER, fName);
    gl.glBufferData(GL_ARRAY_BUFFER, bytesOf(fCount), contents.data(), GL_DYNAMIC_DRAW);
}

void VertexBuffer::destroy(QOpenGLFunctions_3_3_Core& gl)
{
    gl.glDeleteBuffers(1, &fName);
    fName = 0;
}

void VertexBuffer::write(QOpenGLFunctions_3_3_Core& gl,
                         const std::vector<vyra::Vector3>& contents) const
{
    gl.glBindBuffer(GL_ARRAY_BUFFER, fName);
    gl.glBufferSubData(GL_ARRAY_BUFFER, 0, bytesOf(fCount), contents.data());
}

std::vector<vyra::Vector3> VertexBuffer::read(QOpenGLFunctions_3_3_Core& gl) const
{
    std::vector<vyra::Vector3> contents(fCount);
    gl.glBindBuffer(GL_ARRAY_BUFFER, fName);
    gl.glGetBufferSubData(GL_ARRAY_BUFFER, 0, bytesOf(fCount), contents.data());
    return contents;
}

} // namespace viewer
