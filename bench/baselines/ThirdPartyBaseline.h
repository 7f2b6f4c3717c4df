// Third-party libraries with the same purpose, as additional cases of the groups. The build selects
// them (VYRA_BENCH_BASELINES); by default there are none.
#pragma once

#include "harness/Group.h"

#include <array>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include <CL/cl.h>

class Programs;

// One third-party library, in the context and on the device of this library. Each operation returns
// the corresponding case of a group, or nothing if the library has no such operation. The bodies
// own their data and borrow the arguments, which must outlive them. May throw std::runtime_error if
// the library cannot use the context or the device.
class ThirdPartyBaseline {
public:
    virtual ~ThirdPartyBaseline() = default;

    virtual std::string name() const = 0;

    // Creates and releases a kernel of each program in turn, from the library's program cache.
    virtual std::optional<Case> kernelHits(const Programs& /*programs*/) const { return {}; }
    // Creates and releases buffers of these sizes in bytes in turn, kBuffersTaken at a time.
    virtual std::optional<Case> bufferReuse(const std::vector<std::size_t>& /*sizes*/) const
    {
        return {};
    }
    // Creates, writes and releases a buffer; for libraries with a pool.
    virtual std::optional<Case> writtenReuse(std::size_t /*bytes*/,
                                             void (* /*write*/)(cl_mem, std::size_t bytes)) const
    {
        return {};
    }
    // Fills a wait list with the events and destroys it.
    virtual std::optional<Case> waitList(const std::vector<cl_event>& /*events*/) const
    {
        return {};
    }
    // Uploads the contents to the buffer, which has the same size, and waits.
    virtual std::optional<Case> upload(cl_mem /*buffer*/,
                                       const std::vector<char>& /*contents*/) const
    {
        return {};
    }
};

// Returns the libraries that the program was built with.
const std::vector<const ThirdPartyBaseline*>& thirdPartyBaselines();

// Adds the case that `make` creates for each library. It has the library's name, the number of
// operations of the group's first case, and no goal.
void addThirdPartyBaselines(
    Group& group, const std::function<std::optional<Case>(const ThirdPartyBaseline&)>& make);

// The number of buffers that an evaluation takes from the pool.
constexpr std::size_t kBuffersTaken = 8;

// Returns a body that creates buffers of these sizes in turn. `create` takes a size in bytes and
// returns an owner. One buffer of each size is created beforehand, to fill the pool.
template <typename Create>
Body takingBuffers(const std::vector<std::size_t>& sizes, Create create)
{
    using Buffer = decltype(create(sizes.front()));
    {
        std::vector<Buffer> live;
        live.reserve(sizes.size());
        for (const std::size_t bytes : sizes)
            live.push_back(create(bytes));
    }
    return [sizes, create, next = std::size_t{0}](std::size_t turns) mutable {
        return timedLoop(turns, [&] {
            std::array<Buffer, kBuffersTaken> taken;
            for (Buffer& buffer : taken)
                buffer = create(sizes[next++ % sizes.size()]);
        });
    };
}
