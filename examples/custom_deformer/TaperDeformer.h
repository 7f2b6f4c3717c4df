// A deformer of the application's own: narrows a mesh towards its top.
#pragma once

#include "evaluator/Deformer.h"

// Scales x and z by 1 + taper * y.
class TaperDeformer : public vyra::Deformer {
public:
    float taper = -0.5F; // per unit of height

    const char* name() const override { return "taper"; }
    vyra::KernelSource kernel(unsigned pass) const override;
    void setArguments(unsigned pass, vyra::KernelArguments& arguments) override;
    void deform(const vyra::MeshGeometry& geometry, vyra::Surface& surface) const override;
};
