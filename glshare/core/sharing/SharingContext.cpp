#include "core/sharing/SharingContext.h"

#include "core/api/Settings.h"
#include "core/sharing/CopyBatch.h"

#include <utility>

namespace glshare {

namespace {

// More than the copying commands that an application has pending at a time.
constexpr std::size_t kMaxFreeBatches = 16;

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
    return settings().glEvent && !fProperties.hasUserSync && fWorker->isCallerInShareGroup();
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
        fFreeBatches.reserve(kMaxFreeBatches); // so that returnBatch allocates nothing
        if (!fFreeBatches.empty()) {
            std::unique_ptr<CopyBatch> batch = std::move(fFreeBatches.back());
            fFreeBatches.pop_back();
            return batch;
        }
    }
    return std::make_unique<CopyBatch>();
}

void SharingContext::returnBatch(std::unique_ptr<CopyBatch> batch) noexcept
{
    const std::scoped_lock lock(fMutex);
    if (fFreeBatches.size() < fFreeBatches.capacity())
        fFreeBatches.push_back(std::move(batch));
}

} // namespace glshare
