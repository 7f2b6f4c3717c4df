#include "core/sharing/PinnedStorage.h"

#include "core/sharing/SharingContext.h"

#include <utility>

namespace glshare {

namespace {

class UnpinTask final : public GlTask {
public:
    bool run(GlBufferAccess* gl) noexcept override
    {
        if (gl != nullptr)
            gl->unpin(pin);
        return true;
    }

    GLuint pin = 0;
};

} // namespace

// Reads the address after pinning, since it may change before.
PinnedStorage::PinnedStorage(std::shared_ptr<SharingContext> context, GlBufferAccess& gl,
                             GLuint name, std::size_t size)
{
    auto unpin = std::make_unique<UnpinTask>();
    unpin->pin = gl.pin(name);
    fAddress = unpin->pin == 0 ? nullptr : gl.hostAddress(name, size);
    if (fAddress == nullptr) {
        gl.unpin(unpin->pin); // 0 is ignored
        return;
    }
    fUnpinTask.reset(unpin.release());
    fContext = std::move(context);
}

PinnedStorage::~PinnedStorage()
{
    if (fUnpinTask != nullptr)
        fContext->worker().post(std::move(fUnpinTask));
}

PinnedStorage::PinnedStorage(PinnedStorage&& other) noexcept
    : fContext(std::move(other.fContext)), fAddress(std::exchange(other.fAddress, nullptr)),
      fUnpinTask(std::move(other.fUnpinTask))
{
}

PinnedStorage& PinnedStorage::operator=(PinnedStorage&& other) noexcept
{
    PinnedStorage taken(std::move(other));
    std::swap(fContext, taken.fContext);
    std::swap(fAddress, taken.fAddress);
    std::swap(fUnpinTask, taken.fUnpinTask);
    return *this;
}

} // namespace glshare
