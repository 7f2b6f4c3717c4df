// The times of whole frames as tables and as JSON, with the goals.
#pragma once

#include "frames/Stage.h"

#include <ostream>
#include <vector>

#include <QJsonObject>

// One row for each crowd and path.
void writeTimes(std::ostream& output, const std::vector<CrowdTimes>& crowds);
// One row for each crowd and comparison of two paths: the ratio, its goal, and whether it is met.
void writeGoals(std::ostream& output, const std::vector<CrowdTimes>& crowds);
// Both.
QJsonObject toJson(const std::vector<CrowdTimes>& crowds);
