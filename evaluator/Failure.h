// Statuses that name what failed. Internal.
#pragma once

#include "evaluator/Status.h"

#include <string_view>

#include <CL/cl.h>

namespace vyra {

class DeformableMesh;
class Deformer;

// Returns success, or a status that names the operation and the OpenCL status.
Status failureOf(cl_int status, const char* operation);

// Returns a status for the exception that is being handled.
Status currentException() noexcept;

// Runs steps that return a status, and turns an exception into a status. Deformers of the host may
// throw objects of any type.
template <typename Steps>
Status guarded(const Steps& steps) noexcept
{
    try {
        return steps();
    } catch (...) {
        return currentException();
    }
}

// Prefixes the message of a failure with the name of the mesh or deformer. Out of memory, the
// message stays as it is.
Status ofMesh(const DeformableMesh& mesh, Status status) noexcept;
Status ofDeformer(const Deformer& deformer, Status status) noexcept;

} // namespace vyra
