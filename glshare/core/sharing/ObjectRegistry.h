// The OpenCL contexts and memory objects that glshare shares. Handles that are not found belong to
// the runtime alone.
#pragma once

#include "core/sharing/SharingContext.h"

#include <cstddef>
#include <memory>
#include <mutex>
#include <unordered_map>

namespace glshare {

// Owns a record per context and memory object. Any thread.
class ObjectRegistry {
public:
    // Never destroyed: objects may be released in exit handlers.
    [[nodiscard]] static ObjectRegistry& get();

    // A context is registered until the runtime destroys it, which is after every object in it. A
    // runtime before OpenCL 3.0 does not report that. The context is then registered as long as the
    // application holds references to it or to shared buffers in it. These are counted here, since
    // the runtime's count includes references of others.
    void add(cl_context handle, std::shared_ptr<SharingContext> context);
    void remove(cl_context handle);
    void retain(cl_context handle);
    void release(cl_context handle);
    // Returns null if the context is not registered.
    [[nodiscard]] std::shared_ptr<SharingContext> find(cl_context handle);

    void add(cl_context handle, std::shared_ptr<SharedBuffer> buffer);
    // Returns null if the memory object is not registered.
    [[nodiscard]] std::shared_ptr<SharedBuffer> find(cl_mem handle);

    // Appends the records of `count` handles to `result`, in order, and stops at the first handle
    // that is not registered.
    void find(const cl_mem* handles, std::size_t count, SharedBuffers& result);

    // Called when the runtime destroys the memory object. Ignores one that is not registered.
    void remove(cl_mem handle);

private:
    struct ContextEntry {
        std::shared_ptr<SharingContext> context;
        bool isEndReported = false; // by the runtime; the counts are then not used
        std::size_t references = 1; // the application's
        std::size_t buffers = 0;
    };
    struct BufferEntry {
        cl_context context;
        std::shared_ptr<SharedBuffer> buffer;
    };

    // Called with the lock held. Removes the context's entry if its counts are 0, and returns its
    // context; null otherwise. The caller releases the result after it has unlocked, since that may
    // end a thread.
    [[nodiscard]] std::shared_ptr<SharingContext> takeUnused(cl_context handle);

    std::mutex fMutex; // guards both maps
    std::unordered_map<cl_context, ContextEntry> fContexts;
    std::unordered_map<cl_mem, BufferEntry> fBuffers;
};

} // namespace glshare
