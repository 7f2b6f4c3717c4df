// GlBufferAccess on a scripted OpenGL that executes commands only in glFinish, as a GPU driver may.
// Mesa's software renderers execute at once, which hides a missing glFinish.
#include "core/gl/GlBufferAccess.h"

#include <gtest/gtest.h>

#include <array>
#include <cstring>
#include <functional>
#include <map>
#include <string_view>
#include <vector>

namespace {

using glshare::GlBufferAccess;

constexpr GLuint kBuffer = 7;

std::array<int, 4> theStorage;
std::vector<std::function<void()>> thePending;

// Replaces the functions that the test does not use.
std::intptr_t APIENTRY doNothing()
{
    return 0;
}

void APIENTRY finish()
{
    for (const auto& command : std::exchange(thePending, {}))
        command();
}

void APIENTRY bufferSubData(GLenum, GLintptr offset, GLsizeiptr size, const void* data)
{
    std::vector<char> bytes(static_cast<std::size_t>(size));
    std::memcpy(bytes.data(), data, bytes.size());
    thePending.emplace_back([bytes, offset] {
        std::memcpy(reinterpret_cast<char*>(theStorage.data()) + offset, bytes.data(),
                    bytes.size());
    });
}

void* resolve(const char* name)
{
    static const std::map<std::string_view, void*> theFunctions{
        {"glFinish", reinterpret_cast<void*>(finish)},
        {"glBufferSubData", reinterpret_cast<void*>(bufferSubData)},
        {"glFenceSync", reinterpret_cast<void*>(+[](GLenum, GLbitfield) -> GLsync {
             return reinterpret_cast<GLsync>(&theStorage);
         })},
        {"glIsBuffer", reinterpret_cast<void*>(+[](GLuint buffer) -> GLboolean {
             return buffer == kBuffer ? GL_TRUE : GL_FALSE;
         })},
        {"glGetBufferParameteri64v", reinterpret_cast<void*>(+[](GLenum, GLenum, GLint64* size) {
             *size = sizeof theStorage;
         })},
    };
    const auto found = theFunctions.find(name);
    return found == theFunctions.end() ? reinterpret_cast<void*>(doNothing) : found->second;
}

TEST(GlBufferAccessTest, EndOfWriteScopeWaitsForItsWrites)
{
    auto access = GlBufferAccess::create(resolve);
    ASSERT_TRUE(access);
    const std::array<int, 4> numbers{1, 2, 3, 4};
    {
        GlBufferAccess::WriteScope scope(*access);
        EXPECT_TRUE(scope.write(kBuffer, numbers.data(), sizeof numbers));
        EXPECT_FALSE(scope.write(kBuffer, numbers.data(), sizeof numbers + 1)) << "too small";
        EXPECT_FALSE(scope.write(kBuffer + 1, numbers.data(), sizeof numbers)) << "not a buffer";
    }
    EXPECT_EQ(theStorage, numbers);
}

} // namespace
