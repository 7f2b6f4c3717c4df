#include "core/Registry.h"

#include <utility>

namespace glshare {

Registry& Registry::get()
{
    static auto* const theRegistry = new Registry;
    return *theRegistry;
}

void Registry::add(cl_context handle, std::shared_ptr<SharingContext> context)
{
    const std::scoped_lock lock(mutex_);
    contexts_.insert_or_assign(handle, ContextEntry{std::move(context)});
}

void Registry::retain(cl_context handle)
{
    const std::scoped_lock lock(mutex_);
    if (const auto found = contexts_.find(handle); found != contexts_.end())
        ++found->second.references;
}

void Registry::release(cl_context handle)
{
    std::shared_ptr<SharingContext> unused;
    const std::scoped_lock lock(mutex_);
    const auto found = contexts_.find(handle);
    if (found == contexts_.end())
        return;
    if (found->second.references > 0)
        --found->second.references;
    unused = takeUnused(handle);
}

std::shared_ptr<SharingContext> Registry::find(cl_context handle)
{
    const std::scoped_lock lock(mutex_);
    const auto found = contexts_.find(handle);
    return found == contexts_.end() ? nullptr : found->second.context;
}

void Registry::add(cl_context handle, std::shared_ptr<SharedBuffer> buffer)
{
    const std::scoped_lock lock(mutex_);
    if (const auto found = contexts_.find(handle); found != contexts_.end())
        ++found->second.buffers;
    cl_mem memory = buffer->memory;
    buffers_.insert_or_assign(memory, BufferEntry{handle, std::move(buffer)});
}

std::shared_ptr<SharedBuffer> Registry::find(cl_mem handle)
{
    const std::scoped_lock lock(mutex_);
    const auto found = buffers_.find(handle);
    return found == buffers_.end() ? nullptr : found->second.buffer;
}

SharedBuffers Registry::find(const cl_mem* handles, std::size_t count)
{
    SharedBuffers result;
    result.reserve(count);
    const std::scoped_lock lock(mutex_);
    for (std::size_t i = 0; i < count; ++i) {
        const auto found = buffers_.find(handles[i]);
        if (found == buffers_.end())
            break;
        result.push_back(found->second.buffer);
    }
    return result;
}

// What is dropped is dropped without the lock: the record may be the last owner of its context, and
// that ends a thread.
void Registry::remove(cl_mem handle)
{
    std::shared_ptr<SharedBuffer> buffer;
    std::shared_ptr<SharingContext> unused;
    const std::scoped_lock lock(mutex_);
    const auto found = buffers_.find(handle);
    if (found == buffers_.end())
        return;
    cl_context owner = found->second.context;
    buffer = std::move(found->second.buffer);
    buffers_.erase(found);
    if (const auto context = contexts_.find(owner); context != contexts_.end())
        --context->second.buffers;
    unused = takeUnused(owner);
}

std::shared_ptr<SharingContext> Registry::takeUnused(cl_context handle)
{
    const auto found = contexts_.find(handle);
    if (found == contexts_.end() || found->second.references > 0 || found->second.buffers > 0)
        return nullptr;
    std::shared_ptr<SharingContext> context = std::move(found->second.context);
    contexts_.erase(found);
    return context;
}

} // namespace glshare
