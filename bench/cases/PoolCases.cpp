// The buffer pool relative to creating and releasing memory each time.
#include "baselines/ThirdPartyBaseline.h"
#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBufferPool.h"
#include "cases/Cases.h"
#include "fixtures/Runtime.h"

#include <algorithm>
#include <array>
#include <memory>
#include <random>

namespace {

constexpr unsigned int kElementBytes = 16;

TopenCLDataBufferDescriptor describe(unsigned int bytes)
{
    return {Tplug(1, 2),   TopenCLData::sPositionsName(), TopenCLDataBufferDescriptor::kReadWrite,
            kElementBytes, bytes / kElementBytes,         0};
}

cl_mem createMemory(std::size_t bytes)
{
    cl_int status = CL_SUCCESS;
    return clCreateBuffer(Runtime::context(), CL_MEM_READ_WRITE, bytes, nullptr, &status);
}

// A pool with a number of free entries of different sizes. An evaluation takes some of them in
// random order, then releases all.
class FreeEntries {
public:
    explicit FreeEntries(std::size_t count)
    {
        constexpr unsigned int kSmallest = 1024; // bytes
        for (std::size_t index = 0; index < count; ++index)
            fRequests.push_back(
                describe(kSmallest + kElementBytes * static_cast<unsigned int>(index)));
        std::shuffle(fRequests.begin(), fRequests.end(), fRandom);
        for (const TopenCLDataBufferDescriptor& request : fRequests)
            fPool.createBuffer(request);
        fPool.releaseBuffers();
        std::shuffle(fRequests.begin(), fRequests.end(), fRandom);
    }

    void evaluate()
    {
        {
            std::array<TopenCLDataBuffer, kBuffersTaken> taken;
            for (TopenCLDataBuffer& buffer : taken)
                buffer = fPool.createBuffer(next());
        }
        fPool.releaseBuffers();
    }

    void evaluateDirectly()
    {
        std::array<cl_mem, kBuffersTaken> taken;
        for (cl_mem& memory : taken)
            memory = createMemory(bytesOf(next()));
        for (cl_mem memory : taken)
            clReleaseMemObject(memory);
    }

    // Returns the sizes in bytes, in the order in which evaluations take the buffers.
    std::vector<std::size_t> sizes() const
    {
        std::vector<std::size_t> all;
        for (const TopenCLDataBufferDescriptor& request : fRequests)
            all.push_back(bytesOf(request));
        return all;
    }

private:
    static std::size_t bytesOf(const TopenCLDataBufferDescriptor& request)
    {
        return std::size_t{request.elementCount()} * kElementBytes;
    }
    const TopenCLDataBufferDescriptor& next() { return fRequests[fNext++ % fRequests.size()]; }

    TopenCLDataBufferPool fPool;
    std::vector<TopenCLDataBufferDescriptor> fRequests;
    std::size_t fNext = 0;
    std::mt19937 fRandom{1};
};

Group reuse(const std::string& name, std::size_t count, Goal goal)
{
    const auto entries = std::make_shared<FreeEntries>(count);
    Group group{name,
                {{"create, release",
                  [entries](std::size_t evaluations) {
                      return timedLoop(evaluations, [&] { entries->evaluateDirectly(); });
                  },
                  {},
                  kBuffersTaken},
                 {"createBuffer, releaseBuffers",
                  [entries](std::size_t evaluations) {
                      return timedLoop(evaluations, [&] { entries->evaluate(); });
                  },
                  goal, kBuffersTaken}}};
    addThirdPartyBaselines(group, [&](const ThirdPartyBaseline& library) {
        return library.bufferReuse(entries->sizes());
    });
    return group;
}

// Fills the whole buffer, like a kernel its output, and waits.
void write(cl_mem memory, std::size_t bytes)
{
    constexpr cl_float4 kPattern{{1, 2, 3, 4}};
    clEnqueueFillBuffer(Runtime::queue(), memory, &kPattern, sizeof kPattern, 0, bytes, 0, nullptr,
                        nullptr);
    clFinish(Runtime::queue());
}

// The system must map and clear new memory on its first use, unless the allocator reuses released
// memory; see MALLOC_MMAP_THRESHOLD_ in scripts/bench.
struct WrittenBuffer {
    TopenCLDataBufferPool pool;
    std::size_t bytes;

    cl_mem kept;

    explicit WrittenBuffer(std::size_t size) : bytes(size), kept(createMemory(size)) {}
    ~WrittenBuffer() { clReleaseMemObject(kept); }
    WrittenBuffer(const WrittenBuffer&) = delete;
    WrittenBuffer& operator=(const WrittenBuffer&) = delete;

    void evaluate()
    {
        {
            const TopenCLDataBuffer buffer =
                pool.createBuffer(describe(static_cast<unsigned int>(bytes)));
            write(buffer.buffer().get(), bytes);
        }
        pool.releaseBuffers();
    }

    // Writes into existing memory: the cost without the creation of memory.
    void rewrite() const { write(kept, bytes); }

    void evaluateDirectly() const
    {
        cl_mem memory = createMemory(bytes);
        write(memory, bytes);
        clReleaseMemObject(memory);
    }
};

Group reuseWritten(const std::string& name, std::size_t bytes, double limit)
{
    const auto buffer = std::make_shared<WrittenBuffer>(bytes);
    Group group{
        name,
        {{"create, write, release",
          [buffer](std::size_t count) {
              return timedLoop(count, [&] { buffer->evaluateDirectly(); });
          }},
         {"the write alone",
          [buffer](std::size_t count) { return timedLoop(count, [&] { buffer->rewrite(); }); }},
         {"createBuffer, write, releaseBuffers",
          [buffer](std::size_t count) { return timedLoop(count, [&] { buffer->evaluate(); }); },
          Goal::ratio(limit)}}};
    addThirdPartyBaselines(group, [&](const ThirdPartyBaseline& library) {
        return library.writtenReuse(bytes, write);
    });
    return group;
}

} // namespace

std::vector<GroupFactory> poolGroups()
{
    std::vector<GroupFactory> groups;
    const auto add = [&groups](const std::string& name, auto make, auto... arguments) {
        groups.push_back({name, [=] { return make(name, arguments...); }});
    };
    const auto goalAt = [](std::size_t count) {
        if (count <= 64)
            return Goal::ratio(1.0);
        return count == 256 ? Goal::ratio(3.0) : Goal();
    };
    for (const std::size_t count : {16u, 64u, 256u, 1024u, 4096u})
        add("pool hit, " + std::to_string(count) + " free", reuse, count, goalAt(count));
    add("pool hit, written, 1 MiB", reuseWritten, std::size_t{1} << 20, 0.06);
    add("pool hit, written, 16 MiB", reuseWritten, std::size_t{16} << 20, 0.2);
    return groups;
}
