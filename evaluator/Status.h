// The result of an operation of the evaluator.
#pragma once

#include <string>
#include <utility>

#include <CL/cl.h>

namespace vyra {

// Success, or a message for the user that names the mesh, the deformer and the reason, with the
// build log if a kernel does not compile. A plain value.
struct [[nodiscard]] Status {
    std::string message;        // empty on success
    cl_int openCL = CL_SUCCESS; // the OpenCL status that caused the failure, if any

    Status() = default;
    explicit Status(std::string text, cl_int status = CL_SUCCESS)
        : message(std::move(text)), openCL(status)
    {
    }

    bool ok() const { return message.empty(); }
};

} // namespace vyra
