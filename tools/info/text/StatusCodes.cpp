#include "tools/info/text/StatusCodes.h"

#include "diagnostics/CLErrorCodes.h"

#include <charconv>
#include <string_view>

namespace info {
namespace {

struct Code {
    int code;
    const char* name; // null where the library names it
    const char* meaning;
};

constexpr Code kCodes[] = {
    {0, nullptr, "the call succeeded"},
    {-1, nullptr, "the platform has no device of the kind asked for"},
    {-2, nullptr, "the device is there but cannot be used at present"},
    {-3, nullptr, "the driver has no compiler for kernels"},
    {-4, nullptr, "the device has no memory left for a buffer"},
    {-5, nullptr, "the device ran out of memory or of other resources"},
    {-6, nullptr, "the machine's main memory is exhausted"},
    {-11, nullptr, "a kernel does not compile; the build log says why"},
    {-12, nullptr, "the buffer cannot be made visible to the processor"},
    {-14, nullptr, "a command that was waited for failed"},
    {-15, "CL_COMPILE_PROGRAM_FAILURE", "a kernel does not compile; the build log says why"},
    {-17, "CL_LINK_PROGRAM_FAILURE", "a program cannot be linked; the build log says why"},
    {-30, nullptr, "the driver refuses one of the arguments"},
    {-31, nullptr, "the driver does not know the kind of device asked for"},
    {-32, nullptr, "the platform is not one of this machine's"},
    {-33, nullptr, "the device is not one of the platform's"},
    {-34, nullptr, "the context is not one of this runtime's"},
    {-35, nullptr, "the device cannot make a command queue of the kind asked for"},
    {-36, nullptr, "the command queue is not one of this runtime's"},
    {-38, nullptr, "the memory object is not, or no longer, a valid one"},
    {-52, nullptr, "an argument of the kernel is not set"},
    {-54, nullptr, "the device cannot run work-groups of that size"},
    {-58, nullptr, "an event is not, or no longer, a valid one"},
    {-59, nullptr, "the runtime does not offer this operation"},
    {-60, nullptr, "the OpenGL buffer does not exist or has no storage"},
    {-64, "CL_INVALID_PROPERTY", "the driver does not know a property of the context"},
    {-66, "CL_INVALID_COMPILER_OPTIONS", "the driver's compiler refuses an option"},
    {-1000, nullptr, "the driver does not know the OpenGL context, or it is not on this display"},
    {-1001, "CL_PLATFORM_NOT_FOUND_KHR", "the OpenCL loader found no driver"},
    {-9999, nullptr, "NVIDIA's driver returns it for an invalid memory access in a kernel"},
};

const Code* find(int code)
{
    for (const Code& known : kCodes) {
        if (known.code == code)
            return &known;
    }
    return nullptr;
}

std::optional<int> number(std::string_view text)
{
    int value = 0;
    const char* end = text.data() + text.size();
    const auto [parsed, error] = std::from_chars(text.data(), end, value);
    return error == std::errc() && parsed == end ? std::optional<int>(value) : std::nullopt;
}

// No header has a status below this one that the library names.
constexpr int kLowestNamedCode = -1100;

// The library's names, read backwards.
std::optional<int> codeOfName(std::string_view name)
{
    for (int code = 0; code >= kLowestNamedCode; --code) {
        if (name == CLErrorCodeStr(code))
            return code;
    }
    return std::nullopt;
}

} // namespace

std::string statusName(int code)
{
    std::string name = CLErrorCodeStr(code);
    if (!number(name))
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

std::optional<int> statusInWarning(const std::string& warning)
{
    constexpr std::string_view kPrefix = "OpenCL error: ";
    std::string_view text = warning;
    if (!text.starts_with(kPrefix))
        return std::nullopt;
    text.remove_prefix(kPrefix.size());
    while (text.ends_with('\n'))
        text.remove_suffix(1);
    const std::optional<int> code = number(text);
    return code ? code : codeOfName(text);
}

} // namespace info
