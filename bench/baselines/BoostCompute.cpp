// Boost.Compute: a program cache, owners of OpenCL objects, and a wait list that owns its events.
#include "baselines/AllBaselines.h"
#include "fixtures/Programs.h"
#include "fixtures/Runtime.h"

#include <memory>

#include <boost/compute/algorithm/copy.hpp>
#include <boost/compute/buffer.hpp>
#include <boost/compute/command_queue.hpp>
#include <boost/compute/context.hpp>
#include <boost/compute/iterator/buffer_iterator.hpp>
#include <boost/compute/kernel.hpp>
#include <boost/compute/utility/program_cache.hpp>
#include <boost/compute/utility/wait_list.hpp>

namespace compute = boost::compute;

namespace {

// The path is the key. The cache takes include directories as options, so they are joined in
// advance.
class CachedPrograms {
public:
    explicit CachedPrograms(const Programs& programs)
        : fCache(programs.requests().size()), fRequests(programs.requests()),
          fKernelName(KernelRequest::kKernelName)
    {
        for (const KernelRequest& request : fRequests)
            fOptions.push_back(Programs::buildOptions(request));
        takeTurns(fRequests.size());
    }

    void takeTurns(std::size_t count)
    {
        for (std::size_t index = 0; index < count; ++index) {
            const std::size_t turn = index % fRequests.size();
            const compute::kernel kernel(
                fCache.get_or_build(fRequests[turn].path, fOptions[turn], fSource, fContext),
                fKernelName);
            keep(kernel);
        }
    }

private:
    compute::context fContext{Runtime::context()};
    compute::program_cache fCache;
    const std::vector<KernelRequest>& fRequests;
    std::vector<std::string> fOptions;
    std::string fSource{Programs::source()};
    std::string fKernelName;
};

class BoostCompute : public ThirdPartyBaseline {
public:
    std::string name() const override { return "Boost.Compute"; }

    std::optional<Case> kernelHits(const Programs& programs) const override
    {
        const auto cached = std::make_shared<CachedPrograms>(programs);
        return Case{"program_cache, kernel", [cached](std::size_t count) {
                        return timed([&] { cached->takeTurns(count); });
                    }};
    }

    std::optional<Case> bufferReuse(const std::vector<std::size_t>& sizes) const override
    {
        const compute::context context(Runtime::context());
        return Case{"buffer, no pool", takingBuffers(sizes, [context](std::size_t bytes) {
                        return compute::buffer(context, bytes);
                    })};
    }

    std::optional<Case> waitList(const std::vector<cl_event>& events) const override
    {
        const std::vector<compute::event> held(events.begin(), events.end());
        return Case{"wait_list", [held](std::size_t count) {
                        return timedLoop(count, [&] {
                            compute::wait_list list;
                            for (const compute::event& event : held)
                                list.insert(event);
                            keep(list);
                        });
                    }};
    }

    std::optional<Case> upload(cl_mem memory, const std::vector<char>& contents) const override
    {
        const compute::buffer buffer(memory);
        compute::command_queue queue(Runtime::queue());
        return Case{"copy", [buffer, queue, &contents](std::size_t count) mutable {
                        return timedLoop(count, [&] {
                            compute::copy(contents.begin(), contents.end(),
                                          compute::make_buffer_iterator<char>(buffer), queue);
                        });
                    }};
    }
};

} // namespace

const ThirdPartyBaseline& boostCompute()
{
    static const BoostCompute library;
    return library;
}
