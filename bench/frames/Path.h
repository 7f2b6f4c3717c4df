// The paths on which an application can bring deformed meshes into vertex buffers.
#pragma once

#include "evaluator/Evaluator.h"
#include "frames/CpuDeformation.h"
#include "viewer/render/Scene.h"

#include <cstddef>
#include <memory>

#include <QOpenGLFunctions_3_3_Core>

// One path, with a scene of its own. All functions are called with the renderer's context current;
// a failure of OpenCL or OpenGL throws std::runtime_error.
class Path {
public:
    Path() = default;
    virtual ~Path() = default;
    Path(const Path&) = delete;
    Path& operator=(const Path&) = delete;

    // Brings the poses of the scene into its vertex buffers; they may be drawn from after OpenGL
    // has finished.
    virtual void deform() = 0;
    // To be called after drawing.
    virtual void drawn() {}
};

// The library: deformed on OpenCL in the vertex buffers themselves. The scene is attached to the
// evaluator.
std::unique_ptr<Path> makeSharedBufferPath(vyra::Evaluator& evaluator);
// Deformed by the same kernels in memory of its own, read back, and uploaded with glBufferSubData.
std::unique_ptr<Path> makeReadBackPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene);
// Deformed on all cores, straight into mapped vertex buffers.
std::unique_ptr<Path> makeMappedCpuPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene,
                                        std::unique_ptr<CpuDeformation> deformation);
// Deformed on all cores, and uploaded with glBufferSubData.
std::unique_ptr<Path> makeUploadCpuPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene,
                                        std::unique_ptr<CpuDeformation> deformation);
// The physical limit: only writes as many bytes as the vertex buffers of all meshes have, to memory
// of its own, on one core or on all. What deformers read is shared by all characters and stays in
// the caches.
std::unique_ptr<Path> makeMemoryPath(std::size_t vertexCount, bool onAllCores);
