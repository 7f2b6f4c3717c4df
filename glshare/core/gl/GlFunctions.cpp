#include "core/gl/GlFunctions.h"

namespace glshare {

namespace {

template <typename Function>
bool resolveInto(Function& function, GlFunctions::Resolver resolve, const char* name)
{
    function = reinterpret_cast<Function>(resolve(name));
    return function != nullptr;
}

} // namespace

bool GlFunctions::load(Resolver resolve)
{
    const auto found = [resolve](auto& function, const char* name) {
        return resolveInto(function, resolve, name);
    };
    static_cast<void>(found(getBufferSubData, "glGetBufferSubData")); // missing in OpenGL ES
    return found(getString, "glGetString") && found(finish, "glFinish") &&
           found(getError, "glGetError") && found(getIntegerv, "glGetIntegerv") &&
           found(isBuffer, "glIsBuffer") && found(genBuffers, "glGenBuffers") &&
           found(deleteBuffers, "glDeleteBuffers") && found(bindBuffer, "glBindBuffer") &&
           found(bindBufferBase, "glBindBufferBase") && found(bufferData, "glBufferData") &&
           found(bufferSubData, "glBufferSubData") &&
           found(copyBufferSubData, "glCopyBufferSubData") &&
           found(getBufferParameteri64v, "glGetBufferParameteri64v") &&
           found(mapBufferRange, "glMapBufferRange") && found(unmapBuffer, "glUnmapBuffer") &&
           found(fenceSync, "glFenceSync") && found(isSync, "glIsSync") &&
           found(deleteSync, "glDeleteSync") && found(clientWaitSync, "glClientWaitSync") &&
           found(createShader, "glCreateShader") && found(deleteShader, "glDeleteShader") &&
           found(shaderSource, "glShaderSource") && found(compileShader, "glCompileShader") &&
           found(createProgram, "glCreateProgram") && found(deleteProgram, "glDeleteProgram") &&
           found(attachShader, "glAttachShader") &&
           found(transformFeedbackVaryings, "glTransformFeedbackVaryings") &&
           found(linkProgram, "glLinkProgram") && found(getProgramiv, "glGetProgramiv") &&
           found(useProgram, "glUseProgram") &&
           found(genTransformFeedbacks, "glGenTransformFeedbacks") &&
           found(deleteTransformFeedbacks, "glDeleteTransformFeedbacks") &&
           found(bindTransformFeedback, "glBindTransformFeedback") &&
           found(beginTransformFeedback, "glBeginTransformFeedback") &&
           found(endTransformFeedback, "glEndTransformFeedback");
}

} // namespace glshare
