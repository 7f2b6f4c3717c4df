#include "core/sharing/SharingContext.h"

#include "core/api/Switches.h"
#include "core/sharing/CopyBatch.h"

#include <utility>

namespace glshare {

namespace {

// More than a program has commands under way that copy.
constexpr std::size_t kKeptBatches = 16;

} // namespace

SharingContext::SharingContext(std::unique_ptr<GlWorker> worker, ContextProperties properties,
                               bool canUseHostMemory)
    : fWorker(std::move(worker)), fProperties(std::move(properties)),
      fCanUseHostMemory(canUseHostMemory)
{
}

SharingContext::~SharingContext() = default;

bool SharingContext::isOrderedWithCaller() const
{
    return switches().glEvent && !fProperties.userSynchronises && fWorker->callerSharesObjects();
}

bool SharingContext::setAcquired(const SharedBuffers& buffers, bool acquired)
{
    const std::scoped_lock lock(fMutex);
    for (std::size_t i = 0; i < buffers.size(); ++i) {
        if (buffers[i]->isAcquired == acquired) {
            while (i-- > 0)
                buffers[i]->isAcquired = !acquired;
            return false;
        }
        buffers[i]->isAcquired = acquired;
    }
    return true;
}

std::unique_ptr<CopyBatch> SharingContext::takeBatch()
{
    {
        const std::scoped_lock lock(fMutex);
        fBatches.reserve(kKeptBatches); // so that keepBatch allocates nothing
        if (!fBatches.empty()) {
            std::unique_ptr<CopyBatch> batch = std::move(fBatches.back());
            fBatches.pop_back();
            return batch;
        }
    }
    return std::make_unique<CopyBatch>();
}

void SharingContext::keepBatch(std::unique_ptr<CopyBatch> batch) noexcept
{
    const std::scoped_lock lock(fMutex);
    if (fBatches.size() < fBatches.capacity())
        fBatches.push_back(std::move(batch));
}

} // namespace glshare
