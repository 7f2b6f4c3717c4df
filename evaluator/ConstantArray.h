// Constant data of kernels.
#pragma once

#include "evaluator/EvaluatorExport.h"

#include <cstddef>
#include <memory>
#include <span>
#include <type_traits>
#include <vector>

namespace vyra {

class ConstantStorage; // host bytes and device memory, internal

// An immutable array on the host and, after its first use in an evaluation, on the device.
//
// Copies share host and device memory, so deformers of many meshes can read one array. To change
// the values, assign a new array: it is uploaded in the next evaluation. Safe to copy from any
// thread; one object is assigned by one thread at a time.
class VYRA_EVALUATOR_API ConstantArray {
public:
    // Constructs an empty array.
    ConstantArray() = default;

    template <typename T>
    explicit ConstantArray(const std::vector<T>& values)
        : ConstantArray(values.data(), values.size() * sizeof(T))
    {
        static_assert(std::is_trivially_copyable_v<T>);
    }

    std::size_t sizeInBytes() const;

    // Returns the elements. `T` is the element type of the vector passed to the constructor.
    template <typename T>
    std::span<const T> values() const
    {
        return {static_cast<const T*>(data()), sizeInBytes() / sizeof(T)};
    }

    // Internal: the storage that copies share; null for an empty array.
    const std::shared_ptr<ConstantStorage>& storage() const noexcept { return fStorage; }

private:
    ConstantArray(const void* bytes, std::size_t sizeInBytes);
    const void* data() const;

    std::shared_ptr<ConstantStorage> fStorage;
};

} // namespace vyra
