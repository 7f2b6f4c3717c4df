// The C++ bindings of OpenCL: owners of OpenCL objects, without a cache and without a pool.
#define CL_HPP_TARGET_OPENCL_VERSION 120
#define CL_HPP_MINIMUM_OPENCL_VERSION 120
#define CL_HPP_ENABLE_EXCEPTIONS

#include "baselines/AllBaselines.h"
#include "fixtures/Programs.h"
#include "fixtures/Runtime.h"

#include <algorithm>
#include <iterator>

#include <CL/opencl.hpp>

namespace {

// The caller keeps its own reference.
constexpr bool kRetain = true;

template <typename Object, typename Handle>
std::vector<Object> holdersOf(const std::vector<Handle>& handles)
{
    std::vector<Object> held;
    held.reserve(handles.size());
    for (Handle handle : handles)
        held.emplace_back(handle, kRetain);
    return held;
}

class CppBindings : public ThirdPartyBaseline {
public:
    std::string name() const override { return "OpenCL C++ bindings"; }

    std::optional<Case> kernelHits(const Programs& programs) const override
    {
        const auto held = holdersOf<cl::Program>(programs.built());
        return Case{
            "Kernel of a held Program", [held](std::size_t count) {
                return timed([&] {
                    for (std::size_t index = 0; index < count; ++index)
                        keep(cl::Kernel(held[index % held.size()], KernelRequest::kKernelName));
                });
            }};
    }

    std::optional<Case> bufferReuse(const std::vector<std::size_t>& sizes) const override
    {
        const cl::Context context(Runtime::context(), kRetain);
        return Case{"Buffer, no pool", takingBuffers(sizes, [context](std::size_t bytes) {
                        return cl::Buffer(context, CL_MEM_READ_WRITE, bytes);
                    })};
    }

    std::optional<Case> waitList(const std::vector<cl_event>& events) const override
    {
        const auto held = holdersOf<cl::Event>(events);
        return Case{"vector<Event>", [held](std::size_t count) {
                        return timedLoop(count, [&] {
                            std::vector<cl::Event> list;
                            std::copy(held.begin(), held.end(), std::back_inserter(list));
                            keep(list);
                        });
                    }};
    }

    std::optional<Case> upload(cl_mem memory, const std::vector<char>& contents) const override
    {
        const cl::Buffer buffer(memory, kRetain);
        const cl::CommandQueue queue(Runtime::queue(), kRetain);
        return Case{"enqueueWriteBuffer, wait", [buffer, queue, &contents](std::size_t count) {
                        return timedLoop(count, [&] {
                            cl::Event done;
                            queue.enqueueWriteBuffer(buffer, CL_FALSE, 0, contents.size(),
                                                     contents.data(), nullptr, &done);
                            done.wait();
                        });
                    }};
    }
};

} // namespace

const ThirdPartyBaseline& cppBindings()
{
    static const CppBindings library;
    return library;
}
