// Implements the functions of EntryPoints.h that make and describe memory objects.
#include "core/api/Answer.h"
#include "core/api/Devices.h"
#include "core/sharing/BufferCreation.h"
#include "core/sharing/Registry.h"
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

// The arguments of the functions that make images.
struct ImageRequest {
    cl_context context;
    cl_mem_flags flags;
    bool isTarget = true;
    cl_GLint level = 0;
};

// Textures and renderbuffers are not offered: no name is that of an object to share. The other
// arguments are checked first.
cl_int errorOf(const ImageRequest& request)
{
    if (Registry::get().find(request.context) == nullptr)
        return CL_INVALID_CONTEXT;
    if (!areSharingFlags(request.flags) || !request.isTarget)
        return CL_INVALID_VALUE;
    return request.level < 0 ? CL_INVALID_MIP_LEVEL : CL_INVALID_GL_OBJECT;
}

template <typename PassDown>
cl_mem refuse(const ImageRequest& request, cl_int* error, PassDown passDown)
{
    const cl_int reason = errorOf(request);
    if (reason == CL_INVALID_CONTEXT && runtimeShares(request.context))
        return passDown();
    setError(error, reason);
    return nullptr;
}

// Of an object that is not ours: what the runtime says, if it knows OpenGL objects at all.
template <typename PassDown>
cl_int askRuntime(cl_mem memory, PassDown passDown)
{
    cl_context context = nullptr;
    if (memory == nullptr ||
        runtime().clGetMemObjectInfo(memory, CL_MEM_CONTEXT, sizeof(cl_context), &context,
                                     nullptr) != CL_SUCCESS)
        return CL_INVALID_MEM_OBJECT;
    return runtimeShares(context) ? passDown() : CL_INVALID_GL_OBJECT;
}

} // namespace

cl_mem CL_API_CALL createFromGlBuffer(cl_context context, cl_mem_flags flags, cl_GLuint name,
                                      cl_int* error)
{
    const auto sharing = Registry::get().find(context);
    if (sharing == nullptr) {
        if (runtimeShares(context))
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
    return refuse({context, flags, isAnyDimension(target), level}, error, [&] {
        return runtime().clCreateFromGLTexture(context, flags, target, level, texture, error);
    });
}

cl_mem CL_API_CALL createFromGlTexture2D(cl_context context, cl_mem_flags flags, cl_GLenum target,
                                         cl_GLint level, cl_GLuint texture, cl_int* error)
{
    return refuse({context, flags, is2D(target), level}, error, [&] {
        return runtime().clCreateFromGLTexture2D(context, flags, target, level, texture, error);
    });
}

cl_mem CL_API_CALL createFromGlTexture3D(cl_context context, cl_mem_flags flags, cl_GLenum target,
                                         cl_GLint level, cl_GLuint texture, cl_int* error)
{
    return refuse({context, flags, is3D(target), level}, error, [&] {
        return runtime().clCreateFromGLTexture3D(context, flags, target, level, texture, error);
    });
}

cl_mem CL_API_CALL createFromGlRenderbuffer(cl_context context, cl_mem_flags flags,
                                            cl_GLuint renderbuffer, cl_int* error)
{
    return refuse({context, flags}, error, [&] {
        return runtime().clCreateFromGLRenderbuffer(context, flags, renderbuffer, error);
    });
}

cl_int CL_API_CALL getGlObjectInfo(cl_mem memory, cl_gl_object_type* type, cl_GLuint* name)
{
    const auto buffer = Registry::get().find(memory);
    if (buffer == nullptr)
        return askRuntime(memory, [&] { return runtime().clGetGLObjectInfo(memory, type, name); });
    if (type != nullptr)
        *type = CL_GL_OBJECT_BUFFER;
    if (name != nullptr)
        *name = buffer->name;
    return CL_SUCCESS;
}

cl_int CL_API_CALL getGlTextureInfo(cl_mem memory, cl_gl_texture_info name, std::size_t size,
                                    void* value, std::size_t* sizeNeeded)
{
    if (Registry::get().find(memory) != nullptr)
        return CL_INVALID_GL_OBJECT;
    return askRuntime(memory, [&] {
        return runtime().clGetGLTextureInfo(memory, name, size, value, sizeNeeded);
    });
}

namespace {

// Returns the shared buffer that a memory object is, or is a part or an image of; null if there is
// none.
std::shared_ptr<SharedBuffer> findWhole(cl_mem memory)
{
    std::shared_ptr<SharedBuffer> buffer;
    while (memory != nullptr && (buffer = Registry::get().find(memory)) == nullptr) {
        cl_mem whole = nullptr;
        runtime().clGetMemObjectInfo(memory, CL_MEM_ASSOCIATED_MEMOBJECT, sizeof(cl_mem),
                                     static_cast<void*>(&whole), nullptr);
        memory = whole;
    }
    return buffer;
}

// Returns the flags that the application has given, without those for the memory of `whole`.
cl_mem_flags shownFlags(cl_mem memory, const SharedBuffer& whole)
{
    if (memory == whole.memory)
        return whole.flags;
    cl_mem_flags flags = 0;
    runtime().clGetMemObjectInfo(memory, CL_MEM_FLAGS, sizeof flags, &flags, nullptr);
    return flags & ~cl_mem_flags{CL_MEM_USE_HOST_PTR | CL_MEM_ALLOC_HOST_PTR};
}

} // namespace

cl_int CL_API_CALL getMemObjectInfo(cl_mem memory, cl_mem_info name, std::size_t size, void* value,
                                    std::size_t* sizeNeeded)
{
    if (name == CL_MEM_FLAGS || name == CL_MEM_HOST_PTR) {
        if (const auto whole = findWhole(memory)) {
            const Query query{size, value, sizeNeeded};
            return name == CL_MEM_FLAGS ? answerWith(shownFlags(memory, *whole), query)
                                        : answerWith<void*>(nullptr, query);
        }
    }
    return runtime().clGetMemObjectInfo(memory, name, size, value, sizeNeeded);
}

} // namespace glshare::entry
