#include "tools/info/text/StatusCodes.h"

#include "diagnostics/CLErrorCodes.h"

namespace info {
namespace {

struct Code {
    int code;
    const char* name; // null where the library names it
    const char* meaning;
};

constexpr Code kCodes[] = {
    {0, nullptr, "the call succeeded"},
    {-1, nullptr, "the platform has no device of the requested type"},
    {-2, nullptr, "the device exists but cannot be used at present"},
    {-3, nullptr, "the driver has no compiler for kernels"},
    {-4, nullptr, "the device has no memory left for a buffer"},
    {-5, nullptr, "the device ran out of memory or of other resources"},
    {-6, nullptr, "the machine's main memory is exhausted"},
    {-11, nullptr, "a kernel does not compile; see the build log"},
    {-12, nullptr, "the buffer cannot be mapped into main memory"},
    {-14, nullptr, "a command that was waited for failed"},
    {-15, "CL_COMPILE_PROGRAM_FAILURE", "a kernel does not compile; see the build log"},
    {-17, "CL_LINK_PROGRAM_FAILURE", "a program cannot be linked; see the build log"},
    {-30, nullptr, "the driver refuses one of the arguments"},
    {-31, nullptr, "the driver does not support the requested type of device"},
    {-32, nullptr, "the platform is not one of this machine's"},
    {-33, nullptr, "the device is not one of the platform's"},
    {-34, nullptr, "the context is not one of this runtime's"},
    {-35, nullptr, "the device cannot create a command queue with these properties"},
    {-36, nullptr, "the command queue is not one of this runtime's"},
    {-38, nullptr, "the memory object is not, or no longer, a valid one"},
    {-52, nullptr, "an argument of the kernel is not set"},
    {-54, nullptr, "the device cannot run work-groups of that size"},
    {-58, nullptr, "an event is not, or no longer, a valid one"},
    {-59, nullptr, "the runtime does not offer this operation"},
    {-60, nullptr, "the OpenGL buffer does not exist or has no storage"},
    {-64, "CL_INVALID_PROPERTY", "the driver does not support a property of the context"},
    {-66, "CL_INVALID_COMPILER_OPTIONS", "the driver's compiler refuses an option"},
    {-1000, nullptr,
     "the driver does not recognise the OpenGL context, or it is not on this display"},
    {-1001, "CL_PLATFORM_NOT_FOUND_KHR", "the OpenCL loader found no driver"},
    {-9999, nullptr, "NVIDIA's driver returns it for an invalid memory access in a kernel"},
};

const Code* find(int code) noexcept
{
    for (const Code& known : kCodes) {
        if (known.code == code)
            return &known;
    }
    return nullptr;
}

} // namespace

std::string statusName(int code)
{
    std::string name = CLErrorCodeStr(code);
    if (name != std::to_string(code)) // the text of a code without a name
        return name;
    const Code* known = find(code);
    return known && known->name ? known->name : "";
}

std::string statusMeaning(int code)
{
    const Code* known = find(code);
    return known ? known->meaning : "";
}

std::string describeStatus(int code)
{
    const std::string name = statusName(code);
    const std::string meaning = statusMeaning(code);
    const std::string digits = std::to_string(code);
    const std::string title = name.empty() ? "status " + digits + ", which no OpenCL header names"
                                           : name + " (" + digits + ")";
    return meaning.empty() ? title : title + ": " + meaning;
}

} // namespace info
