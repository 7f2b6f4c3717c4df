#include "tools/info/selftest/RendererVertices.h"

#include <QOpenGLExtraFunctions>

namespace info {
namespace {

GLsizeiptr bytesOf(std::size_t vertexCount)
{
    return static_cast<GLsizeiptr>(vertexCount * sizeof(vyra::Vector3));
}

} // namespace

RendererVertices::RendererVertices(QOpenGLExtraFunctions& gl, std::size_t vertexCount)
    : fGL(gl), fCount(vertexCount)
{
    fGL.glGenBuffers(1, &fName);
    fGL.glBindBuffer(GL_ARRAY_BUFFER, fName);
    fGL.glBufferData(GL_ARRAY_BUFFER, bytesOf(fCount), nullptr, GL_DYNAMIC_DRAW);
}

RendererVertices::~RendererVertices()
{
    fGL.glDeleteBuffers(1, &fName);
}

void RendererVertices::write(const std::vector<vyra::Vector3>& values)
{
    fGL.glBindBuffer(GL_ARRAY_BUFFER, fName);
    fGL.glBufferSubData(GL_ARRAY_BUFFER, 0, bytesOf(values.size()), values.data());
}

std::vector<vyra::Vector3> RendererVertices::read()
{
    fGL.glBindBuffer(GL_ARRAY_BUFFER, fName);
    const auto* mapped = static_cast<const vyra::Vector3*>(
        fGL.glMapBufferRange(GL_ARRAY_BUFFER, 0, bytesOf(fCount), GL_MAP_READ_BIT));
    if (!mapped)
        return {};
    std::vector<vyra::Vector3> values(mapped, mapped + fCount);
    fGL.glUnmapBuffer(GL_ARRAY_BUFFER);
    return values;
}

} // namespace info
