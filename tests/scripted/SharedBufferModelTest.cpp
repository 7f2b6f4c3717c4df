// Random sequences of the shared-buffer manager's operations, against the model, in every pair of
// synchronisation modes. A failing sequence is made as short as it goes before it is printed.
#include "SharedBufferModel.h"
#include "Objects.h"
#include "host/EvaluationId.h"
#include "interop/GraphicsSync.h"

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <random>
#include <sstream>
#include <utility>

using namespace scripted;

namespace {

// 13 processes of these make more than 300,000 steps; about half apply in the state that they meet.
constexpr unsigned kSequences = 300;
constexpr unsigned kSteps = 80;

enum class Op {
    kCreate,
    kDestroy,
    kDestroyBatched,
    kPreEvaluate,
    kAcquire,
    kHandOver,
    kReleaseAlone,
    kPostEvaluate,
    kRenderingComplete
};
constexpr const char* kOpNames[] = {"Create",       "Destroy",      "DestroyBatched",
                                    "PreEvaluate",  "Acquire",      "HandOver",
                                    "ReleaseAlone", "PostEvaluate", "RenderingComplete"};
// How often each occurs, so that batches are large enough to be interesting.
constexpr unsigned kWeights[] = {4, 1, 2, 4, 5, 3, 4, 4, 2};

struct Step {
    Op op;
    unsigned choice; // of a buffer, an id or a number of events
};

std::vector<Step> randomSteps(unsigned seed)
{
    std::mt19937 random(seed);
    std::discrete_distribution<int> op(std::begin(kWeights), std::end(kWeights));
    std::vector<Step> steps;
    for (unsigned i = 0; i < kSteps; ++i)
        steps.push_back({static_cast<Op>(op(random)), static_cast<unsigned>(random() % 1000)});
    return steps;
}

struct Modes {
    int graphicsToCL;
    int clToGraphics;
    bool batching;
};
void PrintTo(const Modes& modes, std::ostream* out)
{
    *out << modes.graphicsToCL << '_' << modes.clToGraphics << (modes.batching ? "" : "_Alone");
}

// One run of a sequence: manager and model side by side.
class SideBySide {
public:
    explicit SideBySide(const Modes& modes)
        : fModel(modes.graphicsToCL, modes.clToGraphics, modes.batching, fCreated), fModes(modes),
          fBase(runtime().balance()), fManager(std::make_unique<TopenCLSharedBufferMgr>())
    {
        std::sort(fBase.begin(), fBase.end());
        // Three events of an evaluator's last commands.
        for (cl_event& event : fEvaluatorEvents) {
            event = makeEvent();
            fEvaluatorNames.push_back(runtime().name(event));
        }
        // From the runtime itself: a run that failed left the model behind it.
        fCreated = {runtime().created(Kind::kMem), runtime().created(Kind::kEvent),
                    runtime().created(Kind::kSync)};
        runtime().takeCalls();
        runtime().takeMisuse();
    }

    // The first difference, or nothing.
    std::string play(const std::vector<Step>& steps)
    {
        for (std::size_t i = 0; i < steps.size() && fDifference.empty(); ++i) {
            perform(steps[i]);
            compareState();
            if (!fDifference.empty())
                fDifference = "step " + std::to_string(i) + ": " + fDifference;
        }
        finish();
        return fDifference;
    }

private:
    void expect(const Lines& expected)
    {
        const Lines actual = runtime().takeCalls();
        if (actual != expected)
            differ("calls " + testing::PrintToString(actual) + "\n  instead of " +
                   testing::PrintToString(expected));
    }
    // Events first; a map lets go of its entries in an order of its own.
    void expectInAnyOrder(Lines expected)
    {
        Lines actual = runtime().takeCalls();
        const auto isEvent = [](const std::string& line) {
            return line.starts_with("clReleaseEvent");
        };
        const auto events = std::find_if_not(expected.begin(), expected.end(), isEvent);
        actual.resize(std::max(actual.size(), expected.size()));
        same("events first", Lines(actual.begin(), actual.begin() + (events - expected.begin())),
             Lines(expected.begin(), events));
        std::sort(actual.begin(), actual.end());
        std::sort(expected.begin(), expected.end());
        same("the last calls", actual, expected);
    }
    void differ(const std::string& text)
    {
        if (fDifference.empty())
            fDifference = text;
    }
    template <typename T>
    void same(const char* what, const T& actual, const T& expected)
    {
        if (!(actual == expected))
            differ(std::string(what) + " is " + testing::PrintToString(actual) + " instead of " +
                   testing::PrintToString(expected));
    }

