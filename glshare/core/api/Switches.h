// The environment variables of this program, read once.
#pragma once

namespace glshare {

struct Switches {
    bool glEvent;  // GLSHARE_GL_EVENT: offer cl_khr_gl_event and order commands as it promises
    bool cpuAsGpu; // GLSHARE_CPU_AS_GPU: report CPU devices as GPUs
    // GLSHARE_ZERO_COPY: use a GL buffer's own storage where that is possible. The application
    // promises to leave a buffer alone in OpenGL while an object is created from it.
    bool zeroCopy;
};

// For the shell, before the first question: no memory object lies over memory that is not the
// runtime's, where a runtime does not report when it needs that no more.
void forbidHostMemory();
[[nodiscard]] bool isHostMemoryAllowed();

// The first two are on unless their variable is "0"; zero copy is on if its variable is "1". Safe
// from any thread.
const Switches& switches();

} // namespace glshare
