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

// Returns the event with a reference of its own; empty outside the batch.
AutoCLObject<cl_event> acquireEventOf(const TopenCLSharedBuffer& buffer)
{
    AutoCLObject<cl_event> event;
    if (buffer.fInBatch)
        manager().EnqueueAcquireSharedCLBuffer(nullptr, &buffer, event.receive());
    return event;
}

} // namespace

OpenEvaluation::OpenEvaluation(const em::Id& id, const TopenCLSharedBuffer* probe) : fId(id)
{
    if (!probe)
        return;
    try {
        open(*probe);
    } catch (const std::bad_alloc&) {
        // PreEvaluate needs memory only if the evaluation is not open.
        fIsOpen = false;
        fIsOwn = true;
    }
}

// The manager does not report whether an evaluation is open, and opening an open one changes
// nothing. It was opened here if one of these holds:
//  - there was a release event, which exists from PostEvaluate to the next PreEvaluate;
//  - a buffer has joined the batch;
//  - the batch has another acquire event;
//  - the acquire failed, and a warning was issued.
void OpenEvaluation::open(const TopenCLSharedBuffer& probe)
{
    const bool wasClosed = *manager().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr) != nullptr;
    const bool wasInBatch = probe.fInBatch;
    const AutoCLObject<cl_event> before = acquireEventOf(probe);
    std::optional<WarningCapture> warnings;
    if (!wasClosed && wasInBatch && !before.get())
        warnings.emplace();
    manager().PreEvaluate(fId);
    fAcquired = acquireEventOf(probe);
    fIsOwn = wasClosed || probe.fInBatch != wasInBatch || fAcquired.get() != before.get() ||
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
