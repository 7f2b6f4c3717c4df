// The ways in which an application can bring deformed meshes into vertex buffers.
#pragma once

#include "viewer/OpenCLFunctions.h"
#include "viewer/Scene.h"

#include <memory>

#include <QOpenGLFunctions_3_3_Core>

// One way, with a scene of its own. Everything is called with the renderer's context current; a
// failure of OpenCL throws std::runtime_error.
class Way {
public:
    Way() = default;
    virtual ~Way() = default;
    Way(const Way&) = delete;
    Way& operator=(const Way&) = delete;

    virtual const char* name() const = 0;
    // Brings the poses of the scene into its vertex buffers; they may be drawn from when OpenGL has
    // finished.
    virtual void deform() = 0;
    // To be called after drawing.
    virtual void drawn() {}
};

// The library: deformed on OpenCL in the vertex buffers themselves.
std::unique_ptr<Way> makeSharedWay(QOpenGLFunctions_3_3_Core& gl, const viewer::OpenCLFunctions& cl,
                                   viewer::Scene& scene);
// Deformed on OpenCL in memory of its own, read back, and uploaded with glBufferSubData.
std::unique_ptr<Way> makeReadBackWay(QOpenGLFunctions_3_3_Core& gl,
                                     const viewer::OpenCLFunctions& cl, viewer::Scene& scene);
// Deformed on all processors with vector instructions, and uploaded with glBufferSubData.
std::unique_ptr<Way> makeProcessorWay(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene);
