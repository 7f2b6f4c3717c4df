// The paths by which an application can get deformed meshes into vertex buffers.
#pragma once

#include "evaluator/Evaluator.h"
#include "frames/CpuDeformation.h"
#include "viewer/render/Scene.h"

#include <cstddef>
#include <memory>

#include <QOpenGLFunctions_3_3_Core>

// One path, with its own scene. The OpenGL context is current during each operation. Operations
// throw std::runtime_error if OpenCL or OpenGL fails.
class Path {
public:
    Path() = default;
    virtual ~Path() = default;
    Path(const Path&) = delete;
    Path& operator=(const Path&) = delete;

    // Deforms the meshes of the scene, in their current poses, into its vertex buffers, which may
    // be drawn after glFinish.
    virtual void deform() = 0;
    // Called after drawing.
    virtual void drawn() {}
};

// The library: deforms with OpenCL directly in the vertex buffers. The scene is attached to the
// evaluator.
[[nodiscard]] std::unique_ptr<Path> makeSharedBufferPath(vyra::Evaluator& evaluator);
// Deforms by the same kernels in separate memory, reads back, and uploads with glBufferSubData.
[[nodiscard]] std::unique_ptr<Path> makeReadBackPath(QOpenGLFunctions_3_3_Core& gl,
                                                     viewer::Scene& scene);
// Deforms on all cores into mapped vertex buffers.
[[nodiscard]] std::unique_ptr<Path> makeMappedCpuPath(QOpenGLFunctions_3_3_Core& gl,
                                                      viewer::Scene& scene,
                                                      std::unique_ptr<CpuDeformation> deformation);
// Deforms on all cores, and uploads with glBufferSubData.
[[nodiscard]] std::unique_ptr<Path> makeUploadCpuPath(QOpenGLFunctions_3_3_Core& gl,
                                                      viewer::Scene& scene,
                                                      std::unique_ptr<CpuDeformation> deformation);
// The physical limit: writes as many bytes as the vertex buffers of all meshes have, to its own
// memory, on one core or on all. It reads nothing, since the inputs of deformers are shared by all
// characters and stay in the caches.
[[nodiscard]] std::unique_ptr<Path> makeMemoryPath(std::size_t vertexCount, bool onAllCores);
