// Entry points of programs and kernels. A program builds unless its source holds "#error", and has
// every kernel whose name its source mentions.
#include "fake/Entry.h"

#include <sstream>

using namespace scripted;

namespace {

// What the source declares in parentheses after the name; nothing if there are none.
std::vector<KernelArgument> argumentsOf(const std::string& name, const std::string& source)
{
    std::vector<KernelArgument> arguments;
    const std::size_t declaration = source.find(name + '(');
    if (declaration == std::string::npos)
        return arguments;
    const std::size_t begin = declaration + name.size() + 1;
    std::istringstream list(source.substr(begin, source.find(')', begin) - begin));
    for (std::string argument; std::getline(list, argument, ',');)
        arguments.push_back({.isMemory = argument.find('*') != std::string::npos});
    return arguments;
}

} // namespace

extern "C" {

cl_program clCreateProgramWithSource(cl_context context, cl_uint count, const char** sources,
                                     const std::size_t* lengths, cl_int* error)
{
    Entry call("clCreateProgramWithSource", context, count, sources[0], lengths);
    call.object(Kind::kContext, context);
    const auto program = call.create<cl_program>(Kind::kProgram);
    if (program)
        call.object(Kind::kProgram, program)->source = sources[0];
    return call.result(program, error);
}

cl_int clBuildProgram(cl_program program, cl_uint deviceCount, const cl_device_id* devices,
                      const char* options, void(CL_CALLBACK* notify)(cl_program, void*),
                      void* userData)
{
    Entry call("clBuildProgram", program, List<cl_device_id>{deviceCount, devices}, options);
    Object* object = call.object(Kind::kProgram, program);
    for (cl_uint i = 0; i < deviceCount; ++i)
        call.object(Kind::kDevice, devices[i]);
    call.require(!notify && !userData, CL_INVALID_VALUE, "not synchronous");
    if (!object || (!call.ok() && !call.withHandle()))
        return call.status();
    object->built = object->source.find("#error") == std::string::npos;
    return object->built ? call.status() : call.answerWith(CL_BUILD_PROGRAM_FAILURE);
}

cl_int clGetProgramBuildInfo(cl_program program, cl_device_id device, cl_program_build_info query,
                             std::size_t capacity, void* value, std::size_t* size)
{
    Entry call("clGetProgramBuildInfo", program, device, query);
    const Object* object = call.object(Kind::kProgram, program);
    call.object(Kind::kDevice, device);
    if (!call.ok())
        return call.status();
    if (query == CL_PROGRAM_BUILD_LOG)
        return call.answer(query, call.machine().buildLog, capacity, value, size);
    call.require(query == CL_PROGRAM_BUILD_STATUS, CL_INVALID_VALUE, "unknown query");
    const cl_build_status status = object->built ? CL_BUILD_SUCCESS : CL_BUILD_ERROR;
    return call.answer(query, &status, sizeof status, capacity, value, size);
}

cl_kernel clCreateKernel(cl_program program, const char* name, cl_int* error)
{
    Entry call("clCreateKernel", program, name);
    const Object* object = call.object(Kind::kProgram, program);
    call.require(!object || object->built, CL_INVALID_PROGRAM_EXECUTABLE, "not built");
    if (call.ok() && object && object->source.find(name) == std::string::npos)
        call.answerWith(CL_INVALID_KERNEL_NAME);
    if (const cl_kernel scripted = call.nextKernel()) {
        call.retain(Kind::kKernel, scripted);
        return call.result(scripted, error);
    }
    const auto kernel = call.create<cl_kernel>(Kind::kKernel);
    if (kernel && object)
        call.object(Kind::kKernel, kernel)->arguments = argumentsOf(name, object->source);
    return call.result(kernel, error);
}

cl_int clGetKernelWorkGroupInfo(cl_kernel kernel, cl_device_id device,
                                cl_kernel_work_group_info query, std::size_t capacity, void* value,
                                std::size_t* size)
{
    Entry call("clGetKernelWorkGroupInfo", kernel, device, query);
    call.object(Kind::kKernel, kernel);
    const Object* object = call.object(Kind::kDevice, device);
    call.require(query == CL_KERNEL_WORK_GROUP_SIZE, CL_INVALID_VALUE, "unknown query");
    if (!call.ok())
        return call.status();
    const std::size_t groupSize = call.script(*object).workGroupSize;
    return call.answer(query, &groupSize, sizeof groupSize, capacity, value, size);
}

} // extern "C"
