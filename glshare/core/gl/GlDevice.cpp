#include "core/gl/GlDevice.h"

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
    if (!device.fGl.load(resolve))
        return std::nullopt;
    device.fIsEs = textOf(device.fGl.getString(GL_VERSION)).starts_with("OpenGL ES");
    if (device.fIsEs)
        device.fGl.getBufferSubData = nullptr; // whatever stands under that name
    device.fKeepsBuffersInMemory = keepsBuffersInMemory(textOf(device.fGl.getString(GL_RENDERER)));
    device.fMark = device.fGl.fenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
    if (device.fMark == nullptr)
        return std::nullopt;
    device.fGl.genBuffers(1, &device.fStaging);
    device.fReportsImmutable = device.findsImmutableStorage();
    return device;
}

// OpenGL 4.4 and the extension GL_ARB_buffer_storage have it.
bool GlDevice::findsImmutableStorage() const
{
    while (fGl.getError() != GL_NO_ERROR) {
    }
    GLuint buffer = 0;
    fGl.genBuffers(1, &buffer);
    fGl.bindBuffer(GL_COPY_READ_BUFFER, buffer);
    static_cast<void>(parameter(GL_BUFFER_IMMUTABLE_STORAGE));
    fGl.bindBuffer(GL_COPY_READ_BUFFER, 0);
    fGl.deleteBuffers(1, &buffer);
    return succeeded();
}

void GlDevice::destroy()
{
    fGl.useProgram(0);
    fGl.deleteProgram(fPinProgram); // 0 is ignored
    fGl.deleteBuffers(1, &fStaging);
    fGl.deleteSync(fMark);
}

// glIsBuffer comes first everywhere: binding a name that is no buffer would create one in some
// profiles.
std::optional<std::size_t> GlDevice::bufferSize(GLuint name) const
{
    if (fGl.isBuffer(name) != GL_TRUE)
        return std::nullopt;
    fGl.bindBuffer(GL_COPY_READ_BUFFER, name);
    const GLint64 size = parameter(GL_BUFFER_SIZE);
    fGl.bindBuffer(GL_COPY_READ_BUFFER, 0);
    return static_cast<std::size_t>(size);
}

GLint64 GlDevice::parameter(GLenum name) const
{
    GLint64 value = 0;
    fGl.getBufferParameteri64v(GL_COPY_READ_BUFFER, name, &value);
    return value;
}

bool GlDevice::prepareCopy(GLuint name, std::size_t size) const
{
    if (bufferSize(name).value_or(0) < size)
        return false;
    while (fGl.getError() != GL_NO_ERROR) {
    }
    return true;
}

void GlDevice::bindStaging(GLenum target, std::size_t size)
{
    fGl.bindBuffer(target, fStaging);
    if (fStagingSize < size) {
        fGl.bufferData(target, static_cast<GLsizeiptr>(size), nullptr, GL_STREAM_COPY);
        fStagingSize = size;
    }
}

// OpenGL ES reads buffers only through a mapping, which has to be of a buffer of our own.
bool GlDevice::read(GLuint name, void* to, std::size_t size)
{
    if (!prepareCopy(name, size))
        return false;
    const auto bytes = static_cast<GLsizeiptr>(size);
    fGl.bindBuffer(GL_COPY_READ_BUFFER, name);
    if (fGl.getBufferSubData != nullptr) {
        fGl.getBufferSubData(GL_COPY_READ_BUFFER, 0, bytes, to);
        fGl.bindBuffer(GL_COPY_READ_BUFFER, 0);
        return succeeded();
    }
    bindStaging(GL_COPY_WRITE_BUFFER, size);
    fGl.copyBufferSubData(GL_COPY_READ_BUFFER, GL_COPY_WRITE_BUFFER, 0, 0, bytes);
    fGl.bindBuffer(GL_COPY_READ_BUFFER, 0);
    if (!succeeded())
        return false;
    const void* mapped = fGl.mapBufferRange(GL_COPY_WRITE_BUFFER, 0, bytes, GL_MAP_READ_BIT);
    if (mapped == nullptr)
        return false;
    std::memcpy(to, mapped, size);
    fGl.unmapBuffer(GL_COPY_WRITE_BUFFER);
    return true;
}

bool GlDevice::Writing::write(GLuint name, const void* from, std::size_t size)
{
    return fDevice.write(name, from, size);
}

// Storage that the application has made immutable may refuse to be written from the host; OpenGL's
// own copies it takes.
bool GlDevice::write(GLuint name, const void* from, std::size_t size)
{
    if (!prepareCopy(name, size))
        return false;
    const auto bytes = static_cast<GLsizeiptr>(size);
    fGl.bindBuffer(GL_COPY_WRITE_BUFFER, name);
    fGl.bufferSubData(GL_COPY_WRITE_BUFFER, 0, bytes, from);
    bool isWritten = succeeded();
    if (!isWritten) {
        bindStaging(GL_COPY_READ_BUFFER, size);
        fGl.bufferSubData(GL_COPY_READ_BUFFER, 0, bytes, from);
        fGl.copyBufferSubData(GL_COPY_READ_BUFFER, GL_COPY_WRITE_BUFFER, 0, 0, bytes);
        isWritten = succeeded();
    }
    fGl.bindBuffer(GL_COPY_WRITE_BUFFER, 0);
    return isWritten;
}

