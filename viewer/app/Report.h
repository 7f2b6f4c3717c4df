// What the viewer tells at the end.
#pragma once

#include "evaluator/Evaluator.h"
#include "viewer/opencl/MeshShare.h"
#include "viewer/opencl/Verification.h"

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

namespace viewer {

// How OpenCL was used.
struct OpenCLFacts {
    std::string device;
    std::string graphicsToCL; // the two synchronisation modes
    std::string clToGraphics;
    bool doublePrecision = false;
    vyra::EvaluatorCounts counts;
    std::size_t deviceBytes = 0;
    std::size_t peakDeviceBytes = 0;
};

struct RunFacts {
    std::optional<OpenCLFacts> openCL; // empty: everything was deformed on the CPU
    std::string renderer;
    std::size_t characters = 0;
    MeshShare share;                  // of the meshes of all characters
    std::size_t vertices = 0;         // of all characters
    std::string deformers;            // the chain
    std::vector<double> evaluationMs; // of each frame, from its start until it could be drawn
    std::optional<Deviation> deviation;
};

std::string reportText(const RunFacts& facts);

// The smallest of the values that at least this part (0 to 1) of all does not exceed. 0 for none.
double percentile(std::vector<double> values, double part);

} // namespace viewer
