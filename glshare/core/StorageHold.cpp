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
    context_ = std::move(context);
    pin_ = device.pin(name);
    address_ = device.address(name, size);
}

StorageHold::~StorageHold()
{
    if (pin_ == 0)
        return;
    context_->worker().post([pin = pin_](GlDevice* device) {
        if (device != nullptr)
            device->unpin(pin);
    });
}

StorageHold::StorageHold(StorageHold&& other) noexcept
    : context_(std::move(other.context_)), address_(std::exchange(other.address_, nullptr)),
      pin_(std::exchange(other.pin_, 0))
{
}

StorageHold& StorageHold::operator=(StorageHold&& other) noexcept
{
    StorageHold taken(std::move(other));
    std::swap(context_, taken.context_);
    std::swap(address_, taken.address_);
    std::swap(pin_, taken.pin_);
    return *this;
}

} // namespace glshare
