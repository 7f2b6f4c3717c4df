#include "Renderer.h"

#include <GL/gl.h>
#include <GL/glext.h>
#include <algorithm>

unsigned Renderer::makeBuffer(const std::vector<float>& values)
{
    unsigned name = 0;
    reinterpret_cast<PFNGLGENBUFFERSPROC>(function("glGenBuffers"))(1, &name);
    reinterpret_cast<PFNGLBINDBUFFERPROC>(function("glBindBuffer"))(GL_ARRAY_BUFFER, name);
    reinterpret_cast<PFNGLBUFFERDATAPROC>(function("glBufferData"))(
        GL_ARRAY_BUFFER, static_cast<GLsizeiptr>(values.size() * sizeof(float)), values.data(),
        GL_DYNAMIC_DRAW);
    return name;
}

void Renderer::writeBuffer(unsigned name, const std::vector<float>& values)
{
    reinterpret_cast<PFNGLBINDBUFFERPROC>(function("glBindBuffer"))(GL_ARRAY_BUFFER, name);
    reinterpret_cast<PFNGLBUFFERSUBDATAPROC>(function("glBufferSubData"))(
        GL_ARRAY_BUFFER, 0, static_cast<GLsizeiptr>(values.size() * sizeof(float)), values.data());
}

std::vector<float> Renderer::readBuffer(unsigned name, std::size_t count)
{
    std::vector<float> values(count);
    reinterpret_cast<PFNGLBINDBUFFERPROC>(function("glBindBuffer"))(GL_ARRAY_BUFFER, name);
    const void* mapped = reinterpret_cast<PFNGLMAPBUFFERRANGEPROC>(function("glMapBufferRange"))(
        GL_ARRAY_BUFFER, 0, static_cast<GLsizeiptr>(count * sizeof(float)), GL_MAP_READ_BIT);
    if (mapped) {
        std::copy_n(static_cast<const float*>(mapped), count, values.begin());
        reinterpret_cast<PFNGLUNMAPBUFFERPROC>(function("glUnmapBuffer"))(GL_ARRAY_BUFFER);
    }
    return values;
}

void Renderer::deleteBuffer(unsigned name)
{
    reinterpret_cast<PFNGLDELETEBUFFERSPROC>(function("glDeleteBuffers"))(1, &name);
}

void Renderer::finish()
{
    reinterpret_cast<void(APIENTRYP)()>(function("glFinish"))();
}

void Renderer::flush()
{
    reinterpret_cast<void(APIENTRYP)()>(function("glFlush"))();
}
