// What is done on the GL side: everything that needs a current OpenGL context. One object per
// worker thread, used on that thread alone while its context is current, except where stated.
#pragma once

#include "core/GlFunctions.h"

#include <cstddef>
#include <optional>

namespace glshare {

class GlDevice {
public:
    // With the context current that `resolve` belongs to; empty if its OpenGL is too old.
    [[nodiscard]] static std::optional<GlDevice> create(GlFunctions::Resolver resolve);

    // Bytes of a buffer's storage; empty if `name` is no buffer (now).
    [[nodiscard]] std::optional<std::size_t> bufferSize(GLuint name) const;

    // The host address of a buffer's storage, null if it has none that lasts, or if the buffer is
    // gone, smaller than `size` bytes, or mapped by the application. Costs well under a
    // microsecond.
    [[nodiscard]] void* address(GLuint name, std::size_t size) const;

    // Keeps a buffer's present storage alive, whatever the application does to the buffer, until
    // unpin. Never 0.
    [[nodiscard]] GLuint pin(GLuint name) const;
    void unpin(GLuint pinned) const;

    // Copies `size` bytes out of, or into, a buffer. False, and nothing done, if the buffer is gone
    // or smaller. A write is visible to the other contexts of the share group on return.
    [[nodiscard]] bool read(GLuint name, void* to, std::size_t size);
    [[nodiscard]] bool write(GLuint name, const void* from, std::size_t size);

    [[nodiscard]] bool isSync(GLsync sync) const;

    // Looks without waiting.
    [[nodiscard]] bool isSignalled(GLsync sync) const;

    // On any thread: whether the context that is current on it belongs to this share group. There
    // must be one.
    [[nodiscard]] bool callerSharesObjects() const;

    // On any thread: waits for what was drawn on the context that is current on it.
    void finishCaller() const { gl_.finish(); }

private:
    GlDevice() = default;

    [[nodiscard]] bool buildPinProgram();
    [[nodiscard]] bool prepareCopy(GLuint name, std::size_t size);

    GlFunctions gl_;
    bool lastingAddresses_ = false;
    GLuint staging_ = 0;          // a buffer of our own, which copies go through
    std::size_t stagingSize_ = 0; // bytes
    // A sync object known to this share group alone, which tells its contexts from others.
    GLsync mark_ = nullptr;
};

} // namespace glshare
