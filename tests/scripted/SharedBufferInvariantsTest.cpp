// Random sequences of the shared-buffer manager's operations, in every pair of synchronisation
// modes, checked against invariants: one acquire and one release per evaluation, every reported
// event in a release, balanced references, no misuse of the runtime.
#include "Objects.h"
#include "ScriptedTest.h"
#include "host/EvaluationId.h"
#include "interop/GraphicsSync.h"

#include <algorithm>
#include <memory>
#include <random>
#include <set>
#include <tuple>

using namespace scripted;

namespace {

constexpr unsigned kSequences = 300; // of each pair of modes
constexpr unsigned kSteps = 80;

struct Modes {
    int graphicsToCL;
    int clToGraphics;
    bool batching;
};

using Names = std::multiset<std::string>;

// A sequence on a manager of its own, and a model of the state that the operations imply.
class Sequence {
public:
    explicit Sequence(const Modes& modes)
        : fModes(modes), fBase(runtime().balance()),
          fManager(std::make_unique<TopenCLSharedBufferMgr>())
    {
        std::ranges::generate(fEvents, makeEvent);
        runtime().takeMisuse();
    }

    // Performs the operations of a random sequence. Returns the first violation, or an empty text.
    std::string play(unsigned seed)
    {
        constexpr void (Sequence::*kOperations[])(unsigned) = {
            &Sequence::create,      &Sequence::destroy<false>, &Sequence::destroy<true>,
            &Sequence::preEvaluate, &Sequence::acquire,        &Sequence::report,
            &Sequence::release,     &Sequence::postEvaluate,   &Sequence::renderingComplete};
        // The weights make large batches.
        std::discrete_distribution<std::size_t> weighted{4, 1, 2, 4, 5, 3, 4, 4, 2};
        std::mt19937 random(seed);
        for (unsigned step = 0; step < kSteps && fViolation.empty(); ++step) {
            const auto operation = kOperations[weighted(random)];
            perform(operation, static_cast<unsigned>(random() % 1000));
            if (!fViolation.empty())
                fViolation = "step " + std::to_string(step) + ": " + fViolation;
        }
        finish();
        return fViolation;
    }

private:
    struct Buffer {
        const TopenCLSharedBuffer* record;
        bool acquired = false; // outside the batch
        bool inBatch = false;

        std::string name() const { return runtime().name(record->fMem.get()); }
    };

    void require(bool holds, const std::string& rule)
    {
        if (!holds && fViolation.empty())
            fViolation = rule + ", calls " + testing::PrintToString(fCalls);
    }
    void perform(void (Sequence::*operation)(unsigned), unsigned choice)
    {
        runtime().takeCalls();
        (this->*operation)(choice);
        checkReferences();
    }
    // Requires one command since the operation began, with these objects and this wait list, and
    // none if there are no objects. Returns its event.
    std::string requireCommand(const char* function, const Names& mems, const Names& waitList)
    {
        fCalls = runtime().takeCalls();
        const Lines commands = linesOf(fCalls, "clEnqueue");
        if (mems.empty()) {
            require(commands.empty(), "no command");
            return "";
        }
        const std::string line = commands.empty() ? "[]" : commands.front();
        require(commands.size() == 1 && line.starts_with(function) &&
                    std::ranges::is_permutation(namesAt(line, line.find('[')), mems) &&
                    std::ranges::is_permutation(namesAt(line, line.rfind('[')), waitList),
                std::string("one ") + function + " of " + testing::PrintToString(mems) + " after " +
                    testing::PrintToString(waitList));
        return line.substr(line.rfind(' ') + 1);
    }
    void requireNoCommand() { requireCommand("", {}, {}); }
    // Requires `count` calls of `function` since the operation began.
    void requireCount(const std::string& function, std::size_t count)
    {
        require(countOf(fCalls, function) == count, std::to_string(count) + " of " + function);
    }
    // Requires that the operation rebuilt the batch if buffers were created or destroyed, and only
    // then.
    void requireWholeBatch()
    {
        requireCount("clRetainMemObject", fDirty && fModes.batching ? fBuffers.size() : 0);
        setInBatch(fModes.batching);
        fDirty = false;
    }
    void setInBatch(bool inBatch)
    {
        for (Buffer& buffer : fBuffers)
            buffer.inBatch = inBatch;
    }
    // Returns the event of the last batch release.
    cl_event releaseEvent() { return *fManager->EnqueueReleaseBatchedSharedCLBuffer(0, nullptr); }
    bool anyAcquired() const { return std::ranges::any_of(fBuffers, &Buffer::acquired); }
    // Returns the chosen buffer, or null.
    Buffer* chosen(unsigned choice)
    {
        return fBuffers.empty() ? nullptr : &fBuffers[choice % fBuffers.size()];
    }

