// The OpenGL functions that glshare calls, resolved at run time: nothing links an OpenGL library.
// A process that shares through EGL never loads GLX, and vice versa.
#pragma once

#include <GL/gl.h>
#include <GL/glext.h>

namespace glshare {

struct GlFunctions {
    using Resolver = void* (*)(const char* name);

    // Fills the table; returns false if a function of OpenGL 3.3 and OpenGL ES 3.0 is missing. The
    // functions act on the calling thread's current context.
    [[nodiscard]] bool load(Resolver resolve);

    const GLubyte*(APIENTRYP getString)(GLenum) = nullptr;
    void(APIENTRYP finish)() = nullptr;
    GLenum(APIENTRYP getError)() = nullptr;
    void(APIENTRYP getIntegerv)(GLenum, GLint*) = nullptr;

    PFNGLISBUFFERPROC isBuffer = nullptr;
    PFNGLGENBUFFERSPROC genBuffers = nullptr;
    PFNGLDELETEBUFFERSPROC deleteBuffers = nullptr;
    PFNGLBINDBUFFERPROC bindBuffer = nullptr;
    PFNGLBINDBUFFERBASEPROC bindBufferBase = nullptr;
    PFNGLBUFFERDATAPROC bufferData = nullptr;
    PFNGLBUFFERSUBDATAPROC bufferSubData = nullptr;
    PFNGLGETBUFFERSUBDATAPROC getBufferSubData = nullptr; // null in OpenGL ES
    PFNGLCOPYBUFFERSUBDATAPROC copyBufferSubData = nullptr;
    PFNGLGETBUFFERPARAMETERI64VPROC getBufferParameteri64v = nullptr;
    PFNGLMAPBUFFERRANGEPROC mapBufferRange = nullptr;
    PFNGLUNMAPBUFFERPROC unmapBuffer = nullptr;

    PFNGLFENCESYNCPROC fenceSync = nullptr;
    PFNGLDELETESYNCPROC deleteSync = nullptr;
    PFNGLISSYNCPROC isSync = nullptr;
    PFNGLCLIENTWAITSYNCPROC clientWaitSync = nullptr;

    PFNGLCREATESHADERPROC createShader = nullptr;
    PFNGLDELETESHADERPROC deleteShader = nullptr;
    PFNGLSHADERSOURCEPROC shaderSource = nullptr;
    PFNGLCOMPILESHADERPROC compileShader = nullptr;
    PFNGLCREATEPROGRAMPROC createProgram = nullptr;
    PFNGLDELETEPROGRAMPROC deleteProgram = nullptr;
    PFNGLATTACHSHADERPROC attachShader = nullptr;
    PFNGLTRANSFORMFEEDBACKVARYINGSPROC transformFeedbackVaryings = nullptr;
    PFNGLLINKPROGRAMPROC linkProgram = nullptr;
    PFNGLGETPROGRAMIVPROC getProgramiv = nullptr;
    PFNGLUSEPROGRAMPROC useProgram = nullptr;
    PFNGLGENTRANSFORMFEEDBACKSPROC genTransformFeedbacks = nullptr;
    PFNGLDELETETRANSFORMFEEDBACKSPROC deleteTransformFeedbacks = nullptr;
    PFNGLBINDTRANSFORMFEEDBACKPROC bindTransformFeedback = nullptr;
    PFNGLBEGINTRANSFORMFEEDBACKPROC beginTransformFeedback = nullptr;
    PFNGLENDTRANSFORMFEEDBACKPROC endTransformFeedback = nullptr;
};

} // namespace glshare
