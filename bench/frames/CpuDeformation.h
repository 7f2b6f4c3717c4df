// Deformers on the CPU without OpenCL, in single precision, with vector instructions.
#pragma once

#include "evaluator/Geometry.h"
#include "viewer/render/Scene.h"

#include <cstddef>
#include <memory>

// The deformers of the meshes of one scene.
class CpuDeformation {
public:
    CpuDeformation() = default;
    virtual ~CpuDeformation() = default;
    CpuDeformation(const CpuDeformation&) = delete;
    CpuDeformation& operator=(const CpuDeformation&) = delete;

    // Deforms the mesh with this index in Scene::meshes(), in its current pose, into two arrays
    // with one element per vertex. Divides large meshes among threads. Several threads may deform
    // different meshes at the same time.
    virtual void deform(std::size_t mesh, vyra::Vector3* positions, vyra::Vector3* normals) = 0;
};

// These borrow the scene, whose meshes have the named deformers.

// Skin and twist: sixteen vertices at a time, by component.
[[nodiscard]] std::unique_ptr<CpuDeformation> makeSkinTwist(const viewer::Scene& scene);
// The same without hand-written vector code: skinned vertex by vertex, twisted by component.
[[nodiscard]] std::unique_ptr<CpuDeformation> makePlainSkinTwist(const viewer::Scene& scene);
// Morph and smooth.
[[nodiscard]] std::unique_ptr<CpuDeformation> makeMorphSmooth(const viewer::Scene& scene);