    void create(unsigned)
    {
        int status = 1;
        fBuffers.push_back({makeShared(*fManager, &status)});
        fDirty = true;
    }

    template <bool kKeepBatch>
    void destroy(unsigned choice)
    {
        const Buffer* buffer = chosen(choice);
        if (!buffer)
            return;
        const bool isHeld = fOpen && buffer->inBatch;
        const bool dissolves = !kKeepBatch && !fOpen && buffer->inBatch;
        const Names mems = kKeepBatch && isHeld ? Names{buffer->name()} : Names{};
        std::string awaited = dissolves && releaseEvent() ? runtime().name(releaseEvent()) : "";
        const int status = kKeepBatch ? fManager->DestroyBatchedSharedCLBuffer(buffer->record)
                                      : fManager->DestroySharedCLBuffer(buffer->record);
        require(status == (!kKeepBatch && isHeld ? CL_INVALID_VALUE : CL_SUCCESS), "the status");
        fBuffers.erase(fBuffers.begin() + (buffer - fBuffers.data()));
        awaited += requireCommand("clEnqueueRelease", mems, fPending);
        requireCount("clWaitForEvents([" + awaited + ']', awaited.empty() ? 0 : 1);
        fDirty = fDirty || !kKeepBatch;
        if (dissolves)
            setInBatch(false);
        for (const std::string& mem : mems)
            fHeld.erase(mem);
    }

    // Buffers acquired outside the batch are released before they join it.
    void preEvaluate(unsigned)
    {
        if (!fOpen && anyAcquired())
            return;
        fManager->PreEvaluate(em::Id(1));
        if (fOpen || !fModes.batching)
            return requireNoCommand();
        fOpen = true;
        for (const Buffer& buffer : fBuffers)
            fHeld.insert(buffer.name());
        const std::string event = requireCommand("clEnqueueAcquire", fHeld, {});
        requireWholeBatch();
        require(!releaseEvent(), "no release since");
        if (fHeld.empty())
            return;
        fAcquireEvent = event;
        fPending.insert(event);
        fFence = false;
    }

    void acquire(unsigned choice)
    {
        Buffer* buffer = chosen(choice);
        if (!buffer || buffer->acquired)
            return;
        AutoCLObject<cl_event> event;
        fManager->EnqueueAcquireSharedCLBuffer(queue(), buffer->record, event.receive());
        buffer->acquired = !buffer->inBatch;
        const Names mems = buffer->acquired ? Names{buffer->name()} : Names{};
        const std::string own = requireCommand("clEnqueueAcquire", mems, {});
        require(runtime().name(event.get()) == (buffer->acquired ? own : fAcquireEvent),
                "the event");
        fFence = fFence && !buffer->acquired;
    }

    void release(unsigned choice)
    {
        Buffer* buffer = chosen(choice);
        if (!buffer || !buffer->acquired)
            return;
        const cl_mem mem = buffer->record->fMem.get();
        fManager->EnqueueReleaseSharedCLBuffer(queue(), 1, &mem, 0, nullptr,
                                               fReleased.emplace_back().receive());
        requireCommand("clEnqueueRelease", {buffer->name()}, {});
        buffer->acquired = false;
    }

    void report(unsigned choice)
    {
        const unsigned number = choice % 4;
        // An array of holders is an array of handles.
        fManager->EnqueueReleaseBatchedSharedCLBuffer(number,
                                                      reinterpret_cast<const cl_event*>(fEvents));
        requireNoCommand();
        for (unsigned index = 0; index < number && fModes.batching; ++index)
            fPending.insert(runtime().name(fEvents[index].get()));
    }

