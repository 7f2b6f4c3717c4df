// A scope in which an evaluation of the shared-buffer manager is open. Internal.
#pragma once

#include "diagnostics/AutoCLObject.h"
#include "host/EvaluationId.h"
#include "interop/TopenCLSharedBuffer.h"

#include <CL/cl.h>

namespace vyra {

// An evaluation that is opened by the constructor and closed by the destructor. An evaluation that
// the host opened with the same id stays open. Used on the thread that evaluates.
class OpenEvaluation {
public:
    // `probe` is a buffer of the evaluator, preferably one outside the batch; if it is
    // null, nothing is opened. Borrows both.
    OpenEvaluation(const em::Id& id, const TopenCLSharedBuffer* probe);
    ~OpenEvaluation();
    OpenEvaluation(const OpenEvaluation&) = delete;
    OpenEvaluation& operator=(const OpenEvaluation&) = delete;

    // Returns false if opening ran out of memory: nothing may be deformed.
    bool isOpen() const noexcept { return fIsOpen; }
    // Return whether the destructor closes it, and whether opening it acquired the batch.
    bool isOwn() const noexcept { return fIsOwn; }
    bool acquiredBatch() const noexcept { return fIsOwn && fAcquired.get(); }

private:
    void open(const TopenCLSharedBuffer& probe);

    const em::Id& fId;
    AutoCLObject<cl_event> fAcquired; // the batch's acquire; empty if the probe is not in it
    bool fIsOpen = true;
    bool fIsOwn = false;
};

} // namespace vyra