    void perform(const Step& step);
    void performOnRecord(const Step& step, std::size_t index);
    void create();
    void acquire(std::size_t index);
    void releaseAlone(std::size_t index);
    void handOver(unsigned count);
    void preEvaluate(unsigned id);
    void postEvaluate();
    void compareState();
    void settle();
    void finish();
    void dropKept();

    Created fCreated;
    SharedBufferModel fModel;
    Modes fModes;
    Lines fBase; // what lived before this run
    std::unique_ptr<TopenCLSharedBufferMgr> fManager;
    std::map<std::string, const TopenCLSharedBuffer*> fRecords;
    cl_event fEvaluatorEvents[3] = {};
    Lines fEvaluatorNames;
    std::vector<cl_event> fKept; // of single releases, until PostEvaluate
    const cl_event* fReleaseSlot = nullptr;
    std::string fDifference;
};

void SideBySide::perform(const Step& step)
{
    switch (step.op) {
    case Op::kCreate:
        return create();
    case Op::kPreEvaluate:
        return preEvaluate(step.choice % 2);
    case Op::kPostEvaluate:
        return postEvaluate();
    case Op::kHandOver:
        return handOver(step.choice % 4);
    case Op::kRenderingComplete:
        fManager->RenderingComplete();
        return expect(fModel.renderingComplete());
    default:
        if (!fModel.records().empty())
            performOnRecord(step, step.choice % fModel.records().size());
    }
}

void SideBySide::performOnRecord(const Step& step, std::size_t index)
{
    const SharedBufferModel::Record record = fModel.records()[index];
    const TopenCLSharedBuffer* buffer = fRecords.at(record.mem);
    switch (step.op) {
    case Op::kAcquire:
        if (!record.acquired)
            acquire(index);
        return;
    case Op::kReleaseAlone:
        if (record.acquired)
            releaseAlone(index);
        return;
    default:
        break;
    }
    const bool batched = step.op == Op::kDestroyBatched;
    const int status = batched ? fManager->DestroyBatchedSharedCLBuffer(buffer)
                               : fManager->DestroySharedCLBuffer(buffer);
    expect(batched ? fModel.destroyBatched(index) : fModel.destroy(index));
    same("status", status, fModel.status());
    fRecords.erase(record.mem);
}

void SideBySide::create()
{
    int status = 1;
    const TopenCLSharedBuffer* record = makeShared(*fManager, &status);
    expect(fModel.create());
    fModel.setHandle(reinterpret_cast<std::uintptr_t>(record->fMem.get()));
    fRecords[runtime().name(record->fMem.get())] = record;
}

void SideBySide::acquire(std::size_t index)
{
    cl_event event = nullptr;
    const auto* buffer = fRecords.at(fModel.records()[index].mem);
    const int status = fManager->EnqueueAcquireSharedCLBuffer(
        TopenCLInfo::theOne().openCLCommandQueue(), buffer, &event);
    expect(fModel.acquire(index));
    same("status", status, fModel.status());
    same("the caller's event", runtime().name(event), fModel.callersEvent());
    if (!event)
        return;
    fModel.drop(runtime().name(event));
    ocl.clReleaseEvent(event);
    runtime().takeCalls();
}

void SideBySide::releaseAlone(std::size_t index)
{
    const auto* buffer = fRecords.at(fModel.records()[index].mem);
    const cl_mem mem = buffer->fMem.get();
    cl_event event = nullptr;
    const int status = fManager->EnqueueReleaseSharedCLBuffer(
        TopenCLInfo::theOne().openCLCommandQueue(), 1, &mem, 0, nullptr, &event);
    expect(fModel.releaseAlone(index));
    same("status", status, fModel.status());
    fKept.push_back(event);
}

void SideBySide::handOver(unsigned count)
{
    Lines names(fEvaluatorNames.begin(), fEvaluatorNames.begin() + count);
    // Three without an array is nothing, too.
    const bool nothing = count == 0 && !fKept.empty();
    fReleaseSlot = fManager->EnqueueReleaseBatchedSharedCLBuffer(
        nothing ? 3 : count, nothing ? nullptr : fEvaluatorEvents);
    expect(fModel.handOver(names));
}

// Evaluations come one at a time. Buffers on their own are released before the batch takes them in.
void SideBySide::preEvaluate(unsigned id)
{
    if (!fModel.openId() && fModel.anyAcquiredAlone())
        return;
    const unsigned open = fModel.openId().value_or(id);
    fManager->PreEvaluate(em::Id(static_cast<std::uint16_t>(open)));
    expect(fModel.preEvaluate(open));
}

void SideBySide::postEvaluate()
{
    if (fModel.anyAcquiredAlone())
        return;
    fManager->PostEvaluate(em::Id(0));
    expect(fModel.postEvaluate());
    dropKept();
}

void SideBySide::dropKept()
{
    for (cl_event event : fKept) {
        fModel.drop(runtime().name(event));
        ocl.clReleaseEvent(event);
    }
    fKept.clear();
    runtime().takeCalls();
}

void SideBySide::compareState()
{
    for (const SharedBufferModel::Record& record : fModel.records())
        same("membership of the batch", fRecords.at(record.mem)->fInBatch, record.inBatch);
    if (fReleaseSlot)
        same("release event", runtime().name(*fReleaseSlot), fModel.releaseEvent());

    std::map<std::string, int> expected = fModel.references();
    for (const std::string& name : fEvaluatorNames)
        ++expected[name];
    std::erase_if(expected, [](const auto& entry) { return entry.second == 0; });
    std::map<std::string, int> actual;
    for (const std::string& line : runtime().balance()) {
        if (!std::binary_search(fBase.begin(), fBase.end(), line))
            actual[line.substr(0, line.find(' '))] = std::stoi(line.substr(line.rfind('x') + 1));
    }
    same("references", actual, expected);
    same("wrong use", runtime().takeMisuse(), Lines{});
}

// One evaluation more, with a buffer in the batch: its release takes all listed events along.
void SideBySide::settle()
{
    for (std::size_t i = 0; i < fModel.records().size(); ++i) {
        if (fModel.records()[i].acquired)
            releaseAlone(i);
    }
    postEvaluate();
    create();
    preEvaluate(0);
    postEvaluate();
}

void SideBySide::finish()
{
    settle();
    fReleaseSlot = nullptr;
    fManager.reset();
    expectInAnyOrder(fModel.end());
    if (fModes.graphicsToCL == 2) {
        WaitForGraphicsFence(); // leaves none for the next run
        expect(fModel.waitForFence());
    }
    dropKept();
    fRecords.clear();
    compareState();
    for (cl_event event : fEvaluatorEvents)
        ocl.clReleaseEvent(event);
    runtime().takeCalls();
}

class SharedBufferModelTest : public ScriptedTest, public ::testing::WithParamInterface<Modes> {
protected:
    void SetUp() override
    {
        if (!GetParam().batching)
            setEnvironment("VYRA_OPENCL_FORCE_THREADING", "0");
        startInModes(GetParam().graphicsToCL, GetParam().clToGraphics);
    }

