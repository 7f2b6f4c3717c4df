// The host memory that a GL buffer had as its storage at one moment, kept alive whatever happens to
// the buffer. Only renderers that keep buffers in host memory have such storage.
#pragma once

#include "core/GlDevice.h"
#include "core/GlWorker.h"

#include <cstddef>
#include <memory>

namespace glshare {

class SharingContext;

// Owned by one thread at a time; may be let go on any.
class StorageHold {
public:
    // Holds nothing.
    StorageHold() = default;

    // On the worker of `context`, whose device it is. Holds nothing if the buffer is gone, smaller
    // than `size` bytes, or without host memory to look at.
    StorageHold(std::shared_ptr<SharingContext> context, const GlDevice& device, GLuint name,
                std::size_t size);

    ~StorageHold();

    StorageHold(StorageHold&& other) noexcept;
    StorageHold& operator=(StorageHold&& other) noexcept;
    StorageHold(const StorageHold&) = delete;
    StorageHold& operator=(const StorageHold&) = delete;

    // Null if nothing is held.
    [[nodiscard]] void* address() const { return address_; }

private:
    std::shared_ptr<SharingContext> context_;
    void* address_ = nullptr;
    // Unpins the storage; empty if nothing is held. Made in advance, since a destructor that found
    // no memory could not report it.
    GlWorker::PreparedJob release_;
};

} // namespace glshare
