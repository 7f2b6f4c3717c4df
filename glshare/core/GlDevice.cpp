#include "core/GlDevice.h"

#include <array>
#include <cstring>
#include <mutex>
#include <string_view>

namespace glshare {

namespace {

// The renderers that keep a buffer in ordinary memory, so that every mapping of it is its storage
// itself. Elsewhere a mapping may be a temporary copy that happens to lie where the last one did.
constexpr std::array<std::string_view, 2> kRenderersInMemory{"llvmpipe", "softpipe"};

std::string_view textOf(const GLubyte* string)
{
    return string == nullptr ? std::string_view() : reinterpret_cast<const char*>(string);
}

bool keepsBuffersInMemory(std::string_view renderer)
{
    for (const std::string_view known : kRenderersInMemory) {
        if (renderer.find(known) != std::string_view::npos)
            return true;
    }
    return false;
}

} // namespace

std::optional<GlDevice> GlDevice::create(GlFunctions::Resolver resolve)
{
    GlDevice device;
    if (!device.gl_.load(resolve))
        return std::nullopt;
    device.isEs_ = textOf(device.gl_.getString(GL_VERSION)).starts_with("OpenGL ES");
    if (device.isEs_)
        device.gl_.getBufferSubData = nullptr; // whatever stands under that name
    device.keepsBuffersInMemory_ = keepsBuffersInMemory(textOf(device.gl_.getString(GL_RENDERER)));
    device.mark_ = device.gl_.fenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
    if (device.mark_ == nullptr)
        return std::nullopt;
    device.gl_.genBuffers(1, &device.staging_);
    device.reportsImmutable_ = device.findsImmutableStorage();
    return device;
}

// OpenGL 4.4 and the extension GL_ARB_buffer_storage have it.
bool GlDevice::findsImmutableStorage() const
{
    while (gl_.getError() != GL_NO_ERROR) {
    }
    GLuint buffer = 0;
    gl_.genBuffers(1, &buffer);
    gl_.bindBuffer(GL_COPY_READ_BUFFER, buffer);
    static_cast<void>(parameter(GL_BUFFER_IMMUTABLE_STORAGE));
    gl_.bindBuffer(GL_COPY_READ_BUFFER, 0);
    gl_.deleteBuffers(1, &buffer);
    return succeeded();
}

void GlDevice::destroy()
{
    gl_.useProgram(0);
    gl_.deleteProgram(pinProgram_); // 0 is ignored
    gl_.deleteBuffers(1, &staging_);
    gl_.deleteSync(mark_);
}

// glIsBuffer comes first everywhere: binding a name that is no buffer would create one in some
// profiles.
std::optional<std::size_t> GlDevice::bufferSize(GLuint name) const
{
    if (gl_.isBuffer(name) != GL_TRUE)
        return std::nullopt;
    gl_.bindBuffer(GL_COPY_READ_BUFFER, name);
    const GLint64 size = parameter(GL_BUFFER_SIZE);
    gl_.bindBuffer(GL_COPY_READ_BUFFER, 0);
    return static_cast<std::size_t>(size);
}

GLint64 GlDevice::parameter(GLenum name) const
{
    GLint64 value = 0;
    gl_.getBufferParameteri64v(GL_COPY_READ_BUFFER, name, &value);
    return value;
}

bool GlDevice::prepareCopy(GLuint name, std::size_t size) const
{
    if (bufferSize(name).value_or(0) < size)
        return false;
    while (gl_.getError() != GL_NO_ERROR) {
    }
    return true;
}

void GlDevice::bindStaging(GLenum target, std::size_t size)
{
    gl_.bindBuffer(target, staging_);
    if (stagingSize_ < size) {
        gl_.bufferData(target, static_cast<GLsizeiptr>(size), nullptr, GL_STREAM_COPY);
        stagingSize_ = size;
    }
}

// OpenGL ES reads buffers only through a mapping, which has to be of a buffer of our own.
bool GlDevice::read(GLuint name, void* to, std::size_t size)
{
    if (!prepareCopy(name, size))
        return false;
    const auto bytes = static_cast<GLsizeiptr>(size);
    gl_.bindBuffer(GL_COPY_READ_BUFFER, name);
    if (gl_.getBufferSubData != nullptr) {
        gl_.getBufferSubData(GL_COPY_READ_BUFFER, 0, bytes, to);
        gl_.bindBuffer(GL_COPY_READ_BUFFER, 0);
        return succeeded();
    }
    bindStaging(GL_COPY_WRITE_BUFFER, size);
    gl_.copyBufferSubData(GL_COPY_READ_BUFFER, GL_COPY_WRITE_BUFFER, 0, 0, bytes);
    gl_.bindBuffer(GL_COPY_READ_BUFFER, 0);
    if (!succeeded())
        return false;
    const void* mapped = gl_.mapBufferRange(GL_COPY_WRITE_BUFFER, 0, bytes, GL_MAP_READ_BIT);
    if (mapped == nullptr)
        return false;
    std::memcpy(to, mapped, size);
    gl_.unmapBuffer(GL_COPY_WRITE_BUFFER);
    return true;
}

bool GlDevice::Writing::write(GLuint name, const void* from, std::size_t size)
{
    return device_.write(name, from, size);
}

// Storage that the application has made immutable may refuse to be written from the host; OpenGL's
// own copies it takes.
bool GlDevice::write(GLuint name, const void* from, std::size_t size)
{
    if (!prepareCopy(name, size))
        return false;
    const auto bytes = static_cast<GLsizeiptr>(size);
    gl_.bindBuffer(GL_COPY_WRITE_BUFFER, name);
    gl_.bufferSubData(GL_COPY_WRITE_BUFFER, 0, bytes, from);
    bool isWritten = succeeded();
    if (!isWritten) {
        bindStaging(GL_COPY_READ_BUFFER, size);
        gl_.bufferSubData(GL_COPY_READ_BUFFER, 0, bytes, from);
        gl_.copyBufferSubData(GL_COPY_READ_BUFFER, GL_COPY_WRITE_BUFFER, 0, 0, bytes);
        isWritten = succeeded();
    }
    gl_.bindBuffer(GL_COPY_WRITE_BUFFER, 0);
    return isWritten;
}

// The mapping is not waited for: it is only looked at. Asking for writing has a use of its own, as
// the driver then forgets what it has cached of the contents.
void* GlDevice::address(GLuint name, std::size_t size) const
{
    if (!keepsBuffersInMemory_ || gl_.isBuffer(name) != GL_TRUE)
        return nullptr;
    gl_.bindBuffer(GL_COPY_READ_BUFFER, name);
    void* const mapped = addressOfBound(size);
    gl_.bindBuffer(GL_COPY_READ_BUFFER, 0);
    return mapped;
}

void* GlDevice::addressOfBound(std::size_t size) const
{
    // Contexts that share one buffer look at it in turn.
    static std::mutex theMutex;
    const std::scoped_lock lock(theMutex);
    void* mapped = gl_.mapBufferRange(GL_COPY_READ_BUFFER, 0, static_cast<GLsizeiptr>(size),
                                      GL_MAP_WRITE_BIT | GL_MAP_UNSYNCHRONIZED_BIT);
    if (mapped != nullptr)
        gl_.unmapBuffer(GL_COPY_READ_BUFFER);
    return mapped;
}

GlDevice::CallerLook::CallerLook(const GlDevice& device) : device_(device)
{
    device_.gl_.getIntegerv(GL_COPY_READ_BUFFER_BINDING, &bound_);
}

GlDevice::CallerLook::~CallerLook()
{
    device_.gl_.bindBuffer(GL_COPY_READ_BUFFER, static_cast<GLuint>(bound_));
}

// Whatever could make the mapping fail is looked at before, as errors are the application's.
// Immutable storage may not be mappable; such a buffer is new, and its storage another one.
void* GlDevice::CallerLook::address(GLuint name, std::size_t size) const
{
    const GlFunctions& gl = device_.gl_;
    if (!device_.reportsImmutable_ || gl.isBuffer(name) != GL_TRUE)
        return nullptr;
    gl.bindBuffer(GL_COPY_READ_BUFFER, name);
    const bool canBeMapped = device_.parameter(GL_BUFFER_SIZE) >= static_cast<GLint64>(size) &&
                             device_.parameter(GL_BUFFER_MAPPED) == GL_FALSE &&
                             device_.parameter(GL_BUFFER_IMMUTABLE_STORAGE) == GL_FALSE;
    return canBeMapped ? device_.addressOfBound(size) : nullptr;
}

// Pinning needs a program in use that could be captured from; nothing is ever drawn with it.
bool GlDevice::buildPinProgram()
{
    const std::array<const char*, 2> source{
        isEs_ ? "#version 300 es\n" : "#version 150\n",
        "out float captured; void main() { captured = 0.0; gl_Position = vec4(0.0); }"};
    const std::array<const char*, 2> fragment{source[0], "void main() {}"};
    pinProgram_ = gl_.createProgram();
    const auto attach = [&](GLenum stage, const std::array<const char*, 2>& text) {
        const GLuint shader = gl_.createShader(stage);
        gl_.shaderSource(shader, static_cast<GLsizei>(text.size()), text.data(), nullptr);
        gl_.compileShader(shader);
        gl_.attachShader(pinProgram_, shader);
        gl_.deleteShader(shader); // goes with the program
    };
    attach(GL_VERTEX_SHADER, source);
    attach(GL_FRAGMENT_SHADER, fragment); // OpenGL ES links no program without one
    const char* captured = "captured";
    gl_.transformFeedbackVaryings(pinProgram_, 1, &captured, GL_INTERLEAVED_ATTRIBS);
    gl_.linkProgram(pinProgram_);
    GLint linked = GL_FALSE;
    gl_.getProgramiv(pinProgram_, GL_LINK_STATUS, &linked);
    gl_.useProgram(linked == GL_TRUE ? pinProgram_ : 0);
    return linked == GL_TRUE;
}

// A capture that was begun makes its transform-feedback object hold the storage, not the buffer; so
// glDeleteBuffers and glBufferData leave it alone. The object stays out of sight of every other
// context.
GLuint GlDevice::pin(GLuint name)
{
    if (keepsBuffersInMemory_ && pinProgram_ == 0)
        keepsBuffersInMemory_ = buildPinProgram();
    if (!keepsBuffersInMemory_)
        return 0;
    GLuint feedback = 0;
    gl_.genTransformFeedbacks(1, &feedback);
    gl_.bindTransformFeedback(GL_TRANSFORM_FEEDBACK, feedback);
    gl_.bindBufferBase(GL_TRANSFORM_FEEDBACK_BUFFER, 0, name);
    gl_.beginTransformFeedback(GL_POINTS);
    gl_.endTransformFeedback();
    gl_.bindTransformFeedback(GL_TRANSFORM_FEEDBACK, 0);
    return feedback;
}

void GlDevice::unpin(GLuint pinned) const
{
    gl_.deleteTransformFeedbacks(1, &pinned);
}

bool GlDevice::isSync(GLsync sync) const
{
    return gl_.isSync(sync) == GL_TRUE;
}

bool GlDevice::isSignalled(GLsync sync) const
{
    const GLenum status = gl_.clientWaitSync(sync, 0, 0);
    return status == GL_ALREADY_SIGNALED || status == GL_CONDITION_SATISFIED;
}

bool GlDevice::callerSharesObjects() const
{
    return gl_.isSync(mark_) == GL_TRUE;
}

} // namespace glshare
