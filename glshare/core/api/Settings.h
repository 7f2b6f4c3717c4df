// The settings, which come from environment variables and are read once.
#pragma once

namespace glshare {

struct Settings {
    bool glEvent;  // offer cl_khr_gl_event and synchronise as it requires; off if "0"
    bool cpuAsGpu; // report CPU devices as GPUs; off if "0"
    // Use the storage of OpenGL buffers in place if possible; on if "1". The application must then
    // not use a buffer in OpenGL while a memory object is created from it.
    bool zeroCopy;
};

// Any thread.
[[nodiscard]] const Settings& settings();

// Disables CL_MEM_USE_HOST_PTR, for a runtime that does not report the destruction of memory
// objects. Called before the application's first OpenCL call.
void forbidHostMemory() noexcept;
[[nodiscard]] bool isHostMemoryAllowed() noexcept;

} // namespace glshare
