#include "viewer/VertexBuffer.h"

#include "runtime/TopenCLInfo.h"

namespace viewer {
namespace {

GLsizeiptr bytesOf(std::size_t vectors)
{
    return static_cast<GLsizeiptr>(vectors * sizeof(QVector3D));
}

} // namespace

void VertexBuffer::create(QOpenGLFunctions_3_3_Core& gl, const std::vector<QVector3D>& contents)
{
    fCount = contents.size();
    gl.glGenBuffers(1, &fName);
    gl.glBindBuffer(GL_ARRAY_BUFFER, fName);
    gl.glBufferData(GL_ARRAY_BUFFER, bytesOf(fCount), contents.data(), GL_DYNAMIC_DRAW);
}

int VertexBuffer::share()
{
    TopenCLInfo& info = TopenCLInfo::theOne();
    int status = CL_SUCCESS;
    // The deformers replace all of the contents.
    fShared = info.sharedBufferMgr().CreateSharedCLBuffer(info.openCLContext(), CL_MEM_WRITE_ONLY,
                                                          &fName, &status);
    return fShared || status != CL_SUCCESS ? status : CL_INVALID_GL_OBJECT;
}

void VertexBuffer::destroy(QOpenGLFunctions_3_3_Core& gl, EvaluationState state)
{
    if (fShared) {
        TopenCLSharedBufferMgr& manager = TopenCLInfo::theOne().sharedBufferMgr();
        if (state == EvaluationState::kOpen)
            manager.DestroyBatchedSharedCLBuffer(fShared);
        else
            manager.DestroySharedCLBuffer(fShared);
        fShared = nullptr;
    }
    gl.glDeleteBuffers(1, &fName);
    fName = 0;
}

void VertexBuffer::write(QOpenGLFunctions_3_3_Core& gl,
                         const std::vector<QVector3D>& contents) const
{
    gl.glBindBuffer(GL_ARRAY_BUFFER, fName);
    gl.glBufferSubData(GL_ARRAY_BUFFER, 0, bytesOf(fCount), contents.data());
}

std::vector<QVector3D> VertexBuffer::read(QOpenGLFunctions_3_3_Core& gl) const
{
    std::vector<QVector3D> contents(fCount);
    gl.glBindBuffer(GL_ARRAY_BUFFER, fName);
    gl.glGetBufferSubData(GL_ARRAY_BUFFER, 0, bytesOf(fCount), contents.data());
    return contents;
}

} // namespace viewer
