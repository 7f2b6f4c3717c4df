// The storage of an OpenGL buffer, kept alive even if the buffer is deleted or reallocated. Only
// renderers that keep buffers in host memory have it.
#pragma once

#include "core/gl/GlBufferAccess.h"
#include "core/worker/GlTask.h"

#include <cstddef>
#include <memory>

namespace glshare {

class SharingContext;

// Movable. Destroyed on any thread: the worker unpins the storage.
class PinnedStorage {
public:
    // Holds nothing.
    PinnedStorage() = default;

    // Called on the worker's thread of `context`, with its `gl`. Pins the current storage of buffer
    // `name`. Holds nothing if the buffer was deleted, is smaller than `size` bytes, or has no host
    // address. No other thread may use the buffer in OpenGL during the call.
    PinnedStorage(std::shared_ptr<SharingContext> context, GlBufferAccess& gl, GLuint name,
                  std::size_t size);

    ~PinnedStorage();

    PinnedStorage(PinnedStorage&& other) noexcept;
    PinnedStorage& operator=(PinnedStorage&& other) noexcept;
    PinnedStorage(const PinnedStorage&) = delete;
    PinnedStorage& operator=(const PinnedStorage&) = delete;

    // Returns null if nothing is held.
    [[nodiscard]] void* address() const noexcept { return fAddress; }

private:
    std::shared_ptr<SharingContext> fContext;
    void* fAddress = nullptr;
    // Null if nothing is held. Allocated in advance, since the destructor could not report a
    // failure.
    GlTaskPtr fUnpinTask;
};

} // namespace glshare
