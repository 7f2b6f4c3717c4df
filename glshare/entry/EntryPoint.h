// The C function around each function of EntryPoints.h: no exception leaves it, and it refuses to
// work in a forked child.
#pragma once

#include "core/Answer.h"
#include "core/Fork.h"
#include "core/OpenCl.h"

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

// Whether a function works in a child that was forked while this program had threads. Only those
// do that use nothing but the runtime's description of itself.
enum class InForkedChild { Fails, Works };

template <auto function, InForkedChild inForkedChild = InForkedChild::Fails>
struct EntryPoint;

template <typename Result, typename... Arguments, Result(CL_API_CALL* function)(Arguments...),
          InForkedChild inForkedChild>
struct EntryPoint<function, inForkedChild> {
    // Standard exceptions only: a cancelled thread unwinds by another, which has to pass. Each one
    // means that the host lacks something, memory or a thread.
    static Result CL_API_CALL call(Arguments... arguments)
    {
        if (inForkedChild == InForkedChild::Fails && isForkedChild())
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
inline constexpr auto entryPointOfDescription = &EntryPoint<function, InForkedChild::Works>::call;

} // namespace glshare
