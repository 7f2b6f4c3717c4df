// The software sharing layer: acquire and release relative to markers with the same wait lists.
#include "cases/Cases.h"
#include "fixtures/GLBuffers.h"
#include "fixtures/Runtime.h"
#include "glshare.h"

#include <memory>
#include <stdexcept>

#include <CL/cl_gl.h>

namespace {

// Returns the layer's counters; all are zero if it is not active.
glshare_counters countersOfLayer()
{
    glshare_counters counters{};
    cl_platform_id platform = nullptr;
    clGetPlatformIDs(1, &platform, nullptr);
    if (const auto getCounters = reinterpret_cast<glshare_get_counters_fn>(
            clGetExtensionFunctionAddressForPlatform(platform, GLSHARE_GET_COUNTERS_NAME)))
        getCounters(&counters);
    return counters;
}

class SharedMemory {
public:
    SharedMemory(Runtime& runtime, std::size_t count) : fBuffers(runtime, count)
    {
        for (const unsigned name : fBuffers.names()) {
            cl_int status = CL_SUCCESS;
            fMemory.push_back(
                clCreateFromGLBuffer(Runtime::context(), CL_MEM_READ_WRITE, name, &status));
            if (status != CL_SUCCESS)
                throw std::runtime_error("a buffer of the renderer cannot be shared");
        }
        requireNoCopies();
    }
    ~SharedMemory()
    {
        for (cl_mem memory : fMemory)
            clReleaseMemObject(memory);
    }
    SharedMemory(const SharedMemory&) = delete;
    SharedMemory& operator=(const SharedMemory&) = delete;

    void acquireAndRelease()
    {
        const auto count = static_cast<cl_uint>(fMemory.size());
        cl_event acquired = nullptr;
        clEnqueueAcquireGLObjects(Runtime::queue(), count, fMemory.data(), 0, nullptr, &acquired);
        clEnqueueReleaseGLObjects(Runtime::queue(), count, fMemory.data(), 1, &acquired, nullptr);
        clReleaseEvent(acquired);
        clFinish(Runtime::queue());
    }
    static void placeMarkers()
    {
        cl_event first = nullptr;
        clEnqueueMarkerWithWaitList(Runtime::queue(), 0, nullptr, &first);
        clEnqueueMarkerWithWaitList(Runtime::queue(), 1, &first, nullptr);
        clReleaseEvent(first);
        clFinish(Runtime::queue());
    }

private:
    void requireNoCopies()
    {
        const std::uint64_t copiedBefore = countersOfLayer().bytes_copied;
        acquireAndRelease();
        if (countersOfLayer().bytes_copied != copiedBefore)
            throw std::runtime_error("sharing copied bytes; set GLSHARE_ZERO_COPY=1");
    }

    GLBuffers fBuffers; // outlives the memory objects made from it
    std::vector<cl_mem> fMemory;
};

// Per buffer.
Group sharing(const std::string& name, Runtime& runtime, std::size_t count)
{
    constexpr double kLimit = 1000;
    const auto memory = std::make_shared<SharedMemory>(runtime, count);
    const auto perBuffer = static_cast<double>(count);
    return {name,
            {{"2 markers, finish",
              [](std::size_t times) { return timedLoop(times, SharedMemory::placeMarkers); },
              {},
              perBuffer},
             {"acquire, release, finish",
              [memory](std::size_t times) {
                  return timedLoop(times, [&] { memory->acquireAndRelease(); });
              },
              Goal::nanoseconds(kLimit), perBuffer}}};
}

} // namespace

std::vector<GroupFactory> sharingGroups(Runtime* runtime)
{
    const std::string name = "glshare, 256 buffers in place";
    return {{name, [=] { return sharing(name, *runtime, 256); }}};
}
