// The C functions around those of EntryPoints.h: no exception leaves them, and in a forked child
// they fail.
#pragma once

#include "core/api/Answer.h"
#include "core/api/OpenCl.h"
#include "core/worker/Fork.h"

#include <exception>
#include <tuple>
#include <type_traits>

namespace glshare {

// Returns what an OpenCL function with these arguments returns when it fails with `error`: the
// error itself, or null and the error through errcode_ret, which is always the last argument.
template <typename Result, typename... Arguments>
Result failWith(cl_int error, Arguments... arguments)
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

// Whether a function works in a forked child: true of those that only query platforms and devices.
enum class InForkedChild { kFails, kWorks };

template <auto function, InForkedChild inForkedChild = InForkedChild::kFails>
struct EntryPoint;

template <typename Result, typename... Arguments, Result(CL_API_CALL* function)(Arguments...),
          InForkedChild inForkedChild>
struct EntryPoint<function, inForkedChild> {
    // Catches standard exceptions only: a cancelled thread unwinds by another, which must pass.
    // Each means that the host has no memory or no thread to give.
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
inline constexpr auto entryPointOfDescription = &EntryPoint<function, InForkedChild::kWorks>::call;

} // namespace glshare