    void postEvaluate(unsigned)
    {
        if (anyAcquired())
            return;
        fManager->PostEvaluate(em::Id(1));
        const std::string event = requireCommand("clEnqueueRelease", fHeld, fPending);
        require(fHeld.empty() || event == runtime().name(releaseEvent()),
                "the event at the address");
        const bool graphicsWaits = fModes.batching && fModes.clToGraphics == 3;
        requireCount("glWaitSync", graphicsWaits ? fReleased.size() + (releaseEvent() ? 1 : 0) : 0);
        requireWholeBatch();
        if (!fHeld.empty())
            fPending.clear();
        fHeld.clear();
        fOpen = false;
        fReleased.clear();
    }

    void renderingComplete(unsigned)
    {
        fManager->RenderingComplete();
        fFence = fModes.batching && fModes.graphicsToCL == 2;
    }

    void checkReferences()
    {
        for (const Buffer& buffer : fBuffers) {
            require(buffer.record->fInBatch == buffer.inBatch, "in the batch");
            require(runtime().references(Kind::kMem, buffer.record->fMem.get()) ==
                        (buffer.inBatch ? 2U : 1U),
                    "one reference of the record and one of the batch");
        }
        for (const auto& event : fEvents)
            require(runtime().references(Kind::kEvent, event.get()) ==
                        1 + fPending.count(runtime().name(event.get())),
                    "one reference for each report");
        require(countOf(runtime().balance(), "sync") == (fFence ? 1 : 0), "only the pending fence");
        const Lines misuse = runtime().takeMisuse();
        require(misuse.empty(), testing::PrintToString(misuse));
    }

    // A last evaluation releases all pending events; then no object may remain.
    void finish()
    {
        for (unsigned index = 0; index < fBuffers.size(); ++index)
            perform(&Sequence::release, index);
        for (const auto operation : {&Sequence::postEvaluate, &Sequence::create,
                                     &Sequence::preEvaluate, &Sequence::postEvaluate})
            perform(operation, 0);
        fManager.reset();
        std::ranges::fill(fEvents, AutoCLObject<cl_event>());
        WaitForGraphicsFence();
        require(runtime().balance() == fBase, testing::PrintToString(runtime().balance()));
    }

    Modes fModes;
    Lines fBase; // objects that existed before
    std::unique_ptr<TopenCLSharedBufferMgr> fManager;
    std::vector<Buffer> fBuffers;
    AutoCLObject<cl_event> fEvents[3]; // of an evaluator's last commands
    std::vector<AutoCLObject<cl_event>>
        fReleased; // of unbatched releases since the last PostEvaluate
    bool fOpen = false;
    bool fDirty = false; // buffers were created or destroyed since the batch was built
    Names fHeld;         // acquired by the open evaluation and not released since
    Names fPending;      // events that the next batch release must wait for
    std::string fAcquireEvent = "null";
    bool fFence = false; // is pending
    Lines fCalls;
    std::string fViolation;
};

// Parameters: those of Modes.
class SharedBufferInvariants : public ScriptedTest,
                               public ::testing::WithParamInterface<std::tuple<int, int, bool>> {};

TEST_P(SharedBufferInvariants, HoldInRandomSequences)
{
    const auto [graphicsToCL, clToGraphics, batching] = GetParam();
    if (!batching)
        setEnvironment("VYRA_OPENCL_FORCE_THREADING", "0");
    startInModes(graphicsToCL, clToGraphics);
    for (unsigned seed = 1; seed <= kSequences; ++seed)
        ASSERT_EQ(Sequence({graphicsToCL, clToGraphics, batching}).play(seed), "")
            << "seed " << seed;
}

using ::testing::Combine, ::testing::Range, ::testing::Values;
INSTANTIATE_TEST_SUITE_P(SharedBuffers, SharedBufferInvariants,
                         Combine(Range(1, 4), Range(1, 5), Values(true)));
INSTANTIATE_TEST_SUITE_P(UnbatchedBuffers, SharedBufferInvariants, Values(std::tuple(2, 3, false)));

} // namespace
