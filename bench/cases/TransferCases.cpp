// Uploads, read-backs and growth of the growable buffer.
#include "baselines/ThirdPartyBaseline.h"
#include "buffers/TopenCLBuffer.h"
#include "cases/Cases.h"
#include "fixtures/Runtime.h"

#include <memory>

namespace {

std::string sizeText(std::size_t bytes)
{
    return bytes < 1'000'000 ? std::to_string(bytes >> 10) + " KiB"
                             : std::to_string(bytes / 1'000'000) + "." +
                                   std::to_string(bytes / 100'000 % 10) + " MB";
}

// Host and device memory, the same for the library and for the direct calls.
struct Transfer {
    std::vector<char> contents;
    TopenCLBuffer buffer{Runtime::context(), CL_MEM_READ_WRITE};
    cl_command_queue queue = Runtime::queue();

    explicit Transfer(std::size_t bytes) : contents(bytes, 1)
    {
        buffer.ensureBufferCapacity(bytes);
        uploadDirectly();
    }

    void upload()
    {
        buffer.uploadDataToGPU(queue, CL_FALSE, 0, contents.size(), contents.data(), 0, nullptr);
        waitForReadyEvent();
    }
    void uploadDirectly()
    {
        cl_event done = nullptr;
        clEnqueueWriteBuffer(queue, buffer.buffer().get(), CL_FALSE, 0, contents.size(),
                             contents.data(), 0, nullptr, &done);
        waitFor(done);
    }
    void readBack()
    {
        buffer.readBackDataFromGPU(queue, CL_FALSE, 0, contents.size(), contents.data(), 0,
                                   nullptr);
        waitForReadyEvent();
    }
    void readBackDirectly()
    {
        cl_event done = nullptr;
        clEnqueueReadBuffer(queue, buffer.buffer().get(), CL_FALSE, 0, contents.size(),
                            contents.data(), 0, nullptr, &done);
        waitFor(done);
    }
    void grow()
    {
        TopenCLBuffer growing(Runtime::context(), CL_MEM_READ_WRITE);
        growing.uploadDataToGPU(queue, CL_FALSE, 0, contents.size(), contents.data(), 0, nullptr);
    }
    void growDirectly()
    {
        cl_int status = CL_SUCCESS;
        cl_mem memory = clCreateBuffer(Runtime::context(), CL_MEM_READ_WRITE | CL_MEM_COPY_HOST_PTR,
                                       contents.size(), contents.data(), &status);
        clReleaseMemObject(memory);
    }

private:
    static void waitFor(cl_event done)
    {
        clWaitForEvents(1, &done);
        clReleaseEvent(done);
    }
    void waitForReadyEvent()
    {
        const cl_event done = buffer.bufferReadyEvent().get();
        clWaitForEvents(1, &done);
        buffer.bufferReadyEvent().reset();
    }
};

using Operation = void (Transfer::*)();

struct Pair {
    const char* directName;
    Operation direct;
    const char* name;
    Operation operation;
    double limit;
    // The case of a third-party library; null if there is none.
    std::optional<Case> (ThirdPartyBaseline::*baselineCase)(
        cl_mem, const std::vector<char>&) const = nullptr;
};

Group transfer(const std::string& name, const Pair& pair, std::size_t bytes)
{
    const auto shared = std::make_shared<Transfer>(bytes);
    const auto repeat = [shared](Operation operation) {
        return [shared, operation](std::size_t count) {
            return timedLoop(count, [&] { (*shared.*operation)(); });
        };
    };
    Group group{name,
                {{pair.directName, repeat(pair.direct)},
                 {pair.name, repeat(pair.operation), Goal::ratio(pair.limit)}}};
    if (pair.baselineCase)
        addThirdPartyBaselines(group, [&](const ThirdPartyBaseline& library) {
            return (library.*pair.baselineCase)(shared->buffer.buffer().get(), shared->contents);
        });
    return group;
}

} // namespace

std::vector<GroupFactory> transferGroups()
{
    constexpr Pair kUpload{"enqueue write, wait",
                           &Transfer::uploadDirectly,
                           "uploadDataToGPU",
                           &Transfer::upload,
                           1.02,
                           &ThirdPartyBaseline::upload};
    constexpr Pair kReadBack{"enqueue read, wait", &Transfer::readBackDirectly,
                             "readBackDataFromGPU", &Transfer::readBack, 1.02};
    constexpr Pair kGrowth{"create with host pointer", &Transfer::growDirectly,
                           "uploadDataToGPU, growing", &Transfer::grow, 1.05};
    std::vector<GroupFactory> groups;
    const auto add = [&groups](const char* name, const Pair& pair, std::size_t bytes) {
        const std::string full = std::string(name) + ", " + sizeText(bytes);
        groups.push_back({full, [=] { return transfer(full, pair, bytes); }});
    };
    // The positions of 4,096, 100,000 and 1,000,000 vertices.
    for (const std::size_t bytes :
         {std::size_t{48} << 10, std::size_t{1'200'000}, std::size_t{12'000'000}}) {
        add("upload", kUpload, bytes);
        add("read-back", kReadBack, bytes);
        add("growth at offset 0", kGrowth, bytes);
    }
    return groups;
}
