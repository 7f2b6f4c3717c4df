#include "core/sharing/PinnedStorage.h"

#include "core/sharing/SharingContext.h"

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
    fAddress = unpin->pin == 0 ? nullptr : device.address(name, size);
    if (fAddress == nullptr) {
        unpin->run(&device);
        return;
    }
    fRelease.reset(unpin.release());
    fContext = std::move(context);
}

PinnedStorage::~PinnedStorage()
{
    if (fRelease != nullptr)
        fContext->worker().post(std::move(fRelease));
}

PinnedStorage::PinnedStorage(PinnedStorage&& other) noexcept
    : fContext(std::move(other.fContext)), fAddress(std::exchange(other.fAddress, nullptr)),
      fRelease(std::move(other.fRelease))
{
}

PinnedStorage& PinnedStorage::operator=(PinnedStorage&& other) noexcept
{
    PinnedStorage taken(std::move(other));
    std::swap(fContext, taken.fContext);
    std::swap(fAddress, taken.fAddress);
    std::swap(fRelease, taken.fRelease);
    return *this;
}

} // namespace glshare
