#include "core/SharingContext.h"

#include "core/Switches.h"

#include <utility>

namespace glshare {

SharingContext::SharingContext(std::unique_ptr<GlWorker> worker, ContextProperties properties,
                               bool canUseHostMemory)
    : worker_(std::move(worker)), properties_(std::move(properties)),
      canUseHostMemory_(canUseHostMemory)
{
}

bool SharingContext::isOrderedWithCaller() const
{
    return switches().glEvent && !properties_.userSynchronises && worker_->callerSharesObjects();
}

bool SharingContext::setAcquired(const SharedBuffers& buffers, bool acquired)
{
    const std::scoped_lock lock(mutex_);
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

void SharingContext::keep(Kept things) noexcept
{
    const std::scoped_lock lock(mutex_);
    kept_.splice(kept_.end(), things);
}

} // namespace glshare
