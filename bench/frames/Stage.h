// Crowds that go through all paths, frame after frame.
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

// What was measured of one path.
struct PathTimes {
    std::string name;
    std::vector<double> milliseconds{}; // of each frame that was timed
    Allocations allocations{};          // in all of them
};

// What was measured of one crowd.
struct CrowdTimes {
    const Content* content = nullptr;
    int characters = 0;
    std::size_t vertices = 0;
    std::vector<PathTimes> paths{};

    // Null if the path was not measured.
    const PathTimes* find(const std::string& name) const;
    // The times of one path over those of another in the same frames; all zero if one of them was
    // not measured.
    Spread ratio(const std::string& name, const std::string& to) const;
};

struct StageSettings {
    int frames = 0;   // of each path; 0: as many as the size of the crowd asks for
    std::string only; // one path; empty: all
};

// Throws std::runtime_error if a path fails, or if its last frame deviates from the reference.
CrowdTimes measure(QOpenGLFunctions_3_3_Core& gl, const viewer::Model& model,
                   const Content& content, int characters, const StageSettings& settings);
