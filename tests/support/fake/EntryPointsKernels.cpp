// Entry points of kernel arguments and kernel commands. A kernel has the arguments that its
// source declares; one that is declared with a '*' is a memory object.
#include "fake/Entry.h"

#include <cstring>

using namespace scripted;

namespace {

// The memory objects that the kernel's arguments name, alive or not.
Mems memoryOf(Entry& call, const Object& kernel)
{
    Mems mems;
    for (const KernelArgument& argument : kernel.arguments) {
        call.require(argument.set, CL_INVALID_KERNEL_ARGS, "an argument is not set");
        if (argument.mem)
            mems.push_back(argument.mem);
    }
    return mems;
}

} // namespace

extern "C" {

cl_int clGetKernelInfo(cl_kernel kernel, cl_kernel_info query, std::size_t capacity, void* value,
                       std::size_t* size)
{
    Entry call("clGetKernelInfo", kernel, query);
    const Object* object = call.object(Kind::kKernel, kernel);
    call.require(query == CL_KERNEL_NUM_ARGS, CL_INVALID_VALUE, "unknown query");
    const auto count = static_cast<cl_uint>(object ? object->arguments.size() : 0);
    return call.answer(query, &count, sizeof count, capacity, value, size);
}

cl_int clSetKernelArg(cl_kernel kernel, cl_uint index, std::size_t size, const void* value)
{
    KernelArgument argument{.set = true};
    if (size == sizeof(cl_mem) && value)
        std::memcpy(&argument.mem, value, size);
    Entry call("clSetKernelArg", kernel, index, size, static_cast<const void*>(argument.mem));
    Object* object = call.object(Kind::kKernel, kernel);
    if (!object || !call.require(index < object->arguments.size(), CL_INVALID_ARG_INDEX,
                                 "no argument of this index"))
        return call.status();
    KernelArgument& target = object->arguments[index];
    argument.isMemory = target.isMemory;
    if (!argument.isMemory)
        argument.mem = nullptr;
    else if (call.require(size == sizeof(cl_mem), CL_INVALID_ARG_SIZE, "not of a memory object"))
        call.require(!argument.mem || call.object(Kind::kMem, argument.mem), CL_INVALID_MEM_OBJECT,
                     "argument " + std::to_string(index) + " is dead");
    if (call.ok())
        target = argument;
    return call.status();
}

cl_int clEnqueueNDRangeKernel(cl_command_queue queue, cl_kernel kernel, cl_uint dimensions,
                              const std::size_t* offset, const std::size_t* global,
                              const std::size_t* local, cl_uint waitCount, const cl_event* waitList,
                              cl_event* event)
{
    const WaitList list{waitCount, waitList};
    Entry call("clEnqueueNDRangeKernel", queue, kernel, *global, *local, list);
    call.require(dimensions == 1 && !offset, CL_INVALID_WORK_DIMENSION, "not one dimension");
    call.require(*local > 0 && *global % *local == 0, CL_INVALID_WORK_GROUP_SIZE,
                 "work-groups of different sizes");
    const Object* object = call.object(Kind::kKernel, kernel);
    const Mems mems = object ? memoryOf(call, *object) : Mems{};
    call.describe(" on ", List<cl_mem>{static_cast<cl_uint>(mems.size()), mems.data()});
    return call.command(queue, list, event, mems);
}

} // extern "C"
