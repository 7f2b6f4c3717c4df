// An evaluation of the shared-buffer manager, open for a scope. Internal.
#pragma once

#include "diagnostics/AutoCLObject.h"
#include "host/EvaluationId.h"
#include "interop/TopenCLSharedBuffer.h"

#include <CL/cl.h>

namespace vyra {

// Opens an evaluation and closes it again. An evaluation that the host opened with the same id
// stays open. On the thread that evaluates.
class OpenEvaluation {
public:
    // `witness` is a buffer of the evaluator, preferably one outside the batch; null if there is
    // none, and then nothing is opened. Borrows both.
    OpenEvaluation(const em::Id& id, const TopenCLSharedBuffer* witness);
    ~OpenEvaluation();
    OpenEvaluation(const OpenEvaluation&) = delete;
    OpenEvaluation& operator=(const OpenEvaluation&) = delete;

    // False if there was no memory to open it: nothing may be deformed.
    bool isOpen() const { return fIsOpen; }
    // Whether the destructor closes it, and whether opening it acquired the batch.
    bool isOwn() const { return fIsOwn; }
    bool acquiredBatch() const { return fIsOwn && fAcquired.get(); }

private:
    void open(const TopenCLSharedBuffer& witness);

    const em::Id& fId;
    AutoCLObject<cl_event> fAcquired; // the batch's acquire; empty if the witness is not in it
    bool fIsOpen = true;
    bool fIsOwn = false;
};

} // namespace vyra
