#include "core/PinnedStorage.h"

#include "core/SharingContext.h"

#include <utility>

namespace glshare {

namespace {

class Unpin final : public GlTask {
public:
    bool run(GlDevice* device) noexcept override
    {
        if (device != nullptr)
            device->unpin(pin); // 0 is ignored
        return true;
    }

    GLuint pin = 0;
};

} // namespace

// The address is taken after pinning: only then is it known to stay.
PinnedStorage::PinnedStorage(std::shared_ptr<SharingContext> context, GlDevice& device, GLuint name,
                             std::size_t size)
{
    auto unpin = std::make_unique<Unpin>();
    unpin->pin = device.pin(name);
    address_ = unpin->pin == 0 ? nullptr : device.address(name, size);
    if (address_ == nullptr) {
        unpin->run(&device);
        return;
    }
    release_.reset(unpin.release());
    context_ = std::move(context);
}

PinnedStorage::~PinnedStorage()
{
    if (release_ != nullptr)
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
