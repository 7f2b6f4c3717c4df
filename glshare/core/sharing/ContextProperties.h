// The property list of an OpenCL context, taken apart.
#pragma once

#include "core/api/OpenCl.h"
#include "core/gl/GlContext.h"

#include <optional>
#include <vector>

namespace glshare {

struct ContextProperties {
    // CL_SUCCESS, or why the list cannot be used; then the rest is incomplete.
    cl_int error = CL_SUCCESS;
    std::vector<cl_context_properties> original;   // as given, ending in 0
    std::vector<cl_context_properties> forRuntime; // without the OpenGL entries, ending in 0
    cl_platform_id platform = nullptr;             // as given, may be null
    bool userSynchronises = false;                 // CL_CONTEXT_INTEROP_USER_SYNC
    // The OpenGL context to share with; empty if the list names none.
    std::optional<GlBinding> binding;
};

// `list` may be null.
[[nodiscard]] ContextProperties parseProperties(const cl_context_properties* list);

} // namespace glshare
