// Results of operations of the viewer that can fail.
#pragma once

#include <optional>
#include <string>
#include <utility>
#include <variant>

namespace viewer {

// Exit codes of the process, as --help documents them.
enum class ExitCode {
    kSuccess = 0,
    kDeviation = 1,   // --verify found a vertex above the bound
    kUsage = 2,       // wrong options
    kModel = 3,       // the model cannot be used
    kNoGraphics = 4,  // no display, or no OpenGL 3.3
    kNoOpenCL = 5,    // no OpenCL that shares buffers with OpenGL
    kOutput = 6,      // a picture or the trace cannot be written
    kOpenCLError = 7, // OpenCL failed while the viewer was running
    kOutOfMemory = 8,
    kInterrupted = 130, // by Ctrl-C, numbered as shells do
};

// Error text for the user, with what to do about it, and the exit code.
struct Failure {
    ExitCode code;
    std::string text;
};

// Empty on success.
using Status = std::optional<Failure>;

// Holds a value, or the failure to produce it.
template <typename T>
class [[nodiscard]] Result {
public:
    Result(T value) : fContent(std::move(value)) {}
    Result(Failure failure) : fContent(std::move(failure)) {}

    explicit operator bool() const noexcept { return std::holds_alternative<T>(fContent); }
    // Throws std::bad_variant_access on a failure.
    [[nodiscard]] T& value() { return std::get<T>(fContent); }
    [[nodiscard]] const T& value() const { return std::get<T>(fContent); }
    // Throws std::bad_variant_access on a value.
    [[nodiscard]] const Failure& failure() const { return std::get<Failure>(fContent); }

private:
    std::variant<T, Failure> fContent;
};

} // namespace viewer
