// The growable device buffer: the calls of every operation in every state, its limits, its copies.
#include "ScriptedTest.h"
#include "buffers/TopenCLBuffer.h"
#include "loader/OpenCLLoader.h"
#include "runtime/TopenCLInfo.h"

#include <array>
#include <memory>

using namespace scripted;

namespace {

constexpr std::size_t kSize = 64; // of the memory in every state but kEmpty

enum class State { kEmpty, kAllocated, kPending, kWrapping, kMappedWrite, kMappedRead, kMapped };
constexpr std::array kStates = {State::kEmpty,    State::kAllocated,   State::kPending,
                                State::kWrapping, State::kMappedWrite, State::kMappedRead,
                                State::kMapped};

cl_mem_flags flagsOf(State state)
{
    switch (state) {
    case State::kMappedWrite: // writing goes before reading
        return CL_MEM_ALLOC_HOST_PTR | CL_MEM_HOST_WRITE_ONLY | CL_MEM_HOST_READ_ONLY;
    case State::kMappedRead:
        return CL_MEM_ALLOC_HOST_PTR | CL_MEM_HOST_READ_ONLY;
    case State::kMapped:
        return CL_MEM_ALLOC_HOST_PTR;
    default:
        return CL_MEM_ALLOC_HOST_PTR | CL_MEM_HOST_NO_ACCESS;
    }
}

std::string number(std::size_t value)
{
    return std::to_string(value);
}

// A buffer in a state, and what the rules say about it: mem#1 is its memory, event#1 its event.
class Subject {
public:
    explicit Subject(State state) : fState(state), fBuffer(makeBuffer(state)) {}

    TopenCLBuffer& buffer() { return *fBuffer; }

    bool isMapped() const { return fState >= State::kMappedWrite; }
    bool hasEvent() const { return fState == State::kPending || fState == State::kWrapping; }
    bool holdsMemory() const { return fState != State::kEmpty; }
    std::string mem() const { return holdsMemory() ? "mem#1" : "null"; }
    unsigned events() const { return hasEvent() ? 1 : 0; }

    // The calls that let go of memory, mapping and event, on the way to a new memory or to none.
    Lines dropping() const
    {
        if (!holdsMemory())
            return {};
        Lines lines;
        if (fState != State::kWrapping)
            lines.push_back("ReduceFromDeviceMemory(64)");
        if (isMapped()) {
            lines.push_back("clEnqueueUnmapMemObject(queue#1, mem#1, []) = event#1");
            lines.push_back("clWaitForEvents([event#1])");
        }
        lines.push_back("clReleaseMemObject(mem#1)");
        if (isMapped() || hasEvent())
            lines.push_back("clReleaseEvent(event#1)");
        return lines;
    }
    // The calls that make memory, and map it where there is no host data.
    Lines creating(std::size_t size, bool hostData) const
    {
        const std::string mem = holdsMemory() ? "mem#2" : "mem#1";
        const cl_mem_flags flags = flagsOf(fState) | (hostData ? CL_MEM_COPY_HOST_PTR : 0);
        Lines lines{"AddToDeviceMemory(" + number(size) + ")",
                    "clCreateBuffer(context#1, " + number(flags) + ", " + number(size) + ", " +
                        (hostData ? "host+0" : "null") + ") = " + mem};
        if (isMapped() && !hostData) {
            const char* mapFlags = fState == State::kMappedWrite  ? "2"
                                   : fState == State::kMappedRead ? "1"
                                                                  : "0";
            lines.push_back("clEnqueueMapBuffer(queue#1, " + mem + ", 1, " + mapFlags + ", 0, " +
                            number(size) + ", [])");
        }
        return lines;
    }
    Lines growing(std::size_t size, bool hostData) const
    {
        Lines lines = dropping();
        const Lines created = creating(size, hostData);
        lines.insert(lines.end(), created.begin(), created.end());
        return lines;
    }

private:
    static std::unique_ptr<TopenCLBuffer> makeBuffer(State state)
    {
        const TopenCLInfo& info = TopenCLInfo::theOne();
        auto made = std::make_unique<TopenCLBuffer>(info.openCLContext(), flagsOf(state));
        if (state != State::kEmpty)
            made->ensureBufferCapacity(kSize);
        char byte = 0;
        if (state == State::kPending || state == State::kWrapping)
            made->uploadDataToGPU(info.openCLCommandQueue(), CL_FALSE, 0, 1, &byte, 0, nullptr);
        if (state != State::kWrapping)
            return made;
        // Element count times element size decides, not the capacity that is recorded.
        TopenCLDataBuffer data = made->openCLDataBuffer();
        data.descriptor().setElementCount(16);
        data.descriptor().setElementSizeInBytes(4);
        data.descriptor().setCapacityInBytes(1000);
        return std::make_unique<TopenCLBuffer>(info.openCLContext(), flagsOf(state), data);
    }

