// Results as a table, as JSON, and beside those of another run.
#pragma once

#include "harness/Comparison.h"

#include <filesystem>
#include <map>
#include <ostream>
#include <string>
#include <vector>

#include <QJsonObject>

// Where and how the figures came to be.
struct RunDescription {
    std::string processor;
    std::string platform; // name and version of the OpenCL platform
    std::string device;
    Effort effort;
};

// The processor's name as the system tells it, or "unknown processor".
std::string processorName();

// Adds the counts of readInstructionCounts to the results of the same names.
void addInstructionCounts(std::vector<GroupResult>& results,
                          const std::map<std::string, double>& counts);

// A Markdown table, its columns aligned.
void writeTable(std::ostream& output, const std::vector<GroupResult>& results);

QJsonObject toJson(const RunDescription& run, const std::vector<GroupResult>& results);
// False when the file cannot be written.
bool writeJson(const std::filesystem::path& path, const QJsonObject& json);

// The ratios of each case in an earlier run, read from its JSON; by the name of group and case.
// Throws std::runtime_error when the file is not the JSON of a run.
std::map<std::string, double> readRatios(const std::filesystem::path& path);

// The cases of both runs, with the change of the ratio; what changed by more than the noise is
// marked.
void writeChanges(std::ostream& output, const std::vector<GroupResult>& results,
                  const std::map<std::string, double>& earlier);
