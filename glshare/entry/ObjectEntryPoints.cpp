// Implements the functions of EntryPoints.h that create and query memory objects.
#include "core/api/Arguments.h"
#include "core/api/Devices.h"
#include "core/sharing/BufferCreation.h"
#include "core/sharing/ObjectRegistry.h"
#include "entry/EntryPoints.h"

#include <GL/gl.h>
#include <GL/glext.h>

#include <memory>

namespace glshare::entry {

namespace {

constexpr bool isCubeFace(cl_GLenum target)
{
    return target >= GL_TEXTURE_CUBE_MAP_POSITIVE_X && target <= GL_TEXTURE_CUBE_MAP_NEGATIVE_Z;
}

constexpr bool is2D(cl_GLenum target)
{
    return target == GL_TEXTURE_2D || target == GL_TEXTURE_RECTANGLE || isCubeFace(target);
}

constexpr bool is3D(cl_GLenum target)
{
    return target == GL_TEXTURE_3D;
}

constexpr bool isAnyDimension(cl_GLenum target)
{
    return target == GL_TEXTURE_1D || target == GL_TEXTURE_1D_ARRAY ||
           target == GL_TEXTURE_BUFFER || is2D(target) || target == GL_TEXTURE_2D_ARRAY ||
           is3D(target);
}

// The arguments of the functions that create images.
struct ImageRequest {
    cl_context context;
    cl_mem_flags flags;
    bool isValidTarget = true;
    cl_GLint level = 0;
};

// Returns the error for an image. Textures and renderbuffers are not supported, so every name is
// invalid; the other arguments are checked first.
[[nodiscard]] cl_int imageError(const ImageRequest& request)
{
    if (ObjectRegistry::get().find(request.context) == nullptr)
        return CL_INVALID_CONTEXT;
    if (!areValidSharingFlags(request.flags) || !request.isValidTarget)
        return CL_INVALID_VALUE;
    return request.level < 0 ? CL_INVALID_MIP_LEVEL : CL_INVALID_GL_OBJECT;
}

template <typename CallRuntime>
[[nodiscard]] cl_mem rejectImage(const ImageRequest& request, cl_int* error,
                                 CallRuntime callRuntime)
{
    const cl_int reason = imageError(request);
    if (reason == CL_INVALID_CONTEXT && runtimeSharesNatively(request.context))
        return callRuntime();
    setError(error, reason);
    return nullptr;
}

// Calls the runtime for a memory object without a record, if the runtime shares natively; otherwise
// returns an error.
template <typename CallRuntime>
[[nodiscard]] cl_int callNativeRuntime(cl_mem memory, CallRuntime callRuntime)
{
    cl_context context = nullptr;
    if (memory == nullptr ||
        runtime().clGetMemObjectInfo(memory, CL_MEM_CONTEXT, sizeof(cl_context), &context,
                                     nullptr) != CL_SUCCESS)
        return CL_INVALID_MEM_OBJECT;
    return runtimeSharesNatively(context) ? callRuntime() : CL_INVALID_GL_OBJECT;
}

} // namespace

cl_mem CL_API_CALL createFromGlBuffer(cl_context context, cl_mem_flags flags, cl_GLuint name,
                                      cl_int* error)
{
    const auto sharing = ObjectRegistry::get().find(context);
    if (sharing == nullptr) {
        if (runtimeSharesNatively(context))
            return runtime().clCreateFromGLBuffer(context, flags, name, error);
        setError(error, CL_INVALID_CONTEXT);
        return nullptr;
    }
    cl_int result = CL_SUCCESS;
    cl_mem memory = createSharedBuffer(context, sharing, flags, name, result);
    setError(error, result);
    return memory;
}

cl_mem CL_API_CALL createFromGlTexture(cl_context context, cl_mem_flags flags, cl_GLenum target,
                                       cl_GLint level, cl_GLuint texture, cl_int* error)
{
    return rejectImage({context, flags, isAnyDimension(target), level}, error, [&] {
        return runtime().clCreateFromGLTexture(context, flags, target, level, texture, error);
    });
}

cl_mem CL_API_CALL createFromGlTexture2D(cl_context context, cl_mem_flags flags, cl_GLenum target,
                                         cl_GLint level, cl_GLuint texture, cl_int* error)
{
    return rejectImage({context, flags, is2D(target), level}, error, [&] {
        return runtime().clCreateFromGLTexture2D(context, flags, target, level, texture, error);
    });
}

cl_mem CL_API_CALL createFromGlTexture3D(cl_context context, cl_mem_flags flags, cl_GLenum target,
                                         cl_GLint level, cl_GLuint texture, cl_int* error)
{
    return rejectImage({context, flags, is3D(target), level}, error, [&] {
        return runtime().clCreateFromGLTexture3D(context, flags, target, level, texture, error);
    });
}

cl_mem CL_API_CALL createFromGlRenderbuffer(cl_context context, cl_mem_flags flags,
                                            cl_GLuint renderbuffer, cl_int* error)
{
    return rejectImage({context, flags}, error, [&] {
        return runtime().clCreateFromGLRenderbuffer(context, flags, renderbuffer, error);
    });
}

cl_int CL_API_CALL getGlObjectInfo(cl_mem memory, cl_gl_object_type* type, cl_GLuint* name)
{
    const auto buffer = ObjectRegistry::get().find(memory);
    if (buffer == nullptr)
        return callNativeRuntime(memory,
                                 [&] { return runtime().clGetGLObjectInfo(memory, type, name); });
    if (type != nullptr)
        *type = CL_GL_OBJECT_BUFFER;
    if (name != nullptr)
        *name = buffer->name;
    return CL_SUCCESS;
}

cl_int CL_API_CALL getGlTextureInfo(cl_mem memory, cl_gl_texture_info name, std::size_t size,
                                    void* value, std::size_t* sizeNeeded)
{
    if (ObjectRegistry::get().find(memory) != nullptr)
        return CL_INVALID_GL_OBJECT;
    return callNativeRuntime(memory, [&] {
        return runtime().clGetGLTextureInfo(memory, name, size, value, sizeNeeded);
    });
}

namespace {

// Returns the shared buffer that a memory object is, or was created from as a sub-buffer or image;
// null if there is none.
[[nodiscard]] std::shared_ptr<SharedBuffer> findParentBuffer(cl_mem memory)
{
    std::shared_ptr<SharedBuffer> buffer;
    while (memory != nullptr && (buffer = ObjectRegistry::get().find(memory)) == nullptr) {
        cl_mem parent = nullptr;
        runtime().clGetMemObjectInfo(memory, CL_MEM_ASSOCIATED_MEMOBJECT, sizeof(cl_mem),
                                     static_cast<void*>(&parent), nullptr);
        memory = parent;
    }
    return buffer;
}

// Returns the flags that the application has passed, without those that glshare adds.
cl_mem_flags reportedFlags(cl_mem memory, const SharedBuffer& buffer)
{
    if (memory == buffer.memory)
        return buffer.flags;
    cl_mem_flags flags = 0;
    runtime().clGetMemObjectInfo(memory, CL_MEM_FLAGS, sizeof flags, &flags, nullptr);
    return flags & ~cl_mem_flags{CL_MEM_USE_HOST_PTR | CL_MEM_ALLOC_HOST_PTR};
}

} // namespace

cl_int CL_API_CALL getMemObjectInfo(cl_mem memory, cl_mem_info name, std::size_t size, void* value,
                                    std::size_t* sizeNeeded)
{
    if (name == CL_MEM_FLAGS || name == CL_MEM_HOST_PTR) {
        if (const auto buffer = findParentBuffer(memory)) {
            const InfoOutput output{size, value, sizeNeeded};
            return name == CL_MEM_FLAGS ? writeInfoValue(reportedFlags(memory, *buffer), output)
                                        : writeInfoValue<void*>(nullptr, output);
        }
    }
    return runtime().clGetMemObjectInfo(memory, name, size, value, sizeNeeded);
}

} // namespace glshare::entry
