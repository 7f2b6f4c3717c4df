// Wraps the functions of EntryPoints.h for C: exceptions become error codes, and calls in a forked
// child fail.
#pragma once

#include "core/api/Arguments.h"
#include "core/api/OpenCl.h"
#include "core/worker/ProcessHooks.h"

#include <exception>
#include <tuple>
#include <type_traits>

namespace glshare {

// Returns the result of an OpenCL function that fails with `error`: the error itself, or null after
// setting errcode_ret, which is always the last argument.
template <typename Result, typename... Arguments>
[[nodiscard]] Result failWith(cl_int error, Arguments... arguments) noexcept
{
    if constexpr (std::is_same_v<Result, cl_int>) {
        return error;
    } else {
        const auto last = std::get<sizeof...(Arguments) - 1>(std::tuple(arguments...));
        if constexpr (std::is_same_v<decltype(last), cl_int* const>)
            setError(last, error);
        return nullptr;
    }
}

// Whether a function works in a forked child. Only queries of platforms and devices do.
enum class InForkedChild { kFails, kWorks };

template <auto function, InForkedChild inForkedChild = InForkedChild::kFails>
struct EntryPoint;

template <typename Result, typename... Arguments, Result(CL_API_CALL* function)(Arguments...),
          InForkedChild inForkedChild>
struct EntryPoint<function, inForkedChild> {
    // Catches standard exceptions only: the exception that unwinds a cancelled thread must pass.
    // Each standard exception means that memory or threads have run out.
    static Result CL_API_CALL call(Arguments... arguments)
    {
        if (inForkedChild == InForkedChild::kFails && isForkedChild())
            return failWith<Result>(CL_OUT_OF_RESOURCES, arguments...);
        try {
            return function(arguments...);
        } catch (const std::exception&) {
            return failWith<Result>(CL_OUT_OF_HOST_MEMORY, arguments...);
        }
    }
};

template <auto function>
inline constexpr auto entryPoint = &EntryPoint<function>::call;

template <auto function>
inline constexpr auto queryEntryPoint = &EntryPoint<function, InForkedChild::kWorks>::call;

} // namespace glshare
