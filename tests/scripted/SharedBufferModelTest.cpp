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

struct Step {
    std::size_t operation; // of kOperations
    unsigned choice;       // of a buffer, an id or a number of events
};

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
    struct Operation {
        const char* name;
        double weight; // how often it occurs, so that batches are large enough to be interesting
        void (SideBySide::*perform)(unsigned choice);
        std::size_t choices; // 0: a buffer
    };
    static const Operation kOperations[9];

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
    void create(unsigned);
    template <bool kBatched>
    void destroy(unsigned index);
    void acquire(unsigned index);
    void releaseAlone(unsigned index);
    void handOver(unsigned count);
    void preEvaluate(unsigned id);
    void postEvaluate(unsigned);
    void renderingComplete(unsigned);
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

const SideBySide::Operation SideBySide::kOperations[] = {
    {"Create", 4, &SideBySide::create, 1},
    {"Destroy", 1, &SideBySide::destroy<false>, 0},
    {"DestroyBatched", 2, &SideBySide::destroy<true>, 0},
    {"PreEvaluate", 4, &SideBySide::preEvaluate, 2},
    {"Acquire", 5, &SideBySide::acquire, 0},
    {"HandOver", 3, &SideBySide::handOver, 4},
    {"ReleaseAlone", 4, &SideBySide::releaseAlone, 0},
    {"PostEvaluate", 4, &SideBySide::postEvaluate, 1},
    {"RenderingComplete", 2, &SideBySide::renderingComplete, 1},
};

std::vector<Step> randomSteps(unsigned seed)
{
    std::vector<double> weights;
    std::ranges::transform(SideBySide::kOperations, std::back_inserter(weights),
                           &SideBySide::Operation::weight);
    std::mt19937 random(seed);
    std::discrete_distribution<std::size_t> operation(weights.begin(), weights.end());
    std::vector<Step> steps;
    for (unsigned i = 0; i < kSteps; ++i)
        steps.push_back({operation(random), static_cast<unsigned>(random() % 1000)});
    return steps;
}

void SideBySide::perform(const Step& step)
{
    const Operation& operation = kOperations[step.operation];
    const std::size_t choices = operation.choices ? operation.choices : fModel.records().size();
    if (choices > 0)
        (this->*operation.perform)(static_cast<unsigned>(step.choice % choices));
}

template <bool kBatched>
void SideBySide::destroy(unsigned index)
{
    const std::string mem = fModel.records()[index].mem;
    const TopenCLSharedBuffer* buffer = fRecords.at(mem);
    const int status = kBatched ? fManager->DestroyBatchedSharedCLBuffer(buffer)
                                : fManager->DestroySharedCLBuffer(buffer);
    expect(kBatched ? fModel.destroyBatched(index) : fModel.destroy(index));
    same("status", status, fModel.status());
    fRecords.erase(mem);
}

void SideBySide::create(unsigned)
{
    int status = 1;
    const TopenCLSharedBuffer* record = makeShared(*fManager, &status);
    expect(fModel.create());
    fModel.setHandle(reinterpret_cast<std::uintptr_t>(record->fMem.get()));
    fRecords[runtime().name(record->fMem.get())] = record;
}

void SideBySide::acquire(unsigned index)
{
    if (fModel.records()[index].acquired)
        return;
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

void SideBySide::releaseAlone(unsigned index)
{
    if (!fModel.records()[index].acquired)
        return;
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

void SideBySide::postEvaluate(unsigned)
{
    if (fModel.anyAcquiredAlone())
        return;
    fManager->PostEvaluate(em::Id(0));
    expect(fModel.postEvaluate());
    dropKept();
}

void SideBySide::renderingComplete(unsigned)
{
    fManager->RenderingComplete();
    expect(fModel.renderingComplete());
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
    for (unsigned index = 0; index < fModel.records().size(); ++index)
        releaseAlone(index);
    postEvaluate(0);
    create(0);
    preEvaluate(0);
    postEvaluate(0);
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
            sequence << "\n  " << SideBySide::kOperations[step.operation].name << ' '
                     << step.choice;
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
