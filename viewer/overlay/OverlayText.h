// What the overlay says.
#pragma once

#include "viewer/opencl/MeshShare.h"

#include <cstddef>
#include <optional>
#include <string>

namespace viewer {

struct OverlayFacts {
    struct OpenCL {
        std::string device;
        std::string graphicsToCL; // the two synchronisation modes
        std::string clToGraphics;
        std::size_t batchSize = 0; // vertex buffers
    };
    std::optional<OpenCL> openCL; // empty: everything is deformed on the CPU
    MeshShare share;
    double framesPerSecond = 0;      // 0: not measured yet
    double evaluationMs = 0;         // of late, the median
    std::optional<double> cpuTwinMs; // of the CPU's copy, where it is shown
    bool paused = false;
    std::string deformers; // the chain
};

// Lines of a label and what belongs to it, then the keys in short.
std::string overlayText(const OverlayFacts& facts);

// The first lines of a long text, each cut to a width that fits a window, and how many more there
// are.
std::string beginningOf(const std::string& text);

} // namespace viewer
