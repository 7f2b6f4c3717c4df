// The measurement of crowds on all paths.
#pragma once

#include "frames/Allocations.h"
#include "frames/Content.h"
#include "frames/Path.h"
#include "harness/Statistics.h"

#include <memory>
#include <string>
#include <vector>

#include <QOpenGLFunctions_3_3_Core>

// The names of the paths.
inline constexpr const char* kShared = "shared";
inline constexpr const char* kReadBack = "read back";
inline constexpr const char* kCpu = "CPU";
inline constexpr const char* kPlainCpu = "plain CPU";
inline constexpr const char* kMemoryOneCore = "memory, 1 core";
inline constexpr const char* kMemoryAllCores = "memory, all cores";

// The measurements of one path.
struct PathTimes {
    std::string name;
    std::vector<double> milliseconds{}; // of each timed frame
    Allocations allocations{};          // in all timed frames
};

// The measurements of one crowd.
struct CrowdTimes {
    const Content* content = nullptr;
    int characters = 0;
    std::size_t vertices = 0;
    std::vector<PathTimes> paths{};

    // Returns null if the path was not measured.
    const PathTimes* find(const std::string& name) const;
    // Returns the ratio of the times of two paths in the same frames; zeros if one of them was not
    // measured.
    Spread ratio(const std::string& name, const std::string& to) const;
};

struct StageSettings {
    int frames = 0;   // of each path; 0: depends on the size of the crowd
    std::string only; // one path; empty: all
};

// Plays and measures all frames. Throws std::runtime_error if a path fails, or if its last frame
// deviates from the reference.
[[nodiscard]] CrowdTimes measure(QOpenGLFunctions_3_3_Core& gl, const viewer::Model& model,
                                 const Content& content, int characters,
                                 const StageSettings& settings);
