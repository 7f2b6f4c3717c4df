// Deformers on the CPU without OpenCL, in single precision, with the CPU's vector instructions.
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

    // Deforms the mesh with this index in Scene::meshes(), in its present pose, into two arrays of
    // all its vertices. Divides large meshes among threads. Safe from any thread, for one mesh
    // each.
    virtual void deform(std::size_t mesh, vyra::Vector3* positions, vyra::Vector3* normals) = 0;
};

// Each borrows the scene, which has the named deformers.

// Skin and twist: sixteen vertices at a time, by component.
std::unique_ptr<CpuDeformation> makeSkinTwist(const viewer::Scene& scene);
// The same, as one would write it first: skinned one by one, twisted by component.
std::unique_ptr<CpuDeformation> makePlainSkinTwist(const viewer::Scene& scene);
// Morph and smooth.
std::unique_ptr<CpuDeformation> makeMorphSmooth(const viewer::Scene& scene);
