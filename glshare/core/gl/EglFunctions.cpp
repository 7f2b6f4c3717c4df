#include "core/gl/EglFunctions.h"

#include "core/gl/LibraryFunctions.h"

namespace glshare {

namespace {

EglFunctions loadEgl()
{
    EglFunctions egl;
    const LibraryFunctions library("libEGL.so.1");
    egl.complete = library.find(egl.getProcAddress, "eglGetProcAddress") &&
                   library.find(egl.bindApi, "eglBindAPI") &&
                   library.find(egl.queryApi, "eglQueryAPI") &&
                   library.find(egl.chooseConfig, "eglChooseConfig") &&
                   library.find(egl.createContext, "eglCreateContext") &&
                   library.find(egl.destroyContext, "eglDestroyContext") &&
                   library.find(egl.getCurrentContext, "eglGetCurrentContext") &&
                   library.find(egl.makeCurrent, "eglMakeCurrent") &&
                   library.find(egl.queryContext, "eglQueryContext") &&
                   library.find(egl.releaseThread, "eglReleaseThread");
    return egl;
}

} // namespace

const EglFunctions& egl()
{
    static const EglFunctions theFunctions = loadEgl();
    return theFunctions;
}

} // namespace glshare
