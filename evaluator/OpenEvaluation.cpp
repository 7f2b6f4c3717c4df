#include "evaluator/OpenEvaluation.h"

#include "evaluator/WarningCapture.h"

#include "interop/TopenCLSharedBufferMgr.h"
#include "runtime/TopenCLInfo.h"

#include <new>
#include <optional>

namespace vyra {
namespace {

TopenCLSharedBufferMgr& manager()
{
    return TopenCLInfo::theOne().sharedBufferMgr();
}

// With a reference of its own.
AutoCLObject<cl_event> acquireEventOf(const TopenCLSharedBuffer& buffer)
{
    AutoCLObject<cl_event> event;
    if (buffer.fInBatch)
        manager().EnqueueAcquireSharedCLBuffer(nullptr, &buffer, event.receive());
    return event;
}

} // namespace

OpenEvaluation::OpenEvaluation(const em::Id& id, const TopenCLSharedBuffer* witness) : fId(id)
{
    if (!witness)
        return;
    try {
        open(*witness);
    } catch (const std::bad_alloc&) {
        // PreEvaluate needs memory only if the evaluation is not open.
        fIsOpen = false;
        fIsOwn = true;
    }
}

// The manager does not report whether an evaluation is open, and opening one once more changes
// nothing. That it was opened here shows in one of four things:
//  - there is a release event, which stands from PostEvaluate to the next PreEvaluate;
//  - a buffer joins the batch;
//  - the batch has another acquire event;
//  - the acquire failed, and was reported.
void OpenEvaluation::open(const TopenCLSharedBuffer& witness)
{
    const bool wasClosed = *manager().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr) != nullptr;
    const bool wasInBatch = witness.fInBatch;
    const AutoCLObject<cl_event> before = acquireEventOf(witness);
    std::optional<WarningCapture> warnings;
    if (!wasClosed && wasInBatch && !before.get())
        warnings.emplace();
    manager().PreEvaluate(fId);
    fAcquired = acquireEventOf(witness);
    fIsOwn = wasClosed || witness.fInBatch != wasInBatch || fAcquired.get() != before.get() ||
             (warnings && !warnings->text().empty());
}

OpenEvaluation::~OpenEvaluation()
{
    if (!fIsOwn)
        return;
    // Twice, because memory can be short before the release or after it, when the batch is rebuilt.
    for (int attempt = 0; attempt < 2; ++attempt) {
        try {
            manager().PostEvaluate(fId);
            return;
        } catch (const std::bad_alloc&) {
            // The next PreEvaluate rebuilds the batch.
        }
    }
}

} // namespace vyra
