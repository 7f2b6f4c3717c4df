// Text of the overlay.
#pragma once

#include "viewer/opencl/MeshDistribution.h"

#include <cstddef>
#include <optional>
#include <string>

namespace viewer {

struct OverlayContent {
    struct OpenCL {
        std::string device;
        std::string graphicsToCL; // the two synchronisation modes
        std::string clToGraphics;
        std::size_t batchSize = 0; // vertex buffers
    };
    std::optional<OpenCL> openCL; // empty if the CPU deforms everything
    MeshDistribution distribution;
    double framesPerSecond = 0;       // 0 before the first measurement
    double evaluationMs = 0;          // median of the last frames
    std::optional<double> cpuSceneMs; // of the CPU's copy; empty if it is not shown
    bool paused = false;
    std::string deformers; // the chain
    std::string keys;      // summary of the keys
};

// Returns lines of a label and a value, and the summary of the keys.
[[nodiscard]] std::string overlayText(const OverlayContent& content);

// Returns the first lines of a long text, each truncated to a width that fits a window, and the
// number of omitted lines.
[[nodiscard]] std::string firstLines(const std::string& text);

} // namespace viewer
