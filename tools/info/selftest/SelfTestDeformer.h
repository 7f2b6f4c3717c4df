// The deformer of the self-test.
#pragma once

#include "evaluator/Deformer.h"

#include <string>

namespace info {

// Doubles the numbers in the vertex buffers and adds an offset: the result depends on the numbers
// that OpenGL wrote.
class SelfTestDeformer : public vyra::Deformer {
public:
    explicit SelfTestDeformer(std::string kernelText) : fKernelText(std::move(kernelText)) {}

    float offset = 0;

    static float result(float input, float offset) { return 2.0F * input + offset; }

    const char* name() const override { return "self-test"; }
    vyra::KernelSource kernel(unsigned /*pass*/) const override
    {
        return {"self_test.cl", "selfTest", "", fKernelText};
    }
    void setArguments(unsigned /*pass*/, vyra::KernelArguments& arguments) override
    {
        arguments.value(offset);
    }
    // Never called: the self-test runs on OpenCL only.
    void deform(const vyra::MeshGeometry& /*geometry*/, vyra::Surface& /*surface*/) const override
    {
    }

private:
    std::string fKernelText;
};

} // namespace info
