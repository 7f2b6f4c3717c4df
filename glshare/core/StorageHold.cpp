#include "core/StorageHold.h"

#include "core/SharingContext.h"

#include <utility>

namespace glshare {

// The address is taken once more after pinning: only then is it known to stay.
StorageHold::StorageHold(std::shared_ptr<SharingContext> context, const GlDevice& device,
                         GLuint name, std::size_t size)
{
    if (device.address(name, size) == nullptr)
        return;
    release_.emplace_back();
    context_ = std::move(context);
    release_.front() = [pin = device.pin(name)](GlDevice* worker) {
        if (worker != nullptr)
            worker->unpin(pin);
    };
    address_ = device.address(name, size);
}

StorageHold::~StorageHold()
{
    if (!release_.empty())
        context_->worker().post(std::move(release_));
}

StorageHold::StorageHold(StorageHold&& other) noexcept
    : context_(std::move(other.context_)), address_(std::exchange(other.address_, nullptr)),
      release_(std::move(other.release_))
{
}

StorageHold& StorageHold::operator=(StorageHold&& other) noexcept
{
    StorageHold taken(std::move(other));
    std::swap(context_, taken.context_);
    std::swap(address_, taken.address_);
    std::swap(release_, taken.release_);
    return *this;
}

} // namespace glshare
