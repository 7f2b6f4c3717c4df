// The growable device buffer: the calls of every operation in every state, its limits, its copies.
#include "Objects.h"
#include "ScriptedTest.h"
#include "buffers/TopenCLBuffer.h"

#include <functional>
#include <memory>
#include <tuple>

using namespace scripted;

namespace {

constexpr std::size_t kSize = 64; // of the memory in every state that has some
constexpr std::size_t kLimit = std::size_t{1} << 32;

using Descriptor = TopenCLDataBufferDescriptor;

enum class Content { kNone, kMemory, kPendingWrite, kWrapped };

struct State : Named {
    Content content;
    cl_mem_flags hostAccess;
    const char* mapFlags = nullptr; // null without a mapping
};
const State kStates[] = {
    {"Empty", Content::kNone, CL_MEM_HOST_NO_ACCESS},
    {"Allocated", Content::kMemory, CL_MEM_HOST_NO_ACCESS},
    {"Pending", Content::kPendingWrite, CL_MEM_HOST_NO_ACCESS},
    {"Wrapping", Content::kWrapped, CL_MEM_HOST_NO_ACCESS},
    // Writing takes precedence over reading.
    {"MappedWrite", Content::kMemory, CL_MEM_HOST_WRITE_ONLY | CL_MEM_HOST_READ_ONLY, "2"},
    {"MappedRead", Content::kMemory, CL_MEM_HOST_READ_ONLY, "1"},
    {"Mapped", Content::kMemory, 0, "0"}};

Lines operator+(Lines lines, const Lines& more)
{
    lines.insert(lines.end(), more.begin(), more.end());
    return lines;
}

// Not the queue that the library uses by itself.
cl_command_queue queue()
{
    return TopenCLInfo::theOne().secondaryOpenCLCommandQueue();
}
cl_context context()
{
    return TopenCLInfo::theOne().openCLContext();
}

// A buffer in a state, and the calls that its operations make: mem#1 is its memory, event#1 its
// event.
class Subject {
public:
    explicit Subject(const State& state)
        : fState(state), fFlags(CL_MEM_ALLOC_HOST_PTR | state.hostAccess)
    {
        buffer = std::make_unique<TopenCLBuffer>(context(), fFlags);
        if (hasMemory())
            buffer->ensureBufferCapacity(kSize);
        if (hasEvent())
            upload(0, 1);
        if (state.content != Content::kWrapped)
            return;
        // Element count times element size decides, not the capacity that is recorded.
        TopenCLDataBuffer data = buffer->openCLDataBuffer();
        data.descriptor().setElementCount(16);
        data.descriptor().setElementSizeInBytes(4);
        data.descriptor().setCapacityInBytes(1000);
        buffer = std::make_unique<TopenCLBuffer>(context(), fFlags, data);
    }

    int upload(std::size_t offset, std::size_t size, cl_uint waitCount = 0,
               const cl_event* waitList = nullptr)
    {
        return buffer->uploadDataToGPU(queue(), CL_FALSE, offset, size, kBytes.data(), waitCount,
                                       waitList);
    }
    // The wait list would be noted as misuse by the runtime.
    int uploadAfterNull(std::size_t offset, std::size_t size)
    {
        const cl_event null = nullptr;
        return upload(offset, size, 1, &null);
    }
    int uploadReadOnly(std::size_t offset, std::size_t size)
    {
        buffer->openCLDataBuffer().descriptor().setPermissions(Descriptor::kReadOnly);
        return upload(offset, size);
    }

    bool hasMemory() const { return fState.content != Content::kNone; }
    bool hasEvent() const { return fState.content >= Content::kPendingWrite; }

