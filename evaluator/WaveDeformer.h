// A travelling wave.
#pragma once

#include "evaluator/Deformer.h"

namespace vyra {

// Moves each vertex along one axis of a space, by a sine of its place on another axis: a point p of
// the space becomes
//
//     p + amplitude * sin(2 pi / wavelength * p[direction] - phase) * unit vector of displacement
//
// which is the plane harmonic wave of textbooks; a growing phase makes it travel in the direction.
// Displacement along the direction itself gives a compression wave. For directions other than the
// axes, rotate the space.
class VYRA_EVALUATOR_API WaveDeformer : public Deformer {
public:
    enum Axis : unsigned { kX, kY, kZ };

    float amplitude = 0.05f; // units of the space
    float wavelength = 0.5f; // units of the space, above 0
    float phase = 0;         // radians
    unsigned direction = kX; // an Axis
    unsigned displacement = kY;
    // From the mesh's space to the space of the wave. Has an inverse.
    MatrixRows space = kIdentityRows;

    const char* name() const override { return "wave"; }
    [[nodiscard]] std::string mismatch(const MeshGeometry& geometry) const override;
    unsigned passCount() const override { return amplitude == 0 ? 0 : 1; }
    KernelSource kernel(unsigned pass) const override;
    void setArguments(unsigned pass, KernelArguments& arguments) override;
    void deform(const MeshGeometry& geometry, Surface& surface) const override;
    // "amplitude", "wavelength", "phase", "direction", "displacement".
    std::vector<DeformerParameter> parameters() override;
};

} // namespace vyra
