// The host memory that a GL buffer had as its storage at one moment, kept alive whatever happens to
// the buffer. Only renderers that keep buffers in host memory have such storage.
#pragma once

#include "core/gl/GlDevice.h"
#include "core/worker/GlTask.h"

#include <cstddef>
#include <memory>

namespace glshare {

class SharingContext;

// Owned by one thread at a time; may be let go on any.
class PinnedStorage {
public:
    // Holds nothing.
    PinnedStorage() = default;

    // On the worker of `context`, whose device it is. Holds nothing if the buffer is gone, smaller
    // than `size` bytes, or without host memory to look at. No other thread may use the buffer in
    // OpenGL at that time.
    PinnedStorage(std::shared_ptr<SharingContext> context, GlDevice& device, GLuint name,
                  std::size_t size);

    ~PinnedStorage();

    PinnedStorage(PinnedStorage&& other) noexcept;
    PinnedStorage& operator=(PinnedStorage&& other) noexcept;
    PinnedStorage(const PinnedStorage&) = delete;
    PinnedStorage& operator=(const PinnedStorage&) = delete;

    // Null if nothing is held.
    [[nodiscard]] void* address() const { return fAddress; }

private:
    std::shared_ptr<SharingContext> fContext;
    void* fAddress = nullptr;
    // Unpins the storage; null if nothing is held. Made in advance, since a destructor that found
    // no memory could not report it.
    GlTaskPtr fRelease;
};

} // namespace glshare