    Lines retaining() const { return counting("clRetain"); }
    Lines releasing() const { return counting("clRelease"); }
    Lines waiting() const
    {
        return hasEvent() ? Lines{"clWaitForEvents([event#1])", "clReleaseEvent(event#1)"}
                          : Lines{};
    }
    Lines dropping() const
    {
        Lines lines;
        if (hasMemory() && fState.content != Content::kWrapped)
            lines.push_back("ReduceFromDeviceMemory(64)");
        if (!fState.mapFlags)
            return lines + releasing();
        return lines + Lines{"clEnqueueUnmapMemObject(queue#1, mem#1, []) = event#1",
                             "clWaitForEvents([event#1])", "clReleaseMemObject(mem#1)",
                             "clReleaseEvent(event#1)"};
    }
    Lines growing(std::size_t size, bool hostData = false) const
    {
        const std::string bytes = std::to_string(size);
        const std::string mem = hasMemory() ? "mem#2" : "mem#1";
        const cl_mem_flags flags = fFlags | (hostData ? CL_MEM_COPY_HOST_PTR : 0);
        Lines lines{"AddToDeviceMemory(" + bytes + ")",
                    "clCreateBuffer(context#1, " + std::to_string(flags) + ", " + bytes + ", " +
                        (hostData ? "host+0" : "null") + ") = " + mem};
        if (fState.mapFlags && !hostData)
            lines.push_back("clEnqueueMapBuffer(queue#1, " + mem + ", 1, " + fState.mapFlags +
                            ", 0, " + bytes + ", [])");
        return dropping() + lines;
    }
    Lines writing(const std::string& mem, const std::string& range, bool afterEvent) const
    {
        return {"clEnqueueWriteBuffer(queue#2, " + mem + ", 0, " + range +
                ", host+0, []) = event#" + (afterEvent ? '2' : '1')};
    }
    Lines writingAfterGrowth() const
    {
        return growing(kSize + 16) +
               writing(hasMemory() ? "mem#2" : "mem#1", "64, 16", hasEvent() || fState.mapFlags);
    }
    Lines writingInPlace() const
    {
        return (hasEvent() ? Lines{"clReleaseEvent(event#1)"} : Lines{}) +
               writing("mem#1", "48, 16", hasEvent());
    }

    static std::array<char, 256> kBytes;
    std::unique_ptr<TopenCLBuffer> buffer;

private:
    Lines counting(const std::string& verb) const
    {
        Lines lines;
        if (hasMemory())
            lines.push_back(verb + "MemObject(mem#1)");
        if (hasEvent())
            lines.push_back(verb + "Event(event#1)");
        return lines;
    }

