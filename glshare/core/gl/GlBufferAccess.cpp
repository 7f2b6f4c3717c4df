#include "core/gl/GlBufferAccess.h"

#include <array>
#include <cstring>
#include <mutex>
#include <string_view>

namespace glshare {

namespace {

// The renderers that keep buffers in host memory, so that each mapping returns the storage itself.
// With other renderers a mapping may be a temporary copy, even one with the same address as before.
constexpr std::array<std::string_view, 2> kRenderersInMemory{"llvmpipe", "softpipe"};

std::string_view toStringView(const GLubyte* string)
{
    return string == nullptr ? std::string_view() : reinterpret_cast<const char*>(string);
}

bool keepsBuffersInMemory(std::string_view renderer)
{
    for (const std::string_view name : kRenderersInMemory) {
        if (renderer.find(name) != std::string_view::npos)
            return true;
    }
    return false;
}

} // namespace

std::optional<GlBufferAccess> GlBufferAccess::create(GlFunctions::Resolver resolve)
{
    GlBufferAccess access;
    if (!access.fGl.load(resolve))
        return std::nullopt;
    access.fIsEs = toStringView(access.fGl.getString(GL_VERSION)).starts_with("OpenGL ES");
    if (access.fIsEs)
        access.fGl.getBufferSubData = nullptr; // not a function of OpenGL ES, even if it is found
    access.fKeepsBuffersInMemory =
        keepsBuffersInMemory(toStringView(access.fGl.getString(GL_RENDERER)));
    access.fShareGroupSync = access.fGl.fenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
    if (access.fShareGroupSync == nullptr)
        return std::nullopt;
    access.fGl.genBuffers(1, &access.fStaging);
    access.fHasImmutableStorage = access.detectImmutableStorage();
    return access;
}

// OpenGL 4.4 and GL_ARB_buffer_storage have immutable storage; elsewhere the query is an error.
bool GlBufferAccess::detectImmutableStorage() const
{
    while (fGl.getError() != GL_NO_ERROR) {
    }
    GLuint buffer = 0;
    fGl.genBuffers(1, &buffer);
    fGl.bindBuffer(GL_COPY_READ_BUFFER, buffer);
    static_cast<void>(boundBufferParameter(GL_BUFFER_IMMUTABLE_STORAGE));
    fGl.bindBuffer(GL_COPY_READ_BUFFER, 0);
    fGl.deleteBuffers(1, &buffer);
    return hasNoError();
}

void GlBufferAccess::destroy()
{
    fGl.useProgram(0);
    fGl.deleteProgram(fPinProgram); // 0 is ignored
    fGl.deleteBuffers(1, &fStaging);
    fGl.deleteSync(fShareGroupSync);
}

// Every function calls glIsBuffer first: in some profiles, binding an unused name creates a buffer.
std::optional<std::size_t> GlBufferAccess::bufferSize(GLuint name) const
{
    if (fGl.isBuffer(name) != GL_TRUE)
        return std::nullopt;
    fGl.bindBuffer(GL_COPY_READ_BUFFER, name);
    const GLint64 size = boundBufferParameter(GL_BUFFER_SIZE);
    fGl.bindBuffer(GL_COPY_READ_BUFFER, 0);
    return static_cast<std::size_t>(size);
}

GLint64 GlBufferAccess::boundBufferParameter(GLenum name) const
{
    GLint64 value = 0;
    fGl.getBufferParameteri64v(GL_COPY_READ_BUFFER, name, &value);
    return value;
}

bool GlBufferAccess::prepareCopy(GLuint name, std::size_t size) const
{
    if (bufferSize(name).value_or(0) < size)
        return false;
    while (fGl.getError() != GL_NO_ERROR) {
    }
    return true;
}

void GlBufferAccess::bindStaging(GLenum target, std::size_t size)
{
    fGl.bindBuffer(target, fStaging);
    if (fStagingSize < size) {
        fGl.bufferData(target, static_cast<GLsizeiptr>(size), nullptr, GL_STREAM_COPY);
        fStagingSize = size;
    }
}

// OpenGL ES reads buffers only through a mapping. That must not be of the application's buffer, so
// the staging buffer is mapped.
bool GlBufferAccess::read(GLuint name, void* to, std::size_t size)
{
    if (!prepareCopy(name, size))
        return false;
    const auto bytes = static_cast<GLsizeiptr>(size);
    fGl.bindBuffer(GL_COPY_READ_BUFFER, name);
    if (fGl.getBufferSubData != nullptr) {
        fGl.getBufferSubData(GL_COPY_READ_BUFFER, 0, bytes, to);
        fGl.bindBuffer(GL_COPY_READ_BUFFER, 0);
        return hasNoError();
    }
    bindStaging(GL_COPY_WRITE_BUFFER, size);
    fGl.copyBufferSubData(GL_COPY_READ_BUFFER, GL_COPY_WRITE_BUFFER, 0, 0, bytes);
    fGl.bindBuffer(GL_COPY_READ_BUFFER, 0);
    if (!hasNoError())
        return false;
    const void* mapped = fGl.mapBufferRange(GL_COPY_WRITE_BUFFER, 0, bytes, GL_MAP_READ_BIT);
    if (mapped == nullptr)
        return false;
    std::memcpy(to, mapped, size);
    fGl.unmapBuffer(GL_COPY_WRITE_BUFFER);
    return true;
}

bool GlBufferAccess::WriteScope::write(GLuint name, const void* from, std::size_t size)
{
    return fAccess.write(name, from, size);
}

// glBufferSubData fails for immutable storage without GL_DYNAMIC_STORAGE_BIT; a copy from the
// staging buffer does not.
bool GlBufferAccess::write(GLuint name, const void* from, std::size_t size)
{
    if (!prepareCopy(name, size))
        return false;
    const auto bytes = static_cast<GLsizeiptr>(size);
    fGl.bindBuffer(GL_COPY_WRITE_BUFFER, name);
    fGl.bufferSubData(GL_COPY_WRITE_BUFFER, 0, bytes, from);
    bool isWritten = hasNoError();
    if (!isWritten) {
        bindStaging(GL_COPY_READ_BUFFER, size);
        fGl.bufferSubData(GL_COPY_READ_BUFFER, 0, bytes, from);
        fGl.copyBufferSubData(GL_COPY_READ_BUFFER, GL_COPY_WRITE_BUFFER, 0, 0, bytes);
        isWritten = hasNoError();
    }
    fGl.bindBuffer(GL_COPY_WRITE_BUFFER, 0);
    return isWritten;
}

void* GlBufferAccess::hostAddress(GLuint name, std::size_t size) const
{
    if (!fKeepsBuffersInMemory || fGl.isBuffer(name) != GL_TRUE)
        return nullptr;
    fGl.bindBuffer(GL_COPY_READ_BUFFER, name);
    void* address = boundBufferAddress(size);
    fGl.bindBuffer(GL_COPY_READ_BUFFER, 0);
    return address;
}

// Only the address is used, so that the mapping need not wait. Write access makes the driver
// discard its cached copies of the contents.
void* GlBufferAccess::boundBufferAddress(std::size_t size) const
{
    // Serialises the contexts that share one buffer.
    static std::mutex theMutex;
    const std::scoped_lock lock(theMutex);
    void* mapped = fGl.mapBufferRange(GL_COPY_READ_BUFFER, 0, static_cast<GLsizeiptr>(size),
                                      GL_MAP_WRITE_BIT | GL_MAP_UNSYNCHRONIZED_BIT);
    if (mapped != nullptr)
        fGl.unmapBuffer(GL_COPY_READ_BUFFER);
    return mapped;
}

GlBufferAccess::CallerAccess::CallerAccess(const GlBufferAccess& access) : fAccess(access)
{
    fAccess.fGl.getIntegerv(GL_COPY_READ_BUFFER_BINDING, &fBound);
}

GlBufferAccess::CallerAccess::~CallerAccess()
{
    fAccess.fGl.bindBuffer(GL_COPY_READ_BUFFER, static_cast<GLuint>(fBound));
}

// A failed mapping would change the application's error state, so its conditions are checked first.
// Immutable storage may not be mappable, which no query reports; the worker's context then tries
// it.
void* GlBufferAccess::CallerAccess::hostAddress(GLuint name, std::size_t size) const
{
    const GlFunctions& gl = fAccess.fGl;
    if (!fAccess.fHasImmutableStorage || gl.isBuffer(name) != GL_TRUE)
        return nullptr;
    gl.bindBuffer(GL_COPY_READ_BUFFER, name);
    const bool canBeMapped =
        fAccess.boundBufferParameter(GL_BUFFER_SIZE) >= static_cast<GLint64>(size) &&
        fAccess.boundBufferParameter(GL_BUFFER_MAPPED) == GL_FALSE &&
        fAccess.boundBufferParameter(GL_BUFFER_IMMUTABLE_STORAGE) == GL_FALSE;
    return canBeMapped ? fAccess.boundBufferAddress(size) : nullptr;
}

// Transform feedback can begin only while a program with captured varyings is in use. Nothing is
// drawn with it.
bool GlBufferAccess::buildPinProgram()
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
        fGl.deleteShader(shader); // deleted with the program
    };
    attach(GL_VERTEX_SHADER, source);
    attach(GL_FRAGMENT_SHADER, fragment); // required by OpenGL ES
    const char* captured = "captured";
    fGl.transformFeedbackVaryings(fPinProgram, 1, &captured, GL_INTERLEAVED_ATTRIBS);
    fGl.linkProgram(fPinProgram);
    GLint linked = GL_FALSE;
    fGl.getProgramiv(fPinProgram, GL_LINK_STATUS, &linked);
    fGl.useProgram(linked == GL_TRUE ? fPinProgram : 0);
    return linked == GL_TRUE;
}

// After a capture has begun, the transform feedback object refers to the storage itself, so that
// glDeleteBuffers and glBufferData do not free it. Transform feedback objects are not shared, so
// the application cannot see it.
GLuint GlBufferAccess::pin(GLuint name)
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

void GlBufferAccess::unpin(GLuint pinned) const
{
    fGl.deleteTransformFeedbacks(1, &pinned);
}

bool GlBufferAccess::isSync(GLsync sync) const
{
    return fGl.isSync(sync) == GL_TRUE;
}

bool GlBufferAccess::isSignalled(GLsync sync) const
{
    const GLenum status = fGl.clientWaitSync(sync, 0, 0);
    return status == GL_ALREADY_SIGNALED || status == GL_CONDITION_SATISFIED;
}

bool GlBufferAccess::isCallerInShareGroup() const
{
    return fGl.isSync(fShareGroupSync) == GL_TRUE;
}

} // namespace glshare
