// The renderer's vertex buffers of one mesh.
#pragma once

#include <cstdint>

namespace vyra {

// Two buffers of packed floats, three per vertex: one of positions, one of normals. The renderer
// owns them, and deletes them only after the mesh was destroyed.
struct VertexBuffers {
    // Names of OpenGL buffers; used unless the Direct3D 11 pointers are set.
    std::uint32_t positions = 0;
    std::uint32_t normals = 0;
    // ID3D11Buffer pointers.
    void* d3d11Positions = nullptr;
    void* d3d11Normals = nullptr;
};

} // namespace vyra
