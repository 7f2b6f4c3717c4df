#include "core/sharing/ObjectRegistry.h"

#include "core/api/Devices.h"
#include "core/worker/ProcessHooks.h"

#include <algorithm>
#include <utility>

namespace glshare {

ObjectRegistry& ObjectRegistry::get()
{
    static auto* const theRegistry = new ObjectRegistry;
    return *theRegistry;
}

// Checks the version first: the table of an older runtime ends before the function that is called.
void ObjectRegistry::add(cl_context handle, std::shared_ptr<SharingContext> context)
{
    const bool canReportEnd =
        runtime().clSetContextDestructorCallback != nullptr && supportsOpenCl3(handle);
    {
        const std::scoped_lock lock(fMutex);
        fContexts.insert_or_assign(handle, ContextEntry{std::move(context)});
    }
    const auto onDestroyed = [](cl_context destroyed, void* /*user*/) {
        if (!isForkedChild())
            get().remove(destroyed);
    };
    if (!canReportEnd ||
        runtime().clSetContextDestructorCallback(handle, onDestroyed, nullptr) != CL_SUCCESS)
        return;
    const std::scoped_lock lock(fMutex);
    fContexts.at(handle).isEndReported = true;
}

void ObjectRegistry::remove(cl_context handle)
{
    std::shared_ptr<SharingContext> unused;
    const std::scoped_lock lock(fMutex);
    if (auto entry = fContexts.extract(handle))
        unused = std::move(entry.mapped().context);
}

void ObjectRegistry::retain(cl_context handle)
{
    const std::scoped_lock lock(fMutex);
    if (const auto found = fContexts.find(handle); found != fContexts.end())
        ++found->second.references;
}

void ObjectRegistry::release(cl_context handle)
{
    std::shared_ptr<SharingContext> unused;
    const std::scoped_lock lock(fMutex);
    const auto found = fContexts.find(handle);
    if (found == fContexts.end())
        return;
    if (found->second.references > 0)
        --found->second.references;
    unused = takeUnused(handle);
}

std::shared_ptr<SharingContext> ObjectRegistry::find(cl_context handle)
{
    const std::scoped_lock lock(fMutex);
    const auto found = fContexts.find(handle);
    return found == fContexts.end() ? nullptr : found->second.context;
}

void ObjectRegistry::add(cl_context handle, std::shared_ptr<SharedBuffer> buffer)
{
    const std::scoped_lock lock(fMutex);
    if (const auto found = fContexts.find(handle); found != fContexts.end())
        ++found->second.buffers;
    cl_mem memory = buffer->memory;
    fBuffers.insert_or_assign(memory, BufferEntry{handle, std::move(buffer)});
}

std::shared_ptr<SharedBuffer> ObjectRegistry::find(cl_mem handle)
{
    const std::scoped_lock lock(fMutex);
    const auto found = fBuffers.find(handle);
    return found == fBuffers.end() ? nullptr : found->second.buffer;
}

void ObjectRegistry::find(const cl_mem* handles, std::size_t count, SharedBuffers& result)
{
    const std::scoped_lock lock(fMutex);
    result.reserve(std::min(count, fBuffers.size()));
    for (std::size_t i = 0; i < count; ++i) {
        const auto found = fBuffers.find(handles[i]);
        if (found == fBuffers.end())
            break;
        result.push_back(found->second.buffer);
    }
}

// The locals are destroyed after the lock: the record may be the last owner of its context, and
// that ends a thread.
void ObjectRegistry::remove(cl_mem handle)
{
    std::shared_ptr<SharedBuffer> buffer;
    std::shared_ptr<SharingContext> unused;
    const std::scoped_lock lock(fMutex);
    const auto found = fBuffers.find(handle);
    if (found == fBuffers.end())
        return;
    cl_context owner = found->second.context;
    buffer = std::move(found->second.buffer);
    fBuffers.erase(found);
    if (const auto context = fContexts.find(owner); context != fContexts.end())
        --context->second.buffers;
    unused = takeUnused(owner);
}

std::shared_ptr<SharingContext> ObjectRegistry::takeUnused(cl_context handle)
{
    const auto found = fContexts.find(handle);
    if (found == fContexts.end() || found->second.isEndReported || found->second.references > 0 ||
        found->second.buffers > 0)
        return nullptr;
    std::shared_ptr<SharingContext> context = std::move(found->second.context);
    fContexts.erase(found);
    return context;
}

} // namespace glshare
