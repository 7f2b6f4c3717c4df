#include "tools/SharedVertices.h"

#include "runtime/TopenCLInfo.h"

#include <QOpenGLExtraFunctions>

namespace info {

SharedVertices::SharedVertices(QOpenGLExtraFunctions& gl, std::size_t floats)
    : fGL(gl), fFloats(floats)
{
    fGL.glGenBuffers(1, &fName);
    write(std::vector<float>(floats));
    TopenCLInfo& library = TopenCLInfo::theOne();
    fRecord = library.sharedBufferMgr().CreateSharedCLBuffer(library.openCLContext(),
                                                             CL_MEM_READ_WRITE, &fName, &fStatus);
}

SharedVertices::~SharedVertices()
{
    if (fRecord)
        TopenCLInfo::theOne().sharedBufferMgr().DestroySharedCLBuffer(fRecord);
    fGL.glDeleteBuffers(1, &fName);
}

void SharedVertices::write(const std::vector<float>& values)
{
    const auto bytes = static_cast<GLsizeiptr>(values.size() * sizeof(float));
    fGL.glBindBuffer(GL_ARRAY_BUFFER, fName);
    // Storage is made once: OpenCL knows the buffer by it.
    if (fRecord)
        fGL.glBufferSubData(GL_ARRAY_BUFFER, 0, bytes, values.data());
    else
        fGL.glBufferData(GL_ARRAY_BUFFER, bytes, values.data(), GL_DYNAMIC_DRAW);
}

std::vector<float> SharedVertices::read()
{
    const auto bytes = static_cast<GLsizeiptr>(fFloats * sizeof(float));
    fGL.glBindBuffer(GL_ARRAY_BUFFER, fName);
    const auto* mapped =
        static_cast<const float*>(fGL.glMapBufferRange(GL_ARRAY_BUFFER, 0, bytes, GL_MAP_READ_BIT));
    if (!mapped)
        return {};
    std::vector<float> values(mapped, mapped + fFloats);
    fGL.glUnmapBuffer(GL_ARRAY_BUFFER);
    return values;
}

} // namespace info