    std::string play(const std::vector<Step>& steps) { return SideBySide(GetParam()).play(steps); }
    // Leaves out every step without which the sequence fails all the same.
    void shrink(std::vector<Step>& steps)
    {
        for (std::size_t i = steps.size(); i-- > 0;) {
            std::vector<Step> fewer = steps;
            fewer.erase(fewer.begin() + static_cast<std::ptrdiff_t>(i));
            if (!play(fewer).empty())
                steps = std::move(fewer);
        }
    }
};

TEST_P(SharedBufferModelTest, RandomSequencesFollowTheRules)
{
    const char* base = std::getenv("VYRA_TEST_SEED");
    const unsigned firstSeed = base ? static_cast<unsigned>(std::atoi(base)) : 1;
    for (unsigned seed = firstSeed; seed < firstSeed + kSequences; ++seed) {
        std::vector<Step> steps = randomSteps(seed);
        if (play(steps).empty())
            continue;
        shrink(steps);
        std::ostringstream sequence;
        for (const Step& step : steps)
            sequence << "\n  " << kOpNames[static_cast<int>(step.op)] << ' ' << step.choice;
        FAIL() << "seed " << seed << " fails at " << play(steps) << "\nin" << sequence.str();
    }
}

std::vector<Modes> allModes()
{
    std::vector<Modes> modes{{2, 3, false}};
    for (int graphicsToCL = 1; graphicsToCL <= 3; ++graphicsToCL) {
        for (int clToGraphics = 1; clToGraphics <= 4; ++clToGraphics)
            modes.push_back({graphicsToCL, clToGraphics, true});
    }
    return modes;
}
INSTANTIATE_TEST_SUITE_P(SharedBuffers, SharedBufferModelTest, ::testing::ValuesIn(allModes()),
                         ::testing::PrintToStringParamName());

} // namespace
