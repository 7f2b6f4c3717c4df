// Everything that the reports tell: the facts, and the rules' reading of them.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"
#include "tools/info/rules/Decisions.h"
#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/rules/Variables.h"

#include <optional>
#include <string>
#include <vector>

namespace info {

// What the process answers to the shell. Documented in --help.
enum class ExitCode {
    kOn = 0,
    kOff = 1,
    kUsage = 2,
    kSelfTestFailed = 3,
    kNoGraphics = 4,
};

struct Explanation {
    Facts facts;
    std::optional<Stop> stop;
    std::vector<Decision> decisions;
    std::vector<VariableReport> variables;
    ExitCode exitCode = ExitCode::kOff;
    std::string summary; // one sentence
};

Explanation explain(Facts facts);

} // namespace info
