// Implements the functions of EntryPoints.h that make and describe memory objects.
#include "core/Answer.h"
#include "core/BufferCreation.h"
#include "core/Devices.h"
#include "core/Registry.h"
#include "entry/EntryPoints.h"

namespace glshare::entry {

namespace {

// Textures and renderbuffers are not offered: to this program none of them is an object to share.
template <typename PassDown>
cl_mem refuse(cl_context context, cl_int* error, PassDown passDown)
{
    if (Registry::get().find(context) != nullptr) {
        setError(error, CL_INVALID_GL_OBJECT);
        return nullptr;
    }
    if (runtimeShares(context))
        return passDown();
    setError(error, CL_INVALID_CONTEXT);
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
    return refuse(context, error, [&] {
        return runtime().clCreateFromGLTexture(context, flags, target, level, texture, error);
    });
}

cl_mem CL_API_CALL createFromGlTexture2D(cl_context context, cl_mem_flags flags, cl_GLenum target,
                                         cl_GLint level, cl_GLuint texture, cl_int* error)
{
    return refuse(context, error, [&] {
        return runtime().clCreateFromGLTexture2D(context, flags, target, level, texture, error);
    });
}

cl_mem CL_API_CALL createFromGlTexture3D(cl_context context, cl_mem_flags flags, cl_GLenum target,
                                         cl_GLint level, cl_GLuint texture, cl_int* error)
{
    return refuse(context, error, [&] {
        return runtime().clCreateFromGLTexture3D(context, flags, target, level, texture, error);
    });
}

cl_mem CL_API_CALL createFromGlRenderbuffer(cl_context context, cl_mem_flags flags,
                                            cl_GLuint renderbuffer, cl_int* error)
{
    return refuse(context, error, [&] {
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

// How the memory is provided is nobody's business: the application sees the flags it gave.
cl_int CL_API_CALL getMemObjectInfo(cl_mem memory, cl_mem_info name, std::size_t size, void* value,
                                    std::size_t* sizeNeeded)
{
    if (name == CL_MEM_FLAGS || name == CL_MEM_HOST_PTR) {
        if (const auto buffer = Registry::get().find(memory)) {
            const Query query{size, value, sizeNeeded};
            return name == CL_MEM_FLAGS ? answerWith(buffer->flags, query)
                                        : answerWith<void*>(nullptr, query);
        }
    }
    return runtime().clGetMemObjectInfo(memory, name, size, value, sizeNeeded);
}

} // namespace glshare::entry
