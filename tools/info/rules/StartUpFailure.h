// The step that stopped start-up, with reason and remedy.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <optional>
#include <span>
#include <string>

namespace info {

// The texts of a step. StartUpStep::kNotStarted stands for the renderer, without which start-up is
// not attempted.
struct StepText {
    StartUpStep step;
    const char* id;      // in JSON
    const char* title;   // the requirement of the step
    const char* failure; // the summary if the step fails
};

// Returns the steps of a start-up with OpenGL, in order.
std::span<const StepText> stepTexts() noexcept;
const StepText& stepText(StartUpStep step) noexcept;

struct StartUpFailure {
    StartUpStep step;
    std::optional<int> status; // of the OpenCL call that failed
    std::string reason;        // whole sentences
    std::string remedy;        // whole sentences
};

// Returns the failure. Empty if OpenCL is on.
[[nodiscard]] std::optional<StartUpFailure> findStartUpFailure(const Diagnostics& diagnostics);

} // namespace info