    const State& fState;
    cl_mem_flags fFlags;
};
std::array<char, 256> Subject::kBytes{};

using S = Subject;

struct Operation : Named {
    std::function<int(S&)> run;
    std::function<Lines(const S&)> calls;
    std::size_t capacity; // afterwards; kSame: as before
    int status = CL_SUCCESS;
};
constexpr std::size_t kSame = SIZE_MAX;

Lines none(const S&)
{
    return {};
}

int copyAndAssign(S& s)
{
    TopenCLBuffer copy(*s.buffer);
    TopenCLBuffer& itself = copy;
    copy = itself;
    copy = *s.buffer;
    EXPECT_EQ(copy.buffer().get(), s.buffer->buffer().get());
    EXPECT_EQ(copy.mappedPointer(), nullptr);
    return static_cast<int>(copy.capacityInBytes() - s.buffer->capacityInBytes());
}

// A row is a sentence, not a column.
// clang-format off
const Operation kOperations[] = {
    {"EnsureNothing", [](S& s) { return s.buffer->ensureBufferCapacity(0); }, [](const S& s) { return s.waiting(); }, kSame},
    {"EnsureTheSame", [](S& s) { return s.buffer->ensureBufferCapacity(s.buffer->capacityInBytes()); }, [](const S& s) { return s.waiting(); }, kSame},
    {"EnsureMore", [](S& s) { return s.buffer->ensureBufferCapacity(65); }, [](const S& s) { return s.growing(65); }, 65},
    {"EnsureMost", [](S& s) { return s.buffer->ensureBufferCapacity(kLimit - 1); }, [](const S& s) { return s.growing(kLimit - 1); }, kLimit - 1},
    {"EnsureTooMuch", [](S& s) { return s.buffer->ensureBufferCapacity(kLimit); }, none, kSame, CL_INVALID_BUFFER_SIZE},
    {"UploadFitting", [](S& s) { return s.hasMemory() ? s.upload(48, 16) : 0; }, [](const S& s) { return s.hasMemory() ? s.writingInPlace() : Lines{}; }, kSame},
    {"UploadGrowsAtTheStart", [](S& s) { return s.upload(0, 128); }, [](const S& s) { return s.growing(128, true); }, 128},
    {"UploadGrowsElsewhere", [](S& s) { return s.upload(64, 16); }, [](const S& s) { return s.writingAfterGrowth(); }, 80},
    {"UploadOfNothing", [](S& s) { return s.uploadAfterNull(0, 0); }, none, kSame},
    {"UploadOfTooMuch", [](S& s) { return s.uploadAfterNull(0, kLimit); }, none, kSame, CL_INVALID_BUFFER_SIZE},
    {"UploadEndsTooFar", [](S& s) { return s.uploadAfterNull(kLimit - 16, 16); }, none, kSame, CL_INVALID_BUFFER_SIZE},
    {"UploadEndOverflows", [](S& s) { return s.uploadAfterNull(SIZE_MAX, 2); }, none, kSame, CL_INVALID_BUFFER_SIZE},
    {"UploadOfNothingToReadOnly", [](S& s) { return s.uploadReadOnly(0, 0); }, none, kSame},
    {"UploadToReadOnly", [](S& s) { return s.uploadReadOnly(kLimit, 1); }, none, kSame, CL_INVALID_OPERATION},
    {"Reset", [](S& s) { s.buffer->reset(); s.buffer->reset(); return 0; }, [](const S& s) { return s.dropping(); }, 0},
    {"AssignEmpty", [](S& s) { *s.buffer = TopenCLBuffer(); return 0; }, [](const S& s) { return s.dropping(); }, 0},
    {"CopyAndAssign", copyAndAssign, [](const S& s) { return s.retaining() + s.releasing() + s.retaining() + s.releasing(); }, kSame},
};
// clang-format on

class BufferTest : public ScriptedTest {
protected:
    void SetUp() override
    {
        ASSERT_TRUE(start());
        runtime().setHostMemory(Subject::kBytes.data(), Subject::kBytes.size());
    }
    void TearDown() override
    {
        ScriptedTest::TearDown();
        EXPECT_EQ(deviceMemory(), 0U);
    }
};

class BufferInState : public BufferTest,
                      public ::testing::WithParamInterface<std::tuple<State, Operation>> {};

TEST_P(BufferInState, MakesTheCallsOfTheOperation)
{
    const auto& [state, operation] = GetParam();
    Subject subject(state);
    TopenCLBuffer& buffer = *subject.buffer;
    const std::size_t before = buffer.capacityInBytes();
    const bool wasMapped = buffer.mappedPointer() != nullptr;
    calls();
    EXPECT_EQ(operation.run(subject), operation.status);
    const Lines made = calls();
    EXPECT_EQ(made, operation.calls(subject));
    EXPECT_EQ(buffer.capacityInBytes(), operation.capacity == kSame ? before : operation.capacity);
    using namespace ::testing;
    const bool isUnmapped = Matches(Contains(StartsWith("clEnqueueUnmap")))(made);
    const bool isMapped = Matches(Contains(StartsWith("clEnqueueMap")))(made);
    EXPECT_EQ(buffer.mappedPointer() != nullptr, isMapped || (wasMapped && !isUnmapped));
}
INSTANTIATE_TEST_SUITE_P(Buffer, BufferInState,
                         ::testing::Combine(::testing::ValuesIn(kStates),
                                            ::testing::ValuesIn(kOperations)),
                         [](const auto& row) {
                             return std::string(std::get<0>(row.param).name) + '_' +
                                    std::get<1>(row.param).name;
                         });

const State& kPending = kStates[2];

TEST_F(BufferTest, WaitListsPassUnchangedOnWritesAndOnlyWithACountOnReads)
{
    Subject subject(kPending);
    TopenCLBuffer& buffer = *subject.buffer;
    char* bytes = Subject::kBytes.data();
    const AutoCLObject<cl_event> event = buffer.bufferReadyEvent();
    const cl_event list[] = {event.get(), event.get()};
    calls();
    buffer.uploadDataToGPU(queue(), CL_TRUE, 8, 4, bytes + 1, 2, list);
    buffer.readBackDataFromGPU(queue(), CL_TRUE, 4, 4, bytes + 2, 2, list);
    buffer.readBackDataFromGPU(queue(), CL_FALSE, 4, 4, bytes + 3, 0, list);
    EXPECT_EQ(
        callsOf("clEnqueue"),
        (Lines{
            "clEnqueueWriteBuffer(queue#2, mem#1, 1, 8, 4, host+1, [event#1, event#1]) = event#2",
            "clEnqueueReadBuffer(queue#2, mem#1, 1, 4, 4, host+2, [event#1, event#1]) = event#3",
            "clEnqueueReadBuffer(queue#2, mem#1, 0, 4, 4, host+3, []) = event#4"}));

    // A null list with a count, and a list without, are the caller's affair.
    subject.upload(0, 4, 0, list);
    expectMisuse("clEnqueueWriteBuffer: count and pointer of the wait list disagree");
}

TEST_F(BufferTest, AGrowingUploadWaitsForTheWaitListFirst)
{
    Subject subject(kPending);
    const AutoCLObject<cl_event> event = subject.buffer->bufferReadyEvent();
    const cl_event handle = event.get();
    calls();
    runtime().plan({.function = "clWaitForEvents"}); // neither reported nor returned
    EXPECT_EQ(subject.upload(0, 65, 1, &handle), 0);
    EXPECT_EQ(calls().front(), "clWaitForEvents([event#1]) ! -5");
    subject.upload(65, 4, 1, &handle);
    const Lines elsewhere = calls();
    EXPECT_EQ(elsewhere.front(), "clWaitForEvents([event#1])");
    EXPECT_THAT(elsewhere.back(), ::testing::HasSubstr("mem#3, 0, 65, 4, host+0, [event#1])"));
}

TEST_F(BufferTest, AReadBackChecksNeitherPermissionsNorCapacity)
{
    TopenCLBuffer buffer;
    buffer.ensureBufferCapacity(8);
    buffer.openCLDataBuffer().descriptor().setPermissions(Descriptor::kReadOnly);
    char bytes[8];
    // The checks of the runtime decide.
    for (const std::size_t size : {8, 0})
        EXPECT_EQ(buffer.readBackDataFromGPU(queue(), CL_TRUE, 0, size, bytes, 0, nullptr), 0);
    for (const std::size_t offset : {std::size_t{4}, kLimit}) {
        buffer.readBackDataFromGPU(queue(), CL_TRUE, offset, 8, bytes, 0, nullptr);
        expectMisuse("clEnqueueReadBuffer: beyond the end");
    }
    EXPECT_EQ(callsOf("clEnqueueRead").size(), 4U);
}

TEST_F(BufferTest, TheEventGoesThoughItsWaitFailsOrItsBufferIsEmpty)
{
    Subject subject(kPending);
    TopenCLBuffer empty;
    empty.bufferReadyEvent() = subject.buffer->bufferReadyEvent();
    EXPECT_EQ(empty.ensureBufferCapacity(kSize), 0);
    EXPECT_EQ(empty.bufferReadyEvent().get(), nullptr);
    runtime().plan({.function = "clWaitForEvents"});
    EXPECT_EQ(subject.buffer->ensureBufferCapacity(kSize), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(subject.buffer->bufferReadyEvent().get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
}

TEST_F(BufferTest, AWrappedBufferKeepsItsDescription)
{
    const TopenCLDataBuffer data(Tplug(1, 2), TuniqueString("positions"), Descriptor::kReadOnly, 12,
                                 10, 7);
    TopenCLBuffer wrapped(context(), CL_MEM_READ_WRITE, data);
    EXPECT_TRUE(wrapped.openCLDataBuffer() == data); // name and plug
    EXPECT_EQ(wrapped.capacityInBytes(), 120U);
    EXPECT_TRUE(wrapped.openCLDataBuffer().descriptor().isReadOnly());
    const TopenCLDataBuffer large(Tplug(), TuniqueString(), {}, 65536, 65537, 7);
    EXPECT_EQ(TopenCLBuffer(nullptr, 0, large).capacityInBytes(), 65536U) << "a 32-bit product";
}

TEST_F(BufferTest, AFailedMappingKeepsTheCountedMemoryAndNoAddress)
{
    TopenCLBuffer buffer(context(), CL_MEM_ALLOC_HOST_PTR);
    runtime().plan({.function = "clEnqueueMapBuffer", .withHandle = true});
    EXPECT_EQ(buffer.ensureBufferCapacity(kSize), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(buffer.mappedPointer(), nullptr);
    EXPECT_NE(buffer.buffer().get(), nullptr);
    EXPECT_EQ(deviceMemory(), kSize);
}

TEST_F(BufferTest, ConstructorsAndCopiesCreateMemoryAsAskedFor)
{
    int error = 1;
    const TopenCLBuffer filled(context(), CL_MEM_READ_WRITE, 8, Subject::kBytes.data(), &error);
    const TopenCLBuffer plain(context(), CL_MEM_READ_WRITE, 9, nullptr, &error);
    const TopenCLBuffer original(context(), CL_MEM_WRITE_ONLY); // no memory yet
    EXPECT_EQ(error, 0);
    TopenCLBuffer byDefault;
    TopenCLBuffer copy(original);
    TopenCLBuffer assigned(nullptr, CL_MEM_READ_WRITE);
    assigned = original;
    std::size_t size = 10;
    for (TopenCLBuffer* buffer : {&byDefault, &copy, &assigned})
        buffer->ensureBufferCapacity(size++);
    EXPECT_EQ(callsOf("clCreate"), (Lines{"clCreateBuffer(context#1, 33, 8, host+0) = mem#1",
                                          "clCreateBuffer(context#1, 1, 9, null) = mem#2",
                                          "clCreateBuffer(context#1, 4, 10, null) = mem#3",
                                          "clCreateBuffer(context#1, 2, 11, null) = mem#4",
                                          "clCreateBuffer(context#1, 2, 12, null) = mem#5"}));
}

TEST_F(BufferTest, ConstructorsReportFailures)
{
    const auto errorOf = [](std::size_t size) {
        int error = 1;
        TopenCLBuffer buffer(context(), CL_MEM_READ_WRITE, size, nullptr, &error);
        EXPECT_EQ(buffer.capacityInBytes(), 0U);
        runtime().clearFaults();
        return error;
    };
    runtime().plan({.function = "clCreateBuffer", .status = -6});
    EXPECT_EQ(errorOf(7), -6);
    // Neither a handle nor a reason is a failure all the same.
    runtime().plan({.function = "clCreateBuffer", .status = CL_SUCCESS});
    EXPECT_EQ(errorOf(7), CL_MEM_OBJECT_ALLOCATION_FAILURE);
    EXPECT_EQ(errorOf(kLimit), CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(errorOf(0), CL_INVALID_BUFFER_SIZE);
    expectMisuse("clCreateBuffer: of no bytes"); // the check of the runtime
}

} // namespace
