// The parsed property list of an OpenCL context.
#pragma once

#include "core/api/OpenCl.h"
#include "core/gl/GlContext.h"

#include <optional>
#include <vector>

namespace glshare {

struct ContextProperties {
    // CL_SUCCESS, or the error of the list; the other fields are then incomplete.
    cl_int error = CL_SUCCESS;
    std::vector<cl_context_properties> original;   // as passed, ending in 0
    std::vector<cl_context_properties> forRuntime; // without the OpenGL properties, ending in 0
    cl_platform_id platform = nullptr;             // as passed, may be null
    bool hasUserSync = false;                      // CL_CONTEXT_INTEROP_USER_SYNC
    // The OpenGL context to share with; empty if the list has none.
    std::optional<GlContextHandle> glContext;
};

// `list` may be null.
[[nodiscard]] ContextProperties parseProperties(const cl_context_properties* list);

} // namespace glshare
