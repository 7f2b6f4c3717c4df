#include "tools/info/report/Extensions.h"

namespace info {
namespace {

constexpr Extension kExtensions[] = {
    {"cl_khr_gl_sharing", "buffers shared with OpenGL"},
    {"cl_khr_gl_event", "implicit ordering of OpenCL and OpenGL"},
    {"cl_khr_fp64", "double precision"},
};

} // namespace

std::span<const Extension> relevantExtensions()
{
    return kExtensions;
}

} // namespace info
