// Other libraries that do what ours does, as further cases of our groups. Which ones there are is
// chosen when the project is configured (VYRA_BENCH_PEERS); by default there are none.
#pragma once

#include "harness/Group.h"

#include <array>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include <CL/cl.h>

class Programs;

// One library. Each operation gives the case that belongs beside ours in the same group, or nothing
// where the library has nothing like it. Peers work in the context and on the device of the
// library, and may throw where they find those unusable. What a body works on goes with the body;
// an argument that is borrowed outlives it.
class Peer {
public:
    virtual ~Peer() = default;

    virtual std::string name() const = 0;

    // A kernel of each program in turn, from the peer's program cache, made and released.
    virtual std::optional<Case> kernelHits(const Programs& /*programs*/) const { return {}; }
    // Buffers of these many bytes in turn, kBuffersTaken at a time, made and given back.
    virtual std::optional<Case> bufferReuse(const std::vector<std::size_t>& /*sizes*/) const
    {
        return {};
    }
    // A buffer made, written and given back, where that differs from creating and releasing one.
    virtual std::optional<Case> writtenReuse(std::size_t /*bytes*/,
                                             void (* /*write*/)(cl_mem, std::size_t bytes)) const
    {
        return {};
    }
    // A list filled with the events, then dropped.
    virtual std::optional<Case> waitList(const std::vector<cl_event>& /*events*/) const
    {
        return {};
    }
    // The contents written to the buffer, which is as large, and waited for.
    virtual std::optional<Case> upload(cl_mem /*buffer*/,
                                       const std::vector<char>& /*contents*/) const
    {
        return {};
    }
};

// Those that the program was built with.
const std::vector<const Peer*>& peers();

// Adds the case that `make` takes from each peer. It is per operation of the group's baseline,
// under the peer's name, and has no goal.
void addPeers(Group& group, const std::function<std::optional<Case>(const Peer&)>& make);

// As many buffers at a time as an evaluation of ours takes.
constexpr std::size_t kBuffersTaken = 8;

// Takes buffers of the sizes in turn from `create`, which is given bytes and returns an owner. All
// sizes are live at once before the first turn, so that a pool knows them.
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
