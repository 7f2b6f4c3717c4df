// How a step of the viewer says that it cannot go on.
#pragma once

#include <optional>
#include <string>
#include <utility>
#include <variant>

namespace viewer {

// What the process answers to the shell. Documented in --help.
enum class ExitCode {
    kSuccess = 0,
    kDeviation = 1,   // --verify found a vertex beyond the bound
    kUsage = 2,       // wrong options
    kModel = 3,       // the model cannot be used
    kNoGraphics = 4,  // no display, or no OpenGL 3.3
    kNoOpenCL = 5,    // no OpenCL that shares buffers with OpenGL
    kOutput = 6,      // a picture or the trace cannot be written
    kOpenCLError = 7, // OpenCL failed while the viewer was running
    kOutOfMemory = 8,
    kInterrupted = 130, // by Ctrl-C, as shells number it
};

// One sentence for the user that says what to do, and the exit code that goes with it.
struct Failure {
    ExitCode code;
    std::string text;
};

// Empty when all went well.
using Status = std::optional<Failure>;

// A value or the reason why there is none.
template <typename T>
class Result {
public:
    Result(T value) : fContent(std::move(value)) {}
    Result(Failure failure) : fContent(std::move(failure)) {}

    explicit operator bool() const { return std::holds_alternative<T>(fContent); }
    T& value() { return std::get<T>(fContent); }
    const T& value() const { return std::get<T>(fContent); }
    const Failure& failure() const { return std::get<Failure>(fContent); }

private:
    std::variant<T, Failure> fContent;
};

} // namespace viewer
