#include "cases/Programs.h"

#include "Runtime.h"

#include <fstream>
#include <stdexcept>

#include <unistd.h>

namespace {

constexpr const char* kSource = "__kernel void scale(__global float* data, float amount)\n"
                                "{ data[get_global_id(0)] *= amount; }\n";

// As deep as an installed host's resources lie.
constexpr const char* kLongFolder =
    "opt/applications/content-creation-2025/resources/opencl/deformers";

constexpr const char* kLongFlags =
    "-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror "
    "-DVYRA_MAXIMUM_INFLUENCES=8 -DVYRA_NORMALS=1 -DVYRA_TANGENTS=0 -DVYRA_VARIANT=";

// Need not exist: the programs include nothing.
TstringArray longIncludeDirs()
{
    TstringArray dirs;
    for (const char* name : {"include", "shared include files", "generated"})
        dirs.append((std::string("/") + kLongFolder + '/' + name).c_str());
    return dirs;
}

cl_program build(const KernelRequest& request)
{
    const char* source = kSource;
    const cl_device_id device = Runtime::device();
    cl_int status = CL_SUCCESS;
    cl_program program =
        clCreateProgramWithSource(Runtime::context(), 1, &source, nullptr, &status);
    if (clBuildProgram(program, 1, &device, request.flags.c_str(), nullptr, nullptr) != CL_SUCCESS)
        throw std::runtime_error("a program cannot be built");
    return program;
}

} // namespace

Programs::Programs(std::size_t count, Texts texts)
    : fFolder(std::filesystem::temp_directory_path() /
              ("vyra-opencl-bench-" + std::to_string(getpid())))
{
    const bool isLong = texts == Texts::kLong;
    const std::filesystem::path folder = isLong ? fFolder / kLongFolder : fFolder;
    std::filesystem::create_directories(folder);
    for (std::size_t index = 0; index < count; ++index) {
        const std::string number = std::to_string(index);
        KernelRequest request{folder / ("deform" + number + ".cl"),
                              isLong ? kLongFlags + number : std::string("-Werror"),
                              isLong ? longIncludeDirs() : TstringArray()};
        std::ofstream(request.path) << kSource;
        fBuilt.push_back(build(request));
        fRequests.push_back(std::move(request));
    }
}

const char* Programs::source()
{
    return kSource;
}

std::string Programs::buildOptions(const KernelRequest& request)
{
    std::string options = request.flags;
    for (unsigned int index = 0; index < request.includeDirs.length(); ++index)
        options += std::string(" -I\"") + request.includeDirs[index].asChar() + '"';
    return options;
}

Programs::~Programs()
{
    for (cl_program program : fBuilt)
        clReleaseProgram(program);
    std::error_code ignored; // what is left lies in the folder for temporary files
    std::filesystem::remove_all(fFolder, ignored);
}
