#include "evaluator/EvaluatorImplementation.h"

#include "evaluator/Failure.h"
#include "evaluator/OpenEvaluation.h"

#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"

#include <string>
#include <utility>

namespace vyra {
namespace {

constexpr std::uint16_t kNoEvaluation = 0xFFFE; // never names an evaluation

// Sets a flag while a scope is open.
class FlagScope {
public:
    explicit FlagScope(bool& flag) : fFlag(flag) { fFlag = true; }
    ~FlagScope() { fFlag = false; }
    FlagScope(const FlagScope&) = delete;
    FlagScope& operator=(const FlagScope&) = delete;

private:
    bool& fFlag;
};

} // namespace

TopenCLSharedBufferMgr& EvaluatorImplementation::manager()
{
    return TopenCLInfo::theOne().sharedBufferMgr();
}

EvaluatorImplementation::EvaluatorImplementation(EvaluatorSettings settings)
    : fSettings(std::move(settings))
{
    fArena.initialize();
    if (TopenCLInfo::isValid())
        startOpenCL();
}

void EvaluatorImplementation::startOpenCL()
{
    fCL = openCLFunctions();
    if (!fCL) {
        fStartStatus =
            Status("the OpenCL library lacks a function that the evaluator calls; update "
                   "the OpenCL loader");
        return;
    }
    std::vector<std::string> directories = fSettings.kernelDirectories;
    directories.push_back(Evaluator::kernelDirectory());
    fLibrary = std::make_unique<KernelLibrary>(*fCL, directories);
    fBatchReleased = manager().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr);
    for (int i = 1; i <= fArena.max_concurrency(); ++i) {
        auto queue =
            DeformationQueue::create(*fCL, static_cast<std::size_t>(i), fSettings, fStartStatus);
        if (queue)
            fQueues.push_back(std::move(queue));
    }
    if (!fQueues.empty())
        fStartStatus = {};
}

EvaluatorImplementation::~EvaluatorImplementation()
{
    finish();
    while (!fMeshes.empty())
        destroy(*fMeshes.back());
}

Status EvaluatorImplementation::prepare()
{
    resetStatuses();
    for (const auto& queue : fQueues)
        queue->prepare(*fLibrary);
    Status first = fStartStatus;
    for (const auto& mesh : fMeshes) {
        if (first.ok())
            first = mesh->status();
    }
    return first;
}

void EvaluatorImplementation::evaluate(const em::Id& id)
{
    if (id.value() == kNoEvaluation) {
        refuse("65534 never names an evaluation; number evaluations from 0");
        return;
    }
    if (!mayDeform())
        return;
    {
        const FlagScope busy(fBusy);
        if (usesOpenCL())
            evaluateWithOpenCL(id);
        else
            deformMeshes();
    }
    destroyRemovedMeshes();
}

void EvaluatorImplementation::evaluateWithOpenCL(const em::Id& id)
{
    if (TopenCLInfo::theOne().useGLFinish())
        fSettings.finishRenderer();
    finishIfUnordered();
    bool closed = false;
    bool acquired = false;
    {
        const OpenEvaluation evaluation(id, findProbe());
        fCounts.acquires += evaluation.acquiredBatch() ? 1 : 0;
        if (evaluation.isOpen())
            deformMeshes();
        else
            refuse("there is no memory to open the evaluation", CL_OUT_OF_HOST_MEMORY);
        closed = evaluation.isOwn();
        acquired = evaluation.acquiredBatch();
    }
    fUnordered = fUnordered || (acquired && !*fBatchReleased);
    if (!closed)
        return;
    TopenCLInfo::flush();
    fCounts.releases += *fBatchReleased ? 1 : 0;
}

// Returns a vertex buffer outside the batch if there is one, else one in the batch, else null.
const TopenCLSharedBuffer* EvaluatorImplementation::findProbe() const
{
    const TopenCLSharedBuffer* found = nullptr;
    for (const auto& mesh : fMeshes) {
        if (const TopenCLSharedBuffer* buffer = mesh->state().positions)
            found = buffer;
        if (found && !found->fInBatch)
            break;
    }
    return found;
}

// Returns whether meshes can be deformed. A refusal is in the status.
bool EvaluatorImplementation::mayDeform()
{
    if (fBusy)
        refuse("an evaluation was asked for inside an evaluation; wait for its end");
    else if (usesOpenCL() && !TopenCLInfo::theOne().usingDX() && !fSettings.finishRenderer)
        refuse("EvaluatorSettings::finishRenderer is not set; with OpenGL it calls glFinish");
    else
        return true;
    return false;
}

void EvaluatorImplementation::refuse(const char* reason, cl_int status)
{
    fStatus =
        guarded([&] { return Status(std::string("nothing was evaluated: ") + reason, status); });
}

void EvaluatorImplementation::deform()
{
    if (!mayDeform())
        return;
    // The manager keeps a release event from PostEvaluate to the next PreEvaluate.
    if (usesOpenCL() && *fBatchReleased && batchSize() > 0) {
        refuse("no evaluation is open; call TopenCLSharedBufferMgr::PreEvaluate before");
        return;
    }
    {
        const FlagScope busy(fBusy);
        deformMeshes();
    }
    destroyRemovedMeshes();
}

void EvaluatorImplementation::finish()
{
    for (const auto& queue : fQueues)
        queue->finish();
    TopenCLInfo::finish();
}

Status EvaluatorImplementation::replaceKernelFile(const std::string& file,
                                                  const std::string& source)
{
    return fLibrary ? fLibrary->replaceFile(file, source) : Status();
}

EvaluatorCounts EvaluatorImplementation::counts() const
{
    EvaluatorCounts counts = fCounts;
    if (fLibrary) {
        counts.programsBuilt = fLibrary->programsBuilt();
        counts.kernelsCreated = fLibrary->kernelsCreated();
    }
    for (const auto& queue : fQueues) {
        counts.buffersCreated += queue->buffersCreated();
        counts.buffersReused += queue->buffersReused();
    }
    return counts;
}

} // namespace vyra
