// What this program keeps for an OpenCL context that was made with an OpenGL context in its
// properties.
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

class SharingContext {
public:
    // `canUseHostMemory` says that every device of the context works in the host's own memory.
    SharingContext(std::unique_ptr<GlWorker> worker, ContextProperties properties,
                   bool canUseHostMemory);

    ~SharingContext();

    SharingContext(const SharingContext&) = delete;
    SharingContext& operator=(const SharingContext&) = delete;

    [[nodiscard]] const ContextProperties& properties() const { return fProperties; }
    [[nodiscard]] bool canUseHostMemory() const { return fCanUseHostMemory; }
    [[nodiscard]] GlWorker& worker() const { return *fWorker; }

    // Whether a command given on the calling thread must be ordered against the OpenGL context that
    // is current there.
    [[nodiscard]] bool isOrderedWithCaller() const;

    // Marks all as acquired, or as released, in one step; false, and nothing changed, if one of
    // them is so already, or stands in the list twice.
    [[nodiscard]] bool setAcquired(const SharedBuffers& buffers, bool acquired);

    // Takes a batch that a command has used before, or makes one; and takes it back, empty.
    [[nodiscard]] std::unique_ptr<CopyBatch> takeBatch();
    void keepBatch(std::unique_ptr<CopyBatch> batch) noexcept;

private:
    std::unique_ptr<GlWorker> fWorker;
    ContextProperties fProperties;
    bool fCanUseHostMemory;
    std::mutex fMutex; // guards SharedBuffer::isAcquired and the following
    std::vector<std::unique_ptr<CopyBatch>> fBatches; // not in use
};

} // namespace glshare
