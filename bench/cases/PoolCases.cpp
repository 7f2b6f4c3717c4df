// The buffer pool beside creating and releasing memory each time.
#include "Runtime.h"
#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBufferPool.h"
#include "cases/Cases.h"

#include <algorithm>
#include <array>
#include <memory>
#include <random>

#include <malloc.h>

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

// A pool with a number of free entries, all of different sizes. An evaluation takes some of them,
// in an order that has nothing to do with that of giving back, then gives all back.
class FreeEntries {
public:
    static constexpr std::size_t kTaken = 8; // buffers per evaluation

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
            std::array<TopenCLDataBuffer, kTaken> taken;
            for (TopenCLDataBuffer& buffer : taken)
                buffer = fPool.createBuffer(next());
        }
        fPool.releaseBuffers();
    }

    void evaluateByHand()
    {
        std::array<cl_mem, kTaken> taken;
        for (cl_mem& memory : taken) {
            const TopenCLDataBufferDescriptor& request = next();
            memory = createMemory(std::size_t{request.elementCount()} * kElementBytes);
        }
        for (cl_mem memory : taken)
            clReleaseMemObject(memory);
    }

private:
    const TopenCLDataBufferDescriptor& next() { return fRequests[fNext++ % fRequests.size()]; }

    TopenCLDataBufferPool fPool;
    std::vector<TopenCLDataBufferDescriptor> fRequests;
    std::size_t fNext = 0;
    std::mt19937 fRandom{1};
};

Group reuse(const std::string& name, std::size_t count, Goal goal)
{
    const auto entries = std::make_shared<FreeEntries>(count);
    return {name,
            {{"create, release",
              [entries](std::size_t evaluations) {
                  return timedLoop(evaluations, [&] { entries->evaluateByHand(); });
              },
              {},
              FreeEntries::kTaken},
             {"createBuffer, releaseBuffers",
              [entries](std::size_t evaluations) {
                  return timedLoop(evaluations, [&] { entries->evaluate(); });
              },
              goal, FreeEntries::kTaken}}};
}

// An allocator that gives memory back to the system at once, as it does when there is much of it:
// memory that is created anew must then be mapped and cleared again. For the life of the object.
class ColdAllocator {
public:
    ColdAllocator() { set(kSmall); }
    ~ColdAllocator() { set(kDefault); }
    ColdAllocator(const ColdAllocator&) = delete;
    ColdAllocator& operator=(const ColdAllocator&) = delete;

private:
    // Bytes from which an allocation is the system's own, and of free memory that is kept.
    static constexpr int kSmall = 64 << 10;
    static constexpr int kDefault = 128 << 10;

    static void set(int bytes)
    {
        mallopt(M_MMAP_THRESHOLD, bytes);
        mallopt(M_TRIM_THRESHOLD, bytes);
    }
};

void write(cl_mem memory, const std::vector<char>& contents)
{
    clEnqueueWriteBuffer(Runtime::queue(), memory, CL_TRUE, 0, contents.size(), contents.data(), 0,
                         nullptr, nullptr);
}

struct WrittenBuffer {
    ColdAllocator allocator;
    TopenCLDataBufferPool pool;
    std::vector<char> contents;

    explicit WrittenBuffer(std::size_t bytes) : contents(bytes, 1) {}

    void evaluate()
    {
        {
            const TopenCLDataBuffer buffer =
                pool.createBuffer(describe(static_cast<unsigned int>(contents.size())));
            write(buffer.buffer().get(), contents);
        }
        pool.releaseBuffers();
    }

    void evaluateByHand() const
    {
        cl_mem memory = createMemory(contents.size());
        write(memory, contents);
        clReleaseMemObject(memory);
    }
};

Group reuseWritten(const std::string& name, std::size_t bytes, double limit)
{
    const auto buffer = std::make_shared<WrittenBuffer>(bytes);
    return {name,
            {{"create, write, release",
              [buffer](std::size_t count) {
                  return timedLoop(count, [&] { buffer->evaluateByHand(); });
              }},
             {"createBuffer, write, releaseBuffers",
              [buffer](std::size_t count) { return timedLoop(count, [&] { buffer->evaluate(); }); },
              Goal::ratio(limit)}}};
}

} // namespace

std::vector<GroupMaker> poolGroups()
{
    std::vector<GroupMaker> groups;
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
