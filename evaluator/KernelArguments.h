// The arguments that a deformer adds to its kernel.
#pragma once

#include "evaluator/ConstantArray.h"
#include "evaluator/EvaluatorExport.h"

#include <cstddef>
#include <span>
#include <type_traits>

#include <CL/cl.h>

namespace vyra {

// A receiver of the arguments of one pass of a deformer, in the order in which the kernel declares
// them after the common ones. If setting one fails, the evaluator skips the mesh and reports it.
class VYRA_EVALUATOR_API KernelArguments {
public:
    // Passes a scalar, a vector such as cl_float4, or a struct of plain numbers.
    template <typename T>
    void value(const T& value)
    {
        static_assert(std::is_trivially_copyable_v<T>);
        setValue(&value, sizeof(T));
    }

    // Passes a pointer to constant data: `global const T*`. An empty array passes a null pointer.
    virtual void constant(const ConstantArray& array) = 0;

    // Passes frame data, the values of this evaluation. The kernel declares two arguments:
    // `global const float4*` and `uint`, the index of the first float4 of the data. The bytes are
    // copied, and they are uploaded only if they changed since the last evaluation.
    template <typename T>
    void frame(std::span<const T> values)
    {
        static_assert(std::is_trivially_copyable_v<T>);
        setFrame(values.data(), values.size_bytes());
    }

protected:
    KernelArguments() = default;
    ~KernelArguments() = default;
    KernelArguments(const KernelArguments&) = delete;
    KernelArguments& operator=(const KernelArguments&) = delete;

private:
    virtual void setValue(const void* value, std::size_t sizeInBytes) = 0;
    virtual void setFrame(const void* bytes, std::size_t sizeInBytes) = 0;
};

} // namespace vyra
