// Report that the viewer prints at the end.
#pragma once

#include "evaluator/Evaluator.h"
#include "viewer/opencl/MeshDistribution.h"
#include "viewer/opencl/Verification.h"

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

namespace viewer {

// Use of OpenCL.
struct OpenCLStatistics {
    std::string device;
    std::string graphicsToCL; // the two synchronisation modes
    std::string clToGraphics;
    bool doublePrecision = false;
    vyra::EvaluatorCounts counts;
    std::size_t deviceBytes = 0; // of buffers
    std::size_t peakDeviceBytes = 0;
};

// Statistics of one run.
struct RunStatistics {
    std::optional<OpenCLStatistics> openCL; // empty if the CPU deformed everything
    std::string renderer;
    std::size_t characters = 0;
    MeshDistribution distribution;      // of the meshes of all characters
    std::size_t vertices = 0;           // of all characters
    std::string deformers;              // the chain
    std::vector<double> evaluationMs;   // of each frame, from its start until it is ready to draw
    std::optional<Deviation> deviation; // empty without --verify
};

[[nodiscard]] std::string reportText(const RunStatistics& run);

// Returns the smallest value that is not less than the fraction `part` (0 to 1) of all values
// (nearest-rank percentile). Returns 0 for no values.
[[nodiscard]] double percentile(std::vector<double> values, double part);

} // namespace viewer
