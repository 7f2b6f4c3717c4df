#include "viewer/BuildLog.h"

#include "diagnostics/AutoCLObject.h"
#include "diagnostics/CLErrorCodes.h"
#include "runtime/TopenCLInfo.h"

namespace viewer {
namespace {

std::string buildOptions()
{
    std::string options = "-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror";
    if (TopenCLInfo::theOne().supportsDoublePrecision())
        options += " -D SupportsDoublePrecision";
    return options;
}

std::string logOf(const OpenCLFunctions& cl, cl_program program, cl_device_id device)
{
    std::size_t size = 0;
    if (cl.clGetProgramBuildInfo(program, device, CL_PROGRAM_BUILD_LOG, 0, nullptr, &size) !=
        CL_SUCCESS)
        return {};
    std::string log(size, '\0');
    if (cl.clGetProgramBuildInfo(program, device, CL_PROGRAM_BUILD_LOG, size, log.data(),
                                 nullptr) != CL_SUCCESS)
        return {};
    return log.c_str(); // without what is behind the terminator
}

} // namespace

std::optional<std::string> buildLog(const OpenCLFunctions& cl, const std::string& source)
{
    const TopenCLInfo& info = TopenCLInfo::theOne();
    const char* text = source.c_str();
    cl_int status = CL_SUCCESS;
    AutoCLObject<cl_program> program;
    program.adopt(cl.clCreateProgramWithSource(info.openCLContext(), 1, &text, nullptr, &status));
    cl_device_id device = info.openCLDevice();
    if (status == CL_SUCCESS)
        status =
            cl.clBuildProgram(program.get(), 1, &device, buildOptions().c_str(), nullptr, nullptr);
    if (status == CL_SUCCESS)
        return std::nullopt;
    std::string log = program.get() ? logOf(cl, program.get(), device) : std::string();
    if (log.empty())
        log = std::string("there is no build log (") + CLErrorCodeStr(status) + ")";
    return log;
}

} // namespace viewer
