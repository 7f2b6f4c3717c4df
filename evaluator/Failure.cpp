#include "evaluator/Failure.h"

#include "evaluator/DeformableMesh.h"
#include "evaluator/Deformer.h"

#include "diagnostics/CLErrorCodes.h"

#include <exception>
#include <new>
#include <string>
#include <utility>

namespace vyra {
namespace {

// Short enough that a string needs no memory for it.
constexpr const char* kOutOfMemory = "out of memory";

Status addName(const char* kind, std::string_view name, Status status) noexcept
{
    if (status.ok())
        return status;
    try {
        status.message = std::string(kind) + " '" + std::string(name) + "': " + status.message;
    } catch (const std::bad_alloc&) {
        // The message stays as it is.
    }
    return status;
}

Status describe(const std::exception& error)
{
    return Status(std::string("it threw an exception: ") + error.what());
}

// Rethrows the exception that is being handled.
Status describeCurrentException()
{
    try {
        throw;
    } catch (const std::bad_alloc&) {
        return Status(kOutOfMemory, CL_OUT_OF_HOST_MEMORY);
    } catch (const std::exception& error) {
        return describe(error);
    } catch (...) {
        return Status("it threw an exception");
    }
}

} // namespace

Status failureOf(cl_int status, const char* operation)
{
    if (status == CL_SUCCESS)
        return {};
    return Status(std::string(operation) + " failed (" + CLErrorCodeStr(status) +
                      "); the vertex buffers keep their last shape",
                  status);
}

Status currentException() noexcept
{
    try {
        return describeCurrentException();
    } catch (...) {
        return Status(kOutOfMemory, CL_OUT_OF_HOST_MEMORY);
    }
}

Status ofMesh(const DeformableMesh& mesh, Status status) noexcept
{
    return addName("mesh", mesh.geometry().name, std::move(status));
}

Status ofDeformer(const Deformer& deformer, Status status) noexcept
{
    return status.ok() ? std::move(status)
                       : addName("deformer", deformer.name(), std::move(status));
}

} // namespace vyra
