#include "core/sharing/ContextProperties.h"

#include <algorithm>
#include <cstddef>
#include <utility>

namespace glshare {

namespace {

// The values of the OpenGL properties; 0, the default of each, if the list has none.
struct GlProperties {
    cl_context_properties context = 0;
    cl_context_properties egl = 0;
    cl_context_properties glx = 0;
    cl_context_properties wgl = 0;
    cl_context_properties cgl = 0;

    // Returns null if `name` is not an OpenGL property.
    [[nodiscard]] cl_context_properties* find(cl_context_properties name) noexcept
    {
        switch (name) {
        case CL_GL_CONTEXT_KHR:
            return &context;
        case CL_EGL_DISPLAY_KHR:
            return &egl;
        case CL_GLX_DISPLAY_KHR:
            return &glx;
        case CL_WGL_HDC_KHR:
            return &wgl;
        case CL_CGL_SHAREGROUP_KHR:
            return &cgl;
        default:
            return nullptr;
        }
    }
};

void* pointerOf(cl_context_properties value)
{
    return reinterpret_cast<void*>(value); // NOLINT(performance-no-int-to-ptr)
}

[[nodiscard]] cl_int findGlContext(const GlProperties& gl, std::optional<GlContextHandle>& result)
{
    std::vector<GlContextHandle> given;
    for (const auto& [windowSystem, display] : {std::pair(WindowSystem::kGlx, gl.glx),
                                                {WindowSystem::kEgl, gl.egl},
                                                {WindowSystem::kWgl, gl.wgl}}) {
        if (display != 0)
            given.push_back({windowSystem, pointerOf(display), pointerOf(gl.context)});
    }
    if (given.size() > 1 || gl.cgl != 0 || (!given.empty() && !isSupported(given[0].windowSystem)))
        return CL_INVALID_OPERATION;
    if (gl.context == 0)
        return CL_SUCCESS;
    if (given.empty() || !isShareable(given[0]))
        return CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR;
    result = given[0];
    return CL_SUCCESS;
}

} // namespace

ContextProperties parseProperties(const cl_context_properties* list)
{
    ContextProperties result;
    GlProperties gl;
    std::vector<cl_context_properties> names;
    for (; list != nullptr && *list != 0; list += 2) {
        const cl_context_properties name = list[0];
        const cl_context_properties value = list[1];
        result.original.insert(result.original.end(), {name, value});
        if (std::ranges::find(names, name) != names.end())
            result.error = CL_INVALID_PROPERTY;
        names.push_back(name);
        if (cl_context_properties* glProperty = gl.find(name)) {
            *glProperty = value;
            continue;
        }
        if (name == CL_CONTEXT_PLATFORM)
            result.platform = static_cast<cl_platform_id>(pointerOf(value));
        if (name == CL_CONTEXT_INTEROP_USER_SYNC) {
            result.hasUserSync = value == CL_TRUE;
            if (value != CL_TRUE && value != CL_FALSE)
                result.error = CL_INVALID_PROPERTY;
        }
        result.forRuntime.insert(result.forRuntime.end(), {name, value});
    }
    result.original.push_back(0);
    result.forRuntime.push_back(0);
    if (result.error == CL_SUCCESS)
        result.error = findGlContext(gl, result.glContext);
    return result;
}

} // namespace glshare
