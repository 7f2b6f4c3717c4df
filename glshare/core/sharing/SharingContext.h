// The state of an OpenCL context that shares with an OpenGL context.
#pragma once

#include "core/sharing/ContextProperties.h"
#include "core/sharing/SharedBuffer.h"
#include "core/worker/GlWorker.h"

#include <memory>
#include <mutex>
#include <span>
#include <vector>

namespace glshare {

using SharedBuffers = std::vector<std::shared_ptr<SharedBuffer>>;
class CopyBatch;

// Owned by the object registry, its buffers and its pending tasks. Any thread.
class SharingContext {
public:
    // `canUseHostMemory`: every device of the context uses host memory in place.
    SharingContext(std::unique_ptr<GlWorker> worker, ContextProperties properties,
                   bool canUseHostMemory);

    ~SharingContext();

    SharingContext(const SharingContext&) = delete;
    SharingContext& operator=(const SharingContext&) = delete;

    [[nodiscard]] const ContextProperties& properties() const noexcept { return fProperties; }
    [[nodiscard]] bool canUseHostMemory() const noexcept { return fCanUseHostMemory; }
    [[nodiscard]] GlWorker& worker() const noexcept { return *fWorker; }

    // Returns whether cl_khr_gl_event orders a command of the calling thread with the OpenGL
    // commands of its current context.
    [[nodiscard]] bool isOrderedWithCaller() const;

    // Marks all buffers as acquired, or as released, in one step. Returns false, and changes
    // nothing, if one of them already is or is listed twice.
    [[nodiscard]] bool setAcquired(const SharedBuffers& buffers, bool acquired);

    // Returns an unused batch, or a new one. returnBatch accepts an empty batch for reuse.
    [[nodiscard]] std::unique_ptr<CopyBatch> takeBatch();
    void returnBatch(std::unique_ptr<CopyBatch> batch) noexcept;

private:
    std::unique_ptr<GlWorker> fWorker;
    ContextProperties fProperties;
    bool fCanUseHostMemory;
    std::mutex fMutex; // guards SharedBuffer::isAcquired and the following
    std::vector<std::unique_ptr<CopyBatch>> fFreeBatches;
};

} // namespace glshare
