#include "core/sharing/BufferCreation.h"

#include "core/api/Switches.h"
#include "core/sharing/Registry.h"
#include "core/worker/Fork.h"

namespace glshare {

namespace {

// Fills in the size and, if it is to be used in place and can be, the storage. False if there is no
// such buffer, or one without storage.
bool describe(SharedBuffer& buffer, GlDevice& device, bool inPlace)
{
    buffer.size = device.bufferSize(buffer.name).value_or(0);
    if (buffer.size == 0)
        return false;
    if (inPlace)
        buffer.storage = PinnedStorage(buffer.context, device, buffer.name, buffer.size);
    return true;
}

// The runtime calls this when nothing uses the memory object any more, on any thread.
void CL_CALLBACK onDestroyed(cl_mem memory, void* /*user*/)
{
    if (!isForkedChild())
        Registry::get().remove(memory);
}

// Over the OpenGL storage, over memory of our own where the devices work in it, or else wherever
// the runtime puts it.
cl_mem createMemory(cl_context handle, SharedBuffer& buffer, bool inHostMemory, cl_int& error)
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

bool areSharingFlags(cl_mem_flags flags)
{
    return flags == 0 || flags == CL_MEM_READ_WRITE || flags == CL_MEM_READ_ONLY ||
           flags == CL_MEM_WRITE_ONLY;
}

cl_mem createSharedBuffer(cl_context handle, const std::shared_ptr<SharingContext>& context,
                          cl_mem_flags flags, cl_GLuint name, cl_int& error)
{
    if (!areSharingFlags(flags)) {
        error = CL_INVALID_VALUE;
        return nullptr;
    }
    auto buffer = std::make_shared<SharedBuffer>();
    buffer->context = context;
    buffer->name = name;
    buffer->flags = flags == 0 ? cl_mem_flags{CL_MEM_READ_WRITE} : flags;

    const bool inHostMemory = context->canUseHostMemory() && isHostMemoryAllowed();
    const bool inPlace = inHostMemory && switches().zeroCopy;
    bool isBuffer = false;
    context->worker().call([&](GlDevice* device) {
        isBuffer = device != nullptr && describe(*buffer, *device, inPlace);
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
        Registry::get().add(handle, buffer);
    } catch (...) {
        runtime().clReleaseMemObject(memory); // the one reference, which nobody has seen
        throw;
    }
    error = runtime().clSetMemObjectDestructorCallback(memory, onDestroyed, nullptr);
    if (error == CL_SUCCESS)
        return memory;
    onDestroyed(memory, nullptr);
    runtime().clReleaseMemObject(memory); // likewise
    return nullptr;
}

} // namespace glshare
