// What is done on the GL side: everything that needs a current OpenGL context. One object per
// worker thread, used on that thread alone while its context is current, except where stated.
#pragma once

#include "core/gl/GlFunctions.h"

#include <cstddef>
#include <optional>

namespace glshare {

class GlDevice {
public:
    // With the context current that `resolve` belongs to; empty if its OpenGL is too old.
    [[nodiscard]] static std::optional<GlDevice> create(GlFunctions::Resolver resolve);

    // Deletes what this object has made in the share group, which outlives its context. Nothing
    // else may be called afterwards.
    void destroy();

    // Bytes of a buffer's storage; empty if `name` is no buffer (now).
    [[nodiscard]] std::optional<std::size_t> bufferSize(GLuint name) const;

    // Copies `size` bytes out of a buffer, without mapping it. False, and nothing done, if the
    // buffer is gone, smaller, or mapped by the application.
    [[nodiscard]] bool read(GLuint name, void* to, std::size_t size);

    // Copies into buffers, in the same way. The other contexts of the share group see what was
    // written when this ends.
    class Writing {
    public:
        explicit Writing(GlDevice& device) : fDevice(device) {}
        ~Writing() { fDevice.fGl.finish(); }
        Writing(const Writing&) = delete;
        Writing& operator=(const Writing&) = delete;

        [[nodiscard]] bool write(GLuint name, const void* from, std::size_t size);

    private:
        GlDevice& fDevice;
    };

    // The host address of a buffer's storage, null if it has none that lasts, or if the buffer is
    // gone, smaller than `size` bytes, or mapped by the application. Maps the buffer for well under
    // a microsecond: no other thread may use it in OpenGL at that time.
    [[nodiscard]] void* address(GLuint name, std::size_t size) const;

    // Keeps a buffer's present storage alive, whatever the application does to the buffer, until
    // unpin; 0 if that is not possible. The same holds for other threads.
    [[nodiscard]] GLuint pin(GLuint name);
    void unpin(GLuint pinned) const;

    [[nodiscard]] bool isSync(GLsync sync) const;

    // Looks without waiting.
    [[nodiscard]] bool isSignalled(GLsync sync) const;

    // On any thread: whether the context that is current on it belongs to this share group. There
    // must be one.
    [[nodiscard]] bool callerSharesObjects() const;

    // On any thread: waits for what was drawn on the context that is current on it.
    void finishCaller() const { fGl.finish(); }

    // Looks at buffers on any thread, with the context of this share group that is current on it,
    // and leaves the state of that context and its errors as they were.
    class CallerLook {
    public:
        explicit CallerLook(const GlDevice& device);
        ~CallerLook();
        CallerLook(const CallerLook&) = delete;
        CallerLook& operator=(const CallerLook&) = delete;

        // As GlDevice::address, of a buffer that had an address before. Null also if only the
        // worker's own context can look.
        [[nodiscard]] void* address(GLuint name, std::size_t size) const;

    private:
        const GlDevice& fDevice;
        GLint fBound = 0; // what the application has bound
    };

private:
    GlDevice() = default;

    // The address of the buffer that is bound to GL_COPY_READ_BUFFER, which may be mapped.
    [[nodiscard]] void* addressOfBound(std::size_t size) const;
    // A fact about that buffer.
    [[nodiscard]] GLint64 parameter(GLenum name) const;
    [[nodiscard]] bool findsImmutableStorage() const;
    [[nodiscard]] bool buildPinProgram();
    [[nodiscard]] bool prepareCopy(GLuint name, std::size_t size) const;
    [[nodiscard]] bool write(GLuint name, const void* from, std::size_t size);
    // Makes the staging buffer that large, and binds it.
    void bindStaging(GLenum target, std::size_t size);
    [[nodiscard]] bool succeeded() const { return fGl.getError() == GL_NO_ERROR; }

    GlFunctions fGl;
    bool fIsEs = false;
    bool fReportsImmutable = false;     // whether buffers report immutable storage
    bool fKeepsBuffersInMemory = false; // where they can be pinned
    GLuint fPinProgram = 0;             // made with the first pin
    GLuint fStaging = 0;                // a buffer of our own, for copies that OpenGL has to make
    std::size_t fStagingSize = 0;       // bytes
    // A sync object known to this share group alone, which tells its contexts from others.
    GLsync fMark = nullptr;
};

} // namespace glshare
