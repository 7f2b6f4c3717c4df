// Answers in the form of OpenCL's information queries.
#pragma once

#include "core/api/OpenCl.h"

#include <cstddef>
#include <cstring>
#include <span>

namespace glshare {

// Where a query wants its answer; each pointer may be null.
struct Query {
    std::size_t size; // bytes at `value`
    void* value;
    std::size_t* sizeNeeded;
};

// CL_INVALID_VALUE if the answer does not fit.
inline cl_int answer(std::span<const std::byte> bytes, const Query& query)
{
    if (query.value != nullptr) {
        if (query.size < bytes.size())
            return CL_INVALID_VALUE;
        std::memcpy(query.value, bytes.data(), bytes.size());
    }
    if (query.sizeNeeded != nullptr)
        *query.sizeNeeded = bytes.size();
    return CL_SUCCESS;
}

template <typename T>
cl_int answerWith(const T& value, const Query& query)
{
    return answer(std::as_bytes(std::span<const T, 1>(&value, 1)), query);
}

// The most elements of a list that an application passes: 128 MiB of handles. A larger count is a
// mistake, such as -1 as a cl_uint, and the list is not read.
inline constexpr cl_uint kLongestList = cl_uint{1} << 24;

// Whether `list` has `count` elements: none and a null pointer, or some and a pointer.
inline bool isList(cl_uint count, const void* list)
{
    return (count == 0) == (list == nullptr) && count <= kLongestList;
}

// Fills in an error code that a caller may not want.
inline void setError(cl_int* result, cl_int error)
{
    if (result != nullptr)
        *result = error;
}

} // namespace glshare
