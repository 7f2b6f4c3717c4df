// Access to the buffers and sync objects of one OpenGL share group: sizes, copies, storage
// addresses. All OpenGL calls are here.
#pragma once

#include "core/gl/GlFunctions.h"

#include <cstddef>
#include <optional>

namespace glshare {

// One per GlWorker. Used on the worker's thread only, on which the worker's context is current; the
// functions for the caller's context, at the end, run on any thread.
class GlBufferAccess {
public:
    // The context of `resolve` must be current on the calling thread. Empty if its OpenGL version
    // is too old.
    [[nodiscard]] static std::optional<GlBufferAccess> create(GlFunctions::Resolver resolve);

    // Deletes the OpenGL objects of this object, since the share group outlives its context. No
    // other function may be called afterwards.
    void destroy();

    // Returns the bytes of a buffer's storage; empty if `name` is not a buffer.
    [[nodiscard]] std::optional<std::size_t> bufferSize(GLuint name) const;

    // Copies `size` bytes from a buffer to `to`, without mapping the buffer. Returns false, and
    // copies nothing, if the buffer was deleted, is smaller, or is mapped by the application.
    [[nodiscard]] bool read(GLuint name, void* to, std::size_t size);

    // Copies to buffers. Its end waits for the copies (glFinish), so that other contexts of the
    // share group read the new contents.
    class WriteScope {
    public:
        explicit WriteScope(GlBufferAccess& access) noexcept : fAccess(access) {}
        ~WriteScope() { fAccess.fGl.finish(); }
        WriteScope(const WriteScope&) = delete;
        WriteScope& operator=(const WriteScope&) = delete;

        // As GlBufferAccess::read, in the other direction.
        [[nodiscard]] bool write(GLuint name, const void* from, std::size_t size);

    private:
        GlBufferAccess& fAccess;
    };

    // Returns the host address of a buffer's storage; null if the renderer does not keep buffers in
    // host memory, or if the buffer was deleted, is smaller than `size` bytes, or is mapped by the
    // application. Maps the buffer for less than a microsecond, during which no other thread may
    // use it in OpenGL.
    [[nodiscard]] void* hostAddress(GLuint name, std::size_t size) const;

    // Keeps the current storage of a buffer alive until unpin, even if the application deletes or
    // reallocates the buffer. Returns 0 if that is not possible. No other thread may use the buffer
    // in OpenGL during the call.
    [[nodiscard]] GLuint pin(GLuint name);
    void unpin(GLuint pinned) const;

    [[nodiscard]] bool isSync(GLsync sync) const;

    // Returns whether a sync object is signalled, without waiting.
    [[nodiscard]] bool isSignalled(GLsync sync) const;

    // Any thread with a current context: returns whether that context belongs to the share group.
    [[nodiscard]] bool isCallerInShareGroup() const;

    // Any thread with a current context: waits for its commands (glFinish).
    void finishCaller() const { fGl.finish(); }

    // Any thread whose current context belongs to the share group: reads buffer addresses with that
    // context, and leaves its bindings and error state unchanged.
    class CallerAccess {
    public:
        explicit CallerAccess(const GlBufferAccess& access);
        ~CallerAccess();
        CallerAccess(const CallerAccess&) = delete;
        CallerAccess& operator=(const CallerAccess&) = delete;

        // As GlBufferAccess::hostAddress, of a buffer that had an address before. Null also if the
        // address can be read only with the worker's context.
        [[nodiscard]] void* hostAddress(GLuint name, std::size_t size) const;

    private:
        const GlBufferAccess& fAccess;
        GLint fBound = 0; // the application's binding of GL_COPY_READ_BUFFER
    };

private:
    GlBufferAccess() = default;

    // Of the buffer bound to GL_COPY_READ_BUFFER; it must be possible to map it.
    [[nodiscard]] void* boundBufferAddress(std::size_t size) const;
    [[nodiscard]] GLint64 boundBufferParameter(GLenum name) const;
    [[nodiscard]] bool detectImmutableStorage() const;
    [[nodiscard]] bool buildPinProgram();
    // Checks the size and clears the error state.
    [[nodiscard]] bool prepareCopy(GLuint name, std::size_t size) const;
    [[nodiscard]] bool write(GLuint name, const void* from, std::size_t size);
    // Binds the staging buffer, and reallocates it if it is smaller than `size` bytes.
    void bindStaging(GLenum target, std::size_t size);
    [[nodiscard]] bool hasNoError() const { return fGl.getError() == GL_NO_ERROR; }

    GlFunctions fGl;
    bool fIsEs = false;
    bool fHasImmutableStorage = false;  // the context has GL_BUFFER_IMMUTABLE_STORAGE
    bool fKeepsBuffersInMemory = false; // buffers can be pinned
    GLuint fPinProgram = 0;             // built with the first pin
    GLuint fStaging = 0;                // for copies that OpenGL makes
    std::size_t fStagingSize = 0;       // bytes
    // A sync object of this share group. glIsSync identifies the group's contexts by it.
    GLsync fShareGroupSync = nullptr;
};

} // namespace glshare
