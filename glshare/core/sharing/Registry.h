// Which of the application's handles mean something here. Handles that are not found belong to the
// runtime alone.
#pragma once

#include "core/sharing/SharingContext.h"

#include <cstddef>
#include <memory>
#include <mutex>
#include <unordered_map>

namespace glshare {

// Safe from any thread.
class Registry {
public:
    // Never destroyed: objects may be released in exit handlers.
    static Registry& get();

    // A context lives here until the runtime destroys it, which is after every object in it. A
    // runtime before OpenCL 3.0 does not report that: then the context lives as long as the
    // application holds references to it or to shared buffers in it. Those references are counted
    // here, as the runtime's own count has other owners too.
    void add(cl_context handle, std::shared_ptr<SharingContext> context);
    void remove(cl_context handle);
    void retain(cl_context handle);
    void release(cl_context handle);
    [[nodiscard]] std::shared_ptr<SharingContext> find(cl_context handle);

    void add(cl_context handle, std::shared_ptr<SharedBuffer> buffer);
    [[nodiscard]] std::shared_ptr<SharedBuffer> find(cl_mem handle);

    // Appends the records of `count` handles to `result` in their order, up to the first that is
    // unknown.
    void find(const cl_mem* handles, std::size_t count, SharedBuffers& result);

    // When the runtime destroys the memory object. Does nothing if it is unknown.
    void remove(cl_mem handle);

private:
    struct ContextEntry {
        std::shared_ptr<SharingContext> context;
        bool isEndReported = false; // if so, nothing is counted
        std::size_t references = 1; // the application's
        std::size_t buffers = 0;
    };
    struct BufferEntry {
        cl_context context;
        std::shared_ptr<SharedBuffer> buffer;
    };

    // Under the lock: the context if nobody needs its entry any more. The caller drops it without
    // the lock, as that ends a thread.
    [[nodiscard]] std::shared_ptr<SharingContext> takeUnused(cl_context handle);

    std::mutex fMutex; // guards both maps
    std::unordered_map<cl_context, ContextEntry> fContexts;
    std::unordered_map<cl_mem, BufferEntry> fBuffers;
};

} // namespace glshare
