// The results as a table and as JSON, and their comparison with an earlier run.
#pragma once

#include "harness/Comparison.h"

#include <filesystem>
#include <map>
#include <ostream>
#include <string>
#include <vector>

#include <QJsonObject>

// The machine and the effort of a run.
struct RunDescription {
    std::string cpu;
    std::string platform; // name and version of the OpenCL platform
    std::string device;
    Effort effort;
};

// Returns the CPU's name, or "unknown CPU".
std::string cpuName();

// Adds the counts of readInstructionCounts to the results with the same names.
void addInstructionCounts(std::vector<GroupResult>& results,
                          const std::map<std::string, double>& counts);

// Writes a Markdown table with aligned columns.
void writeTable(std::ostream& output, const std::vector<GroupResult>& results);

QJsonObject toJson(const RunDescription& run, const std::vector<GroupResult>& results);
// Returns false if the file cannot be written.
[[nodiscard]] bool writeJson(const std::filesystem::path& path, const QJsonObject& json);

// Returns the ratio of each case of an earlier run, by group and case, from its JSON file. Throws
// std::runtime_error if the file is not the JSON of a run.
std::map<std::string, double> readRatios(const std::filesystem::path& path);

// Writes the change of the ratio for each case of both runs. Marks changes beyond the noise.
void writeChanges(std::ostream& output, const std::vector<GroupResult>& results,
                  const std::map<std::string, double>& earlier);
