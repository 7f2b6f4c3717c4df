#include "core/PinnedStorage.h"

#include "core/SharingContext.h"

#include <utility>

namespace glshare {

// The address is taken after pinning: only then is it known to stay.
PinnedStorage::PinnedStorage(std::shared_ptr<SharingContext> context, GlDevice& device, GLuint name,
                             std::size_t size)
{
    GlWorker::PreparedJob release(1);
    const GLuint pin = device.pin(name);
    address_ = pin == 0 ? nullptr : device.address(name, size);
    if (address_ == nullptr) {
        device.unpin(pin); // 0 is ignored
        return;
    }
    release.front() = [pin](GlDevice* worker) {
        if (worker != nullptr)
            worker->unpin(pin);
    };
    release_ = std::move(release);
    context_ = std::move(context);
}

PinnedStorage::~PinnedStorage()
{
    if (!release_.empty())
        context_->worker().post(std::move(release_));
}

PinnedStorage::PinnedStorage(PinnedStorage&& other) noexcept
    : context_(std::move(other.context_)), address_(std::exchange(other.address_, nullptr)),
      release_(std::move(other.release_))
{
}

PinnedStorage& PinnedStorage::operator=(PinnedStorage&& other) noexcept
{
    PinnedStorage taken(std::move(other));
    std::swap(context_, taken.context_);
    std::swap(address_, taken.address_);
    std::swap(release_, taken.release_);
    return *this;
}

} // namespace glshare