// The mapping is not waited for: it is only looked at. Asking for writing has a use of its own, as
// the driver then forgets what it has cached of the contents.
void* GlDevice::address(GLuint name, std::size_t size) const
{
    if (!fKeepsBuffersInMemory || fGl.isBuffer(name) != GL_TRUE)
        return nullptr;
    fGl.bindBuffer(GL_COPY_READ_BUFFER, name);
    void* const mapped = addressOfBound(size);
    fGl.bindBuffer(GL_COPY_READ_BUFFER, 0);
    return mapped;
}

void* GlDevice::addressOfBound(std::size_t size) const
{
    // Contexts that share one buffer look at it in turn.
    static std::mutex theMutex;
    const std::scoped_lock lock(theMutex);
    void* mapped = fGl.mapBufferRange(GL_COPY_READ_BUFFER, 0, static_cast<GLsizeiptr>(size),
                                      GL_MAP_WRITE_BIT | GL_MAP_UNSYNCHRONIZED_BIT);
    if (mapped != nullptr)
        fGl.unmapBuffer(GL_COPY_READ_BUFFER);
    return mapped;
}

GlDevice::CallerLook::CallerLook(const GlDevice& device) : fDevice(device)
{
    fDevice.fGl.getIntegerv(GL_COPY_READ_BUFFER_BINDING, &fBound);
}

GlDevice::CallerLook::~CallerLook()
{
    fDevice.fGl.bindBuffer(GL_COPY_READ_BUFFER, static_cast<GLuint>(fBound));
}

// Whatever could make the mapping fail is looked at before, as errors are the application's.
// Immutable storage may not be mappable; such a buffer is new, and its storage another one.
void* GlDevice::CallerLook::address(GLuint name, std::size_t size) const
{
    const GlFunctions& gl = fDevice.fGl;
    if (!fDevice.fReportsImmutable || gl.isBuffer(name) != GL_TRUE)
        return nullptr;
    gl.bindBuffer(GL_COPY_READ_BUFFER, name);
    const bool canBeMapped = fDevice.parameter(GL_BUFFER_SIZE) >= static_cast<GLint64>(size) &&
                             fDevice.parameter(GL_BUFFER_MAPPED) == GL_FALSE &&
                             fDevice.parameter(GL_BUFFER_IMMUTABLE_STORAGE) == GL_FALSE;
    return canBeMapped ? fDevice.addressOfBound(size) : nullptr;
}

// Pinning needs a program in use that could be captured from; nothing is ever drawn with it.
bool GlDevice::buildPinProgram()
{
    const std::array<const char*, 2> source{
        fIsEs ? "#version 300 es\n" : "#version 150\n",
        "out float captured; void main() { captured = 0.0; gl_Position = vec4(0.0); }"};
    const std::array<const char*, 2> fragment{source[0], "void main() {}"};
    fPinProgram = fGl.createProgram();
    const auto attach = [&](GLenum stage, const std::array<const char*, 2>& text) {
        const GLuint shader = fGl.createShader(stage);
        fGl.shaderSource(shader, static_cast<GLsizei>(text.size()), text.data(), nullptr);
        fGl.compileShader(shader);
        fGl.attachShader(fPinProgram, shader);
        fGl.deleteShader(shader); // goes with the program
    };
    attach(GL_VERTEX_SHADER, source);
    attach(GL_FRAGMENT_SHADER, fragment); // OpenGL ES links no program without one
    const char* captured = "captured";
    fGl.transformFeedbackVaryings(fPinProgram, 1, &captured, GL_INTERLEAVED_ATTRIBS);
    fGl.linkProgram(fPinProgram);
    GLint linked = GL_FALSE;
    fGl.getProgramiv(fPinProgram, GL_LINK_STATUS, &linked);
    fGl.useProgram(linked == GL_TRUE ? fPinProgram : 0);
    return linked == GL_TRUE;
}

// A capture that was begun makes its transform-feedback object hold the storage, not the buffer; so
// glDeleteBuffers and glBufferData leave it alone. The object stays out of sight of every other
// context.
GLuint GlDevice::pin(GLuint name)
{
    if (fKeepsBuffersInMemory && fPinProgram == 0)
        fKeepsBuffersInMemory = buildPinProgram();
    if (!fKeepsBuffersInMemory)
        return 0;
    GLuint feedback = 0;
    fGl.genTransformFeedbacks(1, &feedback);
    fGl.bindTransformFeedback(GL_TRANSFORM_FEEDBACK, feedback);
    fGl.bindBufferBase(GL_TRANSFORM_FEEDBACK_BUFFER, 0, name);
    fGl.beginTransformFeedback(GL_POINTS);
    fGl.endTransformFeedback();
    fGl.bindTransformFeedback(GL_TRANSFORM_FEEDBACK, 0);
    return feedback;
}

void GlDevice::unpin(GLuint pinned) const
{
    fGl.deleteTransformFeedbacks(1, &pinned);
}

bool GlDevice::isSync(GLsync sync) const
{
    return fGl.isSync(sync) == GL_TRUE;
}

bool GlDevice::isSignalled(GLsync sync) const
{
    const GLenum status = fGl.clientWaitSync(sync, 0, 0);
    return status == GL_ALREADY_SIGNALED || status == GL_CONDITION_SATISFIED;
}

bool GlDevice::callerSharesObjects() const
{
    return fGl.isSync(fMark) == GL_TRUE;
}

} // namespace glshare
