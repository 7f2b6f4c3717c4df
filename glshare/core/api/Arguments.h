// Checks of the arguments of OpenCL functions, and their output parameters.
#pragma once

#include "core/api/OpenCl.h"

#include <cstddef>
#include <cstring>
#include <span>

namespace glshare {

// The output parameters of an information query; each pointer may be null.
struct InfoOutput {
    std::size_t size; // bytes at `value`
    void* value;
    std::size_t* sizeNeeded;
};

// Writes the result of an information query. Returns CL_INVALID_VALUE and writes nothing if `value`
// has fewer bytes than the result.
[[nodiscard]] inline cl_int writeInfo(std::span<const std::byte> bytes,
                                      const InfoOutput& output) noexcept
{
    if (output.value != nullptr) {
        if (output.size < bytes.size())
            return CL_INVALID_VALUE;
        std::memcpy(output.value, bytes.data(), bytes.size());
    }
    if (output.sizeNeeded != nullptr)
        *output.sizeNeeded = bytes.size();
    return CL_SUCCESS;
}

template <typename T>
[[nodiscard]] cl_int writeInfoValue(const T& value, const InfoOutput& output) noexcept
{
    return writeInfo(std::as_bytes(std::span<const T, 1>(&value, 1)), output);
}

// The maximum length of a list argument: 128 MiB of handles. A larger count is a mistake, such as
// -1 as a cl_uint, and the list is not read.
inline constexpr cl_uint kMaxListLength = cl_uint{1} << 24;

// Returns whether `count` and `list` agree: 0 with a null pointer, or more with a pointer.
[[nodiscard]] inline bool isValidList(cl_uint count, const void* list) noexcept
{
    return (count == 0) == (list == nullptr) && count <= kMaxListLength;
}

// Stores an error code, unless `result` is null.
inline void setError(cl_int* result, cl_int error) noexcept
{
    if (result != nullptr)
        *result = error;
}

} // namespace glshare
