#include "core/GlDevice.h"

#include <array>
#include <cstring>
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
    device.lastingAddresses_ =
        keepsBuffersInMemory(textOf(device.gl_.getString(GL_RENDERER))) && device.buildPinProgram();
    device.gl_.genBuffers(1, &device.staging_);
    device.mark_ = device.gl_.fenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
    if (device.mark_ == nullptr)
        return std::nullopt;
    return device;
}

// Pinning needs a program in use that could be captured from; nothing is ever drawn with it.
bool GlDevice::buildPinProgram()
{
    const bool isEs = textOf(gl_.getString(GL_VERSION)).starts_with("OpenGL ES");
    const std::array<const char*, 2> source{
        isEs ? "#version 300 es\n" : "#version 150\n",
        "out float captured; void main() { captured = 0.0; gl_Position = vec4(0.0); }"};
    const std::array<const char*, 2> fragment{source[0], "void main() {}"};
    const GLuint program = gl_.createProgram();
    const auto attach = [&](GLenum stage, const std::array<const char*, 2>& text) {
        const GLuint shader = gl_.createShader(stage);
        gl_.shaderSource(shader, static_cast<GLsizei>(text.size()), text.data(), nullptr);
        gl_.compileShader(shader);
        gl_.attachShader(program, shader);
    };
    attach(GL_VERTEX_SHADER, source);
    attach(GL_FRAGMENT_SHADER, fragment); // OpenGL ES links no program without one
    const char* captured = "captured";
    gl_.transformFeedbackVaryings(program, 1, &captured, GL_INTERLEAVED_ATTRIBS);
    gl_.linkProgram(program);
    GLint linked = GL_FALSE;
    gl_.getProgramiv(program, GL_LINK_STATUS, &linked);
    if (linked != GL_TRUE)
        return false;
    gl_.useProgram(program);
    return true;
}

// glIsBuffer comes first everywhere: binding a name that is no buffer would create one in some
// profiles.
std::optional<std::size_t> GlDevice::bufferSize(GLuint name) const
{
    if (gl_.isBuffer(name) != GL_TRUE)
        return std::nullopt;
    GLint64 size = 0;
    gl_.bindBuffer(GL_COPY_READ_BUFFER, name);
    gl_.getBufferParameteri64v(GL_COPY_READ_BUFFER, GL_BUFFER_SIZE, &size);
    gl_.bindBuffer(GL_COPY_READ_BUFFER, 0);
    return static_cast<std::size_t>(size);
}

// The mapping is not waited for: it is only looked at. Asking for writing has a use of its own, as
// the driver then forgets what it has cached of the contents.
void* GlDevice::address(GLuint name, std::size_t size) const
{
    if (!lastingAddresses_ || gl_.isBuffer(name) != GL_TRUE)
        return nullptr;
    gl_.bindBuffer(GL_COPY_READ_BUFFER, name);
    void* mapped = gl_.mapBufferRange(GL_COPY_READ_BUFFER, 0, static_cast<GLsizeiptr>(size),
                                      GL_MAP_WRITE_BIT | GL_MAP_UNSYNCHRONIZED_BIT);
    if (mapped != nullptr)
        gl_.unmapBuffer(GL_COPY_READ_BUFFER);
    gl_.bindBuffer(GL_COPY_READ_BUFFER, 0);
    return mapped;
}

// A capture that was begun makes its transform-feedback object hold the storage, not the buffer; so
// glDeleteBuffers and glBufferData leave it alone. The object stays out of sight of every other
// context.
GLuint GlDevice::pin(GLuint name) const
{
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

// Copies go through a buffer of our own: the application's may have storage that refuses to be
// mapped, or be mapped already.
bool GlDevice::prepareCopy(GLuint name, std::size_t size)
{
    if (bufferSize(name).value_or(0) < size)
        return false;
    if (stagingSize_ < size) {
        gl_.bindBuffer(GL_COPY_WRITE_BUFFER, staging_);
        gl_.bufferData(GL_COPY_WRITE_BUFFER, static_cast<GLsizeiptr>(size), nullptr,
                       GL_STREAM_COPY);
        stagingSize_ = size;
    }
    while (gl_.getError() != GL_NO_ERROR) {
    }
    return true;
}

bool GlDevice::read(GLuint name, void* to, std::size_t size)
{
    if (!prepareCopy(name, size))
        return false;
    const auto bytes = static_cast<GLsizeiptr>(size);
    gl_.bindBuffer(GL_COPY_READ_BUFFER, name);
    gl_.bindBuffer(GL_COPY_WRITE_BUFFER, staging_);
    gl_.copyBufferSubData(GL_COPY_READ_BUFFER, GL_COPY_WRITE_BUFFER, 0, 0, bytes);
    const bool copied = gl_.getError() == GL_NO_ERROR;
    const void* mapped = gl_.mapBufferRange(GL_COPY_WRITE_BUFFER, 0, bytes, GL_MAP_READ_BIT);
    if (mapped != nullptr) {
        std::memcpy(to, mapped, size);
        gl_.unmapBuffer(GL_COPY_WRITE_BUFFER);
    }
    gl_.bindBuffer(GL_COPY_READ_BUFFER, 0);
    return copied && mapped != nullptr;
}

bool GlDevice::write(GLuint name, const void* from, std::size_t size)
{
    if (!prepareCopy(name, size))
        return false;
    const auto bytes = static_cast<GLsizeiptr>(size);
    gl_.bindBuffer(GL_COPY_READ_BUFFER, staging_);
    void* mapped = gl_.mapBufferRange(GL_COPY_READ_BUFFER, 0, bytes,
                                      GL_MAP_WRITE_BIT | GL_MAP_INVALIDATE_BUFFER_BIT);
    if (mapped == nullptr)
        return false;
    std::memcpy(mapped, from, size);
    gl_.unmapBuffer(GL_COPY_READ_BUFFER);
    gl_.bindBuffer(GL_COPY_WRITE_BUFFER, name);
    gl_.copyBufferSubData(GL_COPY_READ_BUFFER, GL_COPY_WRITE_BUFFER, 0, 0, bytes);
    const bool copied = gl_.getError() == GL_NO_ERROR;
    gl_.bindBuffer(GL_COPY_WRITE_BUFFER, 0);
    gl_.finish();
    return copied;
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
