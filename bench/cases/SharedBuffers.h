// Vertex buffers of the renderer, for the cases that share them.
#pragma once

#include <cstddef>
#include <vector>

class Runtime;

// A number of OpenGL buffers; gone with the object.
class GLBuffers {
public:
    static constexpr std::size_t kBytes = 4096; // each; sharing does not depend on it

    GLBuffers(Runtime& runtime, std::size_t count, std::size_t bytes = kBytes);
    ~GLBuffers();
    GLBuffers(const GLBuffers&) = delete;
    GLBuffers& operator=(const GLBuffers&) = delete;

    std::vector<unsigned>& names() { return fNames; }

private:
    Runtime& fRuntime;
    std::vector<unsigned> fNames;
};
