// The OpenCL extensions that affect the library's decisions.
#pragma once

namespace info {

struct Extension {
    const char* name;
    const char* purpose;
};

inline constexpr Extension kRelevantExtensions[] = {
    {"cl_khr_gl_sharing", "buffers shared with OpenGL"},
    {"cl_khr_gl_event", "implicit ordering of OpenCL and OpenGL"},
    {"cl_khr_fp64", "double precision"},
};

} // namespace info
