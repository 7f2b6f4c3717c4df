#include "core/sharing/BufferCreation.h"

#include "core/api/Settings.h"
#include "core/sharing/ObjectRegistry.h"
#include "core/worker/ProcessHooks.h"

namespace glshare {

namespace {

// Allocates at least `size` bytes, not initialised. Throws std::bad_alloc.
[[nodiscard]] HostMemory allocateHostMemory(std::size_t size)
{
    constexpr std::size_t kCacheLine = 64; // devices may access whole lines
    const std::size_t padded = (size + kCacheLine - 1) / kCacheLine * kCacheLine;
    return HostMemory(::operator new(padded, kHostMemoryAlignment));
}

// Sets the size and, if requested and possible, pins the storage. Returns false if there is no such
// buffer or it has no storage.
bool initializeFromGl(SharedBuffer& buffer, GlBufferAccess& gl, bool inPlace)
{
    buffer.size = gl.bufferSize(buffer.name).value_or(0);
    if (buffer.size == 0)
        return false;
    if (inPlace)
        buffer.storage = PinnedStorage(buffer.context, gl, buffer.name, buffer.size);
    return true;
}

// The runtime calls this on any thread, when it destroys the memory object.
void CL_CALLBACK onDestroyed(cl_mem memory, void* /*user*/)
{
    if (!isForkedChild())
        ObjectRegistry::get().remove(memory);
}

// Creates the memory object on the pinned storage, on own host memory if the devices use that in
// place, or on memory that the runtime allocates.
[[nodiscard]] cl_mem createMemory(cl_context handle, SharedBuffer& buffer, bool inHostMemory,
                                  cl_int& error)
{
    void* address = buffer.storage.address();
    if (address == nullptr && inHostMemory) {
        buffer.ownMemory = allocateHostMemory(buffer.size);
        address = buffer.ownMemory.get();
    }
    const cl_mem_flags where = address != nullptr ? CL_MEM_USE_HOST_PTR : CL_MEM_ALLOC_HOST_PTR;
    return runtime().clCreateBuffer(handle, buffer.flags | where, buffer.size, address, &error);
}

} // namespace

bool areValidSharingFlags(cl_mem_flags flags) noexcept
{
    return flags == 0 || flags == CL_MEM_READ_WRITE || flags == CL_MEM_READ_ONLY ||
           flags == CL_MEM_WRITE_ONLY;
}

cl_mem createSharedBuffer(cl_context handle, const std::shared_ptr<SharingContext>& context,
                          cl_mem_flags flags, cl_GLuint name, cl_int& error)
{
    if (!areValidSharingFlags(flags)) {
        error = CL_INVALID_VALUE;
        return nullptr;
    }
    auto buffer = std::make_shared<SharedBuffer>();
    buffer->context = context;
    buffer->name = name;
    buffer->flags = flags == 0 ? cl_mem_flags{CL_MEM_READ_WRITE} : flags;

    const bool inHostMemory = context->canUseHostMemory() && isHostMemoryAllowed();
    const bool inPlace = inHostMemory && settings().zeroCopy;
    bool isBuffer = false;
    context->worker().call([&](GlBufferAccess* gl) {
        isBuffer = gl != nullptr && initializeFromGl(*buffer, *gl, inPlace);
    });
    if (!isBuffer) {
        error = CL_INVALID_GL_OBJECT;
        return nullptr;
    }

    buffer->memory = createMemory(handle, *buffer, inHostMemory, error);
    if (buffer->memory == nullptr)
        return nullptr;
    cl_mem memory = buffer->memory;
    try {
        ObjectRegistry::get().add(handle, buffer);
    } catch (...) {
        runtime().clReleaseMemObject(memory); // the only reference
        throw;
    }
    error = runtime().clSetMemObjectDestructorCallback(memory, onDestroyed, nullptr);
    if (error == CL_SUCCESS)
        return memory;
    onDestroyed(memory, nullptr);
    runtime().clReleaseMemObject(memory); // the only reference
    return nullptr;
}

} // namespace glshare
