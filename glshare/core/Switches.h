// The environment variables of this program, read once.
#pragma once

namespace glshare {

struct Switches {
    bool glEvent;  // GLSHARE_GL_EVENT: offer cl_khr_gl_event and order commands as it promises
    bool cpuAsGpu; // GLSHARE_CPU_AS_GPU: report CPU devices as GPUs
    bool zeroCopy; // GLSHARE_ZERO_COPY: use a GL buffer's own storage where that is possible
};

// For the shell, before the first question: has every buffer copied, where a runtime does not tell
// when it needs a memory object's storage no more.
void forbidZeroCopy();

// Each switch is on unless its variable is "0". Safe from any thread.
const Switches& switches();

} // namespace glshare
