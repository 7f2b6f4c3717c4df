// The contents of the reports: the diagnostics, and the results of all rules.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"
#include "tools/info/rules/Decisions.h"
#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/rules/Variables.h"

#include <optional>
#include <string>
#include <vector>

namespace info {

// The exit codes of the process, documented in --help.
enum class ExitCode {
    kOn = 0,
    kOff = 1,
    kUsage = 2,
    kSelfTestFailed = 3,
    kNoGraphics = 4,
};

struct Explanation {
    Diagnostics diagnostics;
    std::optional<StartUpFailure> failure;
    std::vector<Decision> decisions;
    std::vector<VariableReport> variables;
    ExitCode exitCode = ExitCode::kOff;
    std::string summary; // one sentence
};

[[nodiscard]] Explanation explain(Diagnostics diagnostics);

} // namespace info
