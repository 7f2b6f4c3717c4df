// The times of whole frames, with the goals, as tables and as JSON.
#pragma once

#include "frames/Stage.h"

#include <ostream>
#include <vector>

#include <QJsonObject>

// Writes one row for each crowd and path.
void writeTimes(std::ostream& output, const std::vector<CrowdTimes>& crowds);
// Writes one row for each crowd and comparison of two paths: the ratio, the goal and the verdict.
void writeGoals(std::ostream& output, const std::vector<CrowdTimes>& crowds);
// Returns times and comparisons.
QJsonObject toJson(const std::vector<CrowdTimes>& crowds);