    State fState;
    std::unique_ptr<TopenCLBuffer> fBuffer;
};

class BufferTest : public ScriptedTest {
protected:
    void SetUp() override
    {
        ASSERT_TRUE(start());
        runtime().setHostMemory(fBytes.data(), fBytes.size());
    }
    // Not the queue that the library uses by itself.
    cl_command_queue queue() { return TopenCLInfo::theOne().secondaryOpenCLCommandQueue(); }
    int upload(TopenCLBuffer& buffer, std::size_t offset, std::size_t size)
    {
        return buffer.uploadDataToGPU(queue(), CL_FALSE, offset, size, fBytes.data(), 0, nullptr);
    }

    std::array<char, 256> fBytes{};
};

// One test for every state, each in a runtime that numbers from 1.
class BufferInState : public BufferTest, public ::testing::WithParamInterface<State> {
protected:
    void SetUp() override
    {
        BufferTest::SetUp();
        fSubject = std::make_unique<Subject>(GetParam());
        calls();
    }
    void TearDown() override
    {
        fSubject.reset();
        EXPECT_EQ(deviceMemory(), 0U);
        BufferTest::TearDown();
    }
    TopenCLBuffer& buffer() { return fSubject->buffer(); }

    std::unique_ptr<Subject> fSubject;
};

TEST_P(BufferInState, CapacityOfNoMoreThanItHasWaitsForTheEvent)
{
    EXPECT_EQ(buffer().ensureBufferCapacity(0), 0);
    const Lines waiting{"clWaitForEvents([event#1])", "clReleaseEvent(event#1)"};
    EXPECT_EQ(calls(), fSubject->hasEvent() ? waiting : Lines{});
    EXPECT_EQ(buffer().ensureBufferCapacity(buffer().capacityInBytes()), 0);
    EXPECT_EQ(calls(), Lines{});
    EXPECT_EQ(buffer().bufferReadyEvent().get(), nullptr);
}

TEST_P(BufferInState, MoreCapacityMakesNewMemory)
{
    EXPECT_EQ(buffer().ensureBufferCapacity(kSize + 1), 0);
    EXPECT_EQ(calls(), fSubject->growing(kSize + 1, false));
    EXPECT_EQ(buffer().capacityInBytes(), kSize + 1);
    EXPECT_EQ(deviceMemory(), kSize + 1);
    EXPECT_EQ(buffer().mappedPointer() != nullptr, fSubject->isMapped());
}

class BufferWithMemory : public BufferInState {};

TEST_P(BufferWithMemory, AFittingUploadIsOneWrite)
{
    EXPECT_EQ(upload(buffer(), kSize - 16, 16), 0);
    const std::string event = "event#" + number(fSubject->events() + 1);
    Lines expected = fSubject->hasEvent() ? Lines{"clReleaseEvent(event#1)"} : Lines{};
    expected.push_back("clEnqueueWriteBuffer(queue#2, mem#1, 0, 48, 16, host+0, []) = " + event);
    EXPECT_EQ(calls(), expected);
    EXPECT_EQ(runtime().name(buffer().bufferReadyEvent().get()), event);
}

TEST_P(BufferInState, AnUploadThatGrowsAtTheStartNeedsNoWrite)
{
    EXPECT_EQ(upload(buffer(), 0, 128), 0);
    EXPECT_EQ(calls(), fSubject->growing(128, true));
    EXPECT_EQ(buffer().bufferReadyEvent().get(), nullptr);
    EXPECT_EQ(buffer().mappedPointer(), nullptr);
}

TEST_P(BufferInState, AnUploadThatGrowsElsewhereCreatesAndWrites)
{
    EXPECT_EQ(upload(buffer(), kSize, 16), 0);
    Lines expected = fSubject->growing(kSize + 16, false);
    const bool hadEvent = fSubject->hasEvent() || fSubject->isMapped();
    const std::string mem = fSubject->holdsMemory() ? "mem#2" : "mem#1";
    expected.push_back("clEnqueueWriteBuffer(queue#2, " + mem +
                       ", 0, 64, 16, host+0, []) = event#" + number(hadEvent ? 2 : 1));
    EXPECT_EQ(calls(), expected);
}

TEST_P(BufferInState, AnUploadOfNothingOrToAReadOnlyBufferChangesNothing)
{
    buffer().openCLDataBuffer().descriptor().setPermissions(TopenCLDataBufferDescriptor::kReadOnly);
    EXPECT_EQ(upload(buffer(), 0, 0), 0);
    EXPECT_EQ(upload(buffer(), 0, 1), CL_INVALID_OPERATION);
    EXPECT_EQ(upload(buffer(), std::size_t{1} << 32, 1), CL_INVALID_OPERATION);
    EXPECT_EQ(calls(), Lines{});
}

TEST_P(BufferInState, SizesBeyond32BitsAreRefusedBeforeAnyCall)
{
    constexpr std::size_t kLimit = std::size_t{1} << 32;
    const cl_event waitList = nullptr; // would be a noted misuse
    const auto uploadAfter = [&](std::size_t offset, std::size_t size) {
        return buffer().uploadDataToGPU(queue(), CL_FALSE, offset, size, nullptr, 1, &waitList);
    };
    EXPECT_EQ(buffer().ensureBufferCapacity(kLimit), CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(uploadAfter(0, kLimit), CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(uploadAfter(kLimit - 16, 16), CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(uploadAfter(SIZE_MAX, 2), CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(uploadAfter(0, 0), CL_SUCCESS);
    EXPECT_EQ(calls(), Lines{});
    EXPECT_EQ(buffer().ensureBufferCapacity(kLimit - 1), CL_SUCCESS);
    EXPECT_EQ(buffer().capacityInBytes(), kLimit - 1);
}

TEST_P(BufferInState, ResetLetsGoOfEverythingOnce)
{
    buffer().reset();
    EXPECT_EQ(calls(), fSubject->dropping());
    EXPECT_EQ(buffer().capacityInBytes(), 0U);
    EXPECT_EQ(buffer().mappedPointer(), nullptr);
    buffer().reset();
    EXPECT_EQ(calls(), Lines{});
}

TEST_P(BufferInState, ACopySharesTheMemoryAndNeitherMappingNorCount)
{
    {
        TopenCLBuffer copy(buffer());
        EXPECT_EQ(copy.buffer().get(), buffer().buffer().get());
        EXPECT_EQ(copy.mappedPointer(), nullptr);
        EXPECT_EQ(copy.capacityInBytes(), buffer().capacityInBytes());
        TopenCLBuffer& itself = copy;
        copy = itself;
        copy = buffer();
    }
    using ::testing::StartsWith;
    EXPECT_THAT(calls(), ::testing::Each(::testing::AnyOf(
                             StartsWith("clRetainMemObject"), StartsWith("clReleaseMemObject"),
                             StartsWith("clRetainEvent"), StartsWith("clReleaseEvent"))));
    buffer().reset(); // which alone unmaps and un-counts
    EXPECT_EQ(calls(), fSubject->dropping());
}
INSTANTIATE_TEST_SUITE_P(Buffer, BufferInState, ::testing::ValuesIn(kStates));
INSTANTIATE_TEST_SUITE_P(Buffer, BufferWithMemory,
                         ::testing::ValuesIn(kStates.begin() + 1, kStates.end()));

TEST_F(BufferTest, WaitListsPassUnchangedOnWritesAndOnlyWithACountOnReads)
{
    TopenCLBuffer buffer;
    buffer.ensureBufferCapacity(kSize);
    upload(buffer, 0, 1);
    const AutoCLObject<cl_event> event = buffer.bufferReadyEvent();
    const cl_event list[] = {event.get(), event.get()};
    calls();
    buffer.uploadDataToGPU(queue(), CL_TRUE, 8, 4, fBytes.data() + 1, 2, list);
    buffer.readBackDataFromGPU(queue(), CL_TRUE, 4, 4, fBytes.data() + 2, 2, list);
    buffer.readBackDataFromGPU(queue(), CL_FALSE, 4, 4, fBytes.data() + 3, 0, list);
    EXPECT_EQ(
        calls(),
        (Lines{
            "clReleaseEvent(event#1)",
            "clEnqueueWriteBuffer(queue#2, mem#1, 1, 8, 4, host+1, [event#1, event#1]) = event#2",
            "clReleaseEvent(event#2)",
            "clEnqueueReadBuffer(queue#2, mem#1, 1, 4, 4, host+2, [event#1, event#1]) = event#3",
            "clReleaseEvent(event#3)",
            "clEnqueueReadBuffer(queue#2, mem#1, 0, 4, 4, host+3, []) = event#4"}));

    // A null list with a count, and a list without, are the caller's affair.
    buffer.uploadDataToGPU(queue(), CL_FALSE, 0, 4, fBytes.data(), 0, list);
    expectMisuse("clEnqueueWriteBuffer: count and pointer of the wait list disagree");
}

TEST_F(BufferTest, AGrowingUploadWaitsForTheWaitListFirst)
{
    TopenCLBuffer buffer;
    buffer.ensureBufferCapacity(kSize);
    upload(buffer, 0, 1);
    const AutoCLObject<cl_event> event = buffer.bufferReadyEvent();
    const cl_event handle = event.get();
    calls();
    runtime().plan({.function = "clWaitForEvents"}); // neither reported nor returned
    EXPECT_EQ(buffer.uploadDataToGPU(queue(), CL_FALSE, 0, 65, fBytes.data(), 1, &handle), 0);
    EXPECT_EQ(calls().front(), "clWaitForEvents([event#1]) ! -5");

    buffer.uploadDataToGPU(queue(), CL_TRUE, 65, 4, fBytes.data(), 1, &handle);
    const Lines elsewhere = calls();
    EXPECT_EQ(elsewhere.front(), "clWaitForEvents([event#1])");
    EXPECT_EQ(elsewhere.back(),
              "clEnqueueWriteBuffer(queue#2, mem#3, 1, 65, 4, host+0, [event#1]) = event#2");
}

TEST_F(BufferTest, AReadBackChecksNeitherPermissionsNorCapacity)
{
    TopenCLBuffer buffer;
    buffer.ensureBufferCapacity(8);
    buffer.openCLDataBuffer().descriptor().setPermissions(TopenCLDataBufferDescriptor::kReadOnly);
    EXPECT_EQ(buffer.readBackDataFromGPU(queue(), CL_TRUE, 0, 8, fBytes.data(), 0, nullptr), 0);
    // The checks of the runtime decide.
    EXPECT_EQ(buffer.readBackDataFromGPU(queue(), CL_TRUE, 0, 0, fBytes.data(), 0, nullptr), 0);
    for (const std::size_t offset : {std::size_t{4}, std::size_t{1} << 32}) {
        buffer.readBackDataFromGPU(queue(), CL_TRUE, offset, 8, fBytes.data(), 0, nullptr);
        expectMisuse("clEnqueueReadBuffer: beyond the end");
    }
    EXPECT_EQ(callsOf("clEnqueueRead").size(), 4U);
}

TEST_F(BufferTest, AFailedWaitDropsTheEventAllTheSame)
{
    TopenCLBuffer buffer;
    buffer.ensureBufferCapacity(kSize);
    upload(buffer, 0, 1);
    runtime().plan({.function = "clWaitForEvents"});
    EXPECT_EQ(buffer.ensureBufferCapacity(kSize), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(buffer.bufferReadyEvent().get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
}

TEST_F(BufferTest, CreatingMemoryDropsAnEventThatAnEmptyBufferHolds)
{
    TopenCLBuffer buffer;
    buffer.ensureBufferCapacity(kSize);
    upload(buffer, 0, 1);
    TopenCLBuffer empty;
    empty.bufferReadyEvent() = buffer.bufferReadyEvent();
    EXPECT_EQ(empty.ensureBufferCapacity(kSize), 0);
    EXPECT_EQ(empty.bufferReadyEvent().get(), nullptr);
}

TEST_F(BufferTest, AWrappedBufferKeepsItsDescription)
{
    const TopenCLDataBuffer data(Tplug(1, 2), TuniqueString("positions"),
                                 TopenCLDataBufferDescriptor::kReadOnly, 12, 10, 7);
    TopenCLBuffer wrapped(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_WRITE, data);
    EXPECT_TRUE(wrapped.openCLDataBuffer() == data); // name and plug
    EXPECT_EQ(wrapped.capacityInBytes(), 120U);
    EXPECT_EQ(upload(wrapped, 0, 1), CL_INVALID_OPERATION);
    const auto capacityOf = [](unsigned elementSize, unsigned count) {
        return TopenCLBuffer(nullptr, 0,
                             TopenCLDataBuffer(Tplug(), TuniqueString(), {}, elementSize, count, 7))
            .capacityInBytes();
    };
    EXPECT_EQ(capacityOf(65536, 65537), 65536U) << "a 32-bit product";
    EXPECT_EQ(capacityOf(12, 0), 0U);
}

TEST_F(BufferTest, CopiesCreateMemoryAsTheirOriginalWould)
{
    const TopenCLBuffer original(TopenCLInfo::theOne().openCLContext(), CL_MEM_WRITE_ONLY);
    TopenCLBuffer copy(original);
    TopenCLBuffer assigned(nullptr, CL_MEM_READ_WRITE);
    assigned = original;
    copy.ensureBufferCapacity(8);
    assigned.ensureBufferCapacity(9);
    EXPECT_EQ(callsOf("clCreate"), (Lines{"clCreateBuffer(context#1, 2, 8, null) = mem#1",
                                          "clCreateBuffer(context#1, 2, 9, null) = mem#2"}));
}

TEST_F(BufferTest, AssignmentUnmapsAndUncountsTheTargetOnce)
{
    TopenCLBuffer source;
    source.ensureBufferCapacity(kSize);
    {
        TopenCLBuffer target(TopenCLInfo::theOne().openCLContext(), CL_MEM_ALLOC_HOST_PTR);
        target.ensureBufferCapacity(8);
        calls();
        target = source; // shares memory that the target does not count
        EXPECT_EQ(callsOf("clEnqueueUnmapMemObject").size(), 1U);
        EXPECT_EQ(deviceMemory(), kSize);
    }
    EXPECT_EQ(deviceMemory(), kSize);
}

TEST_F(BufferTest, AFailedMappingKeepsTheCountedMemoryAndNoAddress)
{
    TopenCLBuffer buffer(TopenCLInfo::theOne().openCLContext(), CL_MEM_ALLOC_HOST_PTR);
    runtime().plan({.function = "clEnqueueMapBuffer", .withHandle = true});
    EXPECT_EQ(buffer.ensureBufferCapacity(kSize), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(buffer.mappedPointer(), nullptr);
    EXPECT_NE(buffer.buffer().get(), nullptr);
    EXPECT_EQ(deviceMemory(), kSize);
}

TEST_F(BufferTest, ConstructorsCreateWhatTheyAreAskedFor)
{
    int error = 1;
    const cl_context context = TopenCLInfo::theOne().openCLContext();
    TopenCLBuffer filled(context, CL_MEM_READ_WRITE, 8, fBytes.data(), &error);
    TopenCLBuffer plain(context, CL_MEM_READ_WRITE, 9, nullptr, &error);
    const TopenCLBuffer none(context, CL_MEM_READ_WRITE);
    TopenCLBuffer byDefault;
    byDefault.ensureBufferCapacity(10);
    EXPECT_EQ(error, 0);
    EXPECT_EQ(calls(),
              (Lines{"AddToDeviceMemory(8)", "clCreateBuffer(context#1, 33, 8, host+0) = mem#1",
                     "AddToDeviceMemory(9)", "clCreateBuffer(context#1, 1, 9, null) = mem#2",
                     "AddToDeviceMemory(10)", "clCreateBuffer(context#1, 4, 10, null) = mem#3"}));
    runtime().plan({.function = "clCreateBuffer", .status = -6});
    const TopenCLBuffer failed(context, CL_MEM_READ_WRITE, 7, nullptr, &error);
    EXPECT_EQ(error, -6);
    EXPECT_EQ(failed.openCLDataBuffer().descriptor().capacityInBytes(), 0U);
    // Neither a handle nor a reason is a failure all the same.
    runtime().clearFaults();
    runtime().plan({.function = "clCreateBuffer", .status = CL_SUCCESS});
    const TopenCLBuffer silent(context, CL_MEM_READ_WRITE, 7, nullptr, &error);
    EXPECT_EQ(error, CL_MEM_OBJECT_ALLOCATION_FAILURE);
    calls();
    const TopenCLBuffer huge(context, CL_MEM_READ_WRITE, std::size_t{1} << 32, nullptr, &error);
    EXPECT_EQ(error, CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(calls(), Lines{});
    const TopenCLBuffer ofNothing(context, CL_MEM_READ_WRITE, 0, nullptr, &error);
    EXPECT_EQ(error, CL_INVALID_BUFFER_SIZE);
    expectMisuse("clCreateBuffer: of no bytes"); // the check of the runtime
    EXPECT_EQ(deviceMemory(), 27U);
}

} // namespace
