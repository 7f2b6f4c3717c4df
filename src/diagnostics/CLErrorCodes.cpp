#include "diagnostics/CLErrorCodes.h"

#include <array>
#include <cstdio>

namespace {

// The status codes of OpenCL 1.1's core header, from -62 up to 0. A null entry has no name.
constexpr int kFirstDenseCode = -62;
constexpr std::array<const char*, 63> kDenseNames = {
    "CL_INVALID_MIP_LEVEL",
    "CL_INVALID_BUFFER_SIZE",
    "CL_INVALID_GL_OBJECT",
    "CL_INVALID_OPERATION",
    "CL_INVALID_EVENT",
    "CL_INVALID_EVENT_WAIT_LIST",
    "CL_INVALID_GLOBAL_OFFSET",
    "CL_INVALID_WORK_ITEM_SIZE",
    "CL_INVALID_WORK_GROUP_SIZE",
    "CL_INVALID_WORK_DIMENSION",
    "CL_INVALID_KERNEL_ARGS",
    "CL_INVALID_ARG_SIZE",
    "CL_INVALID_ARG_VALUE",
    "CL_INVALID_ARG_INDEX",
    "CL_INVALID_KERNEL",
    "CL_INVALID_KERNEL_DEFINITION",
    "CL_INVALID_KERNEL_NAME",
    "CL_INVALID_PROGRAM_EXECUTABLE",
    "CL_INVALID_PROGRAM",
    "CL_INVALID_BUILD_OPTIONS",
    "CL_INVALID_BINARY",
    "CL_INVALID_SAMPLER",
    "CL_INVALID_IMAGE_SIZE",
    "CL_INVALID_IMAGE_FORMAT_DESCRIPTOR",
    "CL_INVALID_MEM_OBJECT",
    "CL_INVALID_HOST_PTR",
    "CL_INVALID_COMMAND_QUEUE",
    "CL_INVALID_QUEUE_PROPERTIES",
    "CL_INVALID_CONTEXT",
    "CL_INVALID_DEVICE",
    "CL_INVALID_PLATFORM",
    "CL_INVALID_DEVICE_TYPE",
    "CL_INVALID_VALUE",
    // -29 to -15
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    nullptr,
    "CL_EXEC_STATUS_ERROR_FOR_EVENTS_IN_WAIT_LIST",
    "CL_MISALIGNED_SUB_BUFFER_OFFSET",
    "CL_MAP_FAILURE",
    "CL_BUILD_PROGRAM_FAILURE",
    "CL_IMAGE_FORMAT_NOT_SUPPORTED",
    "CL_IMAGE_FORMAT_MISMATCH",
    "CL_MEM_COPY_OVERLAP",
    "CL_PROFILING_INFO_NOT_AVAILABLE",
    "CL_OUT_OF_HOST_MEMORY",
    "CL_OUT_OF_RESOURCES",
    "CL_MEM_OBJECT_ALLOCATION_FAILURE",
    "CL_COMPILER_NOT_AVAILABLE",
    "CL_DEVICE_NOT_AVAILABLE",
    "CL_DEVICE_NOT_FOUND",
    "CL_SUCCESS",
};

struct NamedCode {
    int code;
    const char* name;
};

// Codes outside the dense range: the last of the core header and those of the sharing extensions.
constexpr std::array<NamedCode, 6> kSparseNames = {{
    {-63, "CL_INVALID_GLOBAL_WORK_SIZE"},
    {-1000, "CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR"},
    {-1006, "CL_INVALID_D3D11_DEVICE"},
    {-1007, "CL_INVALID_D3D11_RESOURCE"},
    {-1008, "CL_D3D11_RESOURCE_ALREADY_ACQUIRED"},
    {-1009, "CL_D3D11_RESOURCE_NOT_ACQUIRED"},
}};

const char* findName(int code)
{
    if (code >= kFirstDenseCode && code <= 0)
        return kDenseNames[static_cast<std::size_t>(code - kFirstDenseCode)];
    for (const NamedCode& named : kSparseNames) {
        if (named.code == code)
            return named.name;
    }
    return nullptr;
}

} // namespace

const char* CLErrorCodeStr(int code)
{
    if (const char* name = findName(code))
        return name;

    // Capacity for any 32-bit number: a sign, ten digits and the terminating NUL.
    thread_local std::array<char, 12> decimalText;
    std::snprintf(decimalText.data(), decimalText.size(), "%d", code);
    return decimalText.data();
}
