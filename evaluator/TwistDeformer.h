// A twist around an axis.
#pragma once

#include "evaluator/Deformer.h"

namespace vyra {

// Turns each vertex around the y axis of a space, by an angle in proportion to its height on that
// axis: with R the rotation by `angle` * y, a point p of the space becomes R p. Source: A. H. Barr,
// Global and Local Deformations of Solid Primitives, SIGGRAPH 1984, "axial twists".
//
// The kernel's sine and cosine deviate by less than 1e-7 as long as the rotation is within 100,000
// radians; deformers.clh has the details.
class VYRA_EVALUATOR_API TwistDeformer : public Deformer {
public:
    // Radians per unit of height.
    float angle = 0.5f;
    // From the mesh's space to the space of the twist. Has an inverse.
    MatrixRows space = kIdentityRows;

    const char* name() const override { return "twist"; }
    [[nodiscard]] std::string mismatch(const MeshGeometry& geometry) const override;
    unsigned passCount() const override { return angle == 0 ? 0 : 1; }
    KernelSource kernel(unsigned pass) const override;
    void setArguments(unsigned pass, KernelArguments& arguments) override;
    void deform(const MeshGeometry& geometry, Surface& surface) const override;
    // "angle".
    std::vector<DeformerParameter> parameters() override;
};

} // namespace vyra
