// Statuses that name what failed. Internal.
#pragma once

#include "evaluator/Status.h"

#include <string_view>

#include <CL/cl.h>

namespace vyra {

class DeformableMesh;
class Deformer;

// Success, or a status that names the operation and the OpenCL status.
Status failureOf(cl_int status, const char* operation);

// The status of the exception that is being handled; never throws.
Status currentException() noexcept;

// Runs steps that return a status, and turns what they throw into a status. Deformers of the host
// may throw anything.
template <typename Steps>
Status guarded(const Steps& steps) noexcept
{
    try {
        return steps();
    } catch (...) {
        return currentException();
    }
}

// Adds who failed, before the message of a failure. Without memory for it the message stays.
Status ofMesh(const DeformableMesh& mesh, Status status) noexcept;
Status ofDeformer(const Deformer& deformer, Status status) noexcept;

} // namespace vyra
