// The renderer of a test: a hidden OpenGL context, current on the test's thread, and the OpenGL
// side of the host around it. One source for Qt's contexts, one for those of Windows.
#pragma once

#include <cstddef>
#include <memory>
#include <vector>

class Renderer {
public:
    // Creates a renderer; null if the machine has no OpenGL.
    static std::unique_ptr<Renderer> make();
    virtual ~Renderer() = default;

    // The arguments of TopenCLInfo::initialize.
    virtual void* window() const = 0;
    virtual void* context() const = 0;

    // Creates a buffer with these values; writes and reads its contents.
    unsigned makeBuffer(const std::vector<float>& values);
    void writeBuffer(unsigned name, const std::vector<float>& values);
    std::vector<float> readBuffer(unsigned name, std::size_t count);
    void deleteBuffer(unsigned name);

    void finish();
    void flush();

protected:
    // Returns the address of an OpenGL function.
    virtual void* function(const char* name) const = 0;
};
