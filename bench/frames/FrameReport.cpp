#include "frames/FrameReport.h"

#include "harness/Goal.h"
#include "harness/Table.h"

#include <cstdio>
#include <iterator>
#include <string>

#include <QJsonArray>

namespace {

// Goals for the time of the shared path, relative to other paths.
struct FrameGoals {
    int characters;
    double toCpu;
    double toReadBack;
};
constexpr const char* kContentOfGoals = "skin-twist";
constexpr FrameGoals kGoals[] = {
    {1, 3, 0.95}, {16, 1.5, 0.85}, {156, 1.4, 0.7}, {500, 1.4, 0.85}, {1560, 1.4, 0.85}};

// Goal for the time per character in a large crowd, relative to a medium one.
constexpr int kMediumCrowd = 156;
constexpr int kLargeCrowd = 1560;
constexpr double kGrowth = 1.05;

// One line of the table of goals.
struct Comparison {
    std::string content;
    std::string crowd;
    std::string name;
    Spread ratio;
    double undisturbed; // the quotient of the 10th percentiles of both times
    Goal goal;
};

std::string fixed(double value, int digits)
{
    char text[32];
    std::snprintf(text, sizeof text, "%.*f", digits, value);
    return text;
}

double perFrame(std::size_t count, const PathTimes& path)
{
    return static_cast<double>(count) / static_cast<double>(path.milliseconds.size());
}

Goal goalOf(const CrowdTimes& crowd, const std::string& other)
{
    for (const FrameGoals& goals : kGoals) {
        if (crowd.content->name != std::string(kContentOfGoals) ||
            crowd.characters != goals.characters)
            continue;
        if (other == kCpu)
            return Goal::ratio(goals.toCpu);
        if (other == kReadBack)
            return Goal::ratio(goals.toReadBack);
    }
    return {};
}

const CrowdTimes* crowdOf(const std::vector<CrowdTimes>& crowds, int characters)
{
    for (const CrowdTimes& crowd : crowds) {
        if (crowd.content->name == std::string(kContentOfGoals) && crowd.characters == characters &&
            crowd.find(kShared))
            return &crowd;
    }
    return nullptr;
}

void addGrowth(const std::vector<CrowdTimes>& crowds, std::vector<Comparison>& all)
{
    const CrowdTimes* medium = crowdOf(crowds, kMediumCrowd);
    const CrowdTimes* large = crowdOf(crowds, kLargeCrowd);
    if (!medium || !large)
        return;
    const Spread few = spreadOf(medium->find(kShared)->milliseconds);
    const Spread many = spreadOf(large->find(kShared)->milliseconds);
    const double crowd = static_cast<double>(kLargeCrowd) / kMediumCrowd;
    all.push_back({kContentOfGoals,
                   std::to_string(kLargeCrowd) + ", " + std::to_string(kMediumCrowd),
                   "shared, per character",
                   {many.median / few.median / crowd, many.low / few.high / crowd,
                    many.high / few.low / crowd},
                   many.low / few.low / crowd,
                   Goal::ratio(kGrowth)});
}

double lowOf(const CrowdTimes& crowd, const char* path)
{
    return spreadOf(crowd.find(path)->milliseconds).low;
}

std::vector<Comparison> comparisonsOf(const std::vector<CrowdTimes>& crowds)
{
    std::vector<Comparison> all;
    for (const CrowdTimes& crowd : crowds) {
        for (const char* other : {kCpu, kReadBack, kPlainCpu, kMemoryOneCore, kMemoryAllCores}) {
            const Spread ratio = crowd.ratio(kShared, other);
            if (ratio.median > 0)
                all.push_back({crowd.content->name, std::to_string(crowd.characters),
                               std::string(kShared) + " / " + other, ratio,
                               lowOf(crowd, kShared) / lowOf(crowd, other), goalOf(crowd, other)});
        }
    }
    addGrowth(crowds, all);
    return all;
}

std::string verdictOf(const Comparison& comparison)
{
    Measurement measurement{};
    measurement.ratio = comparison.ratio;
    return textOf(judge(comparison.goal, measurement));
}

std::string limitOf(const Comparison& comparison)
{
    return comparison.goal.kind == Goal::Kind::kReported ? "" : textOf(comparison.goal);
}

QJsonObject toJson(const Spread& spread)
{
    return {{"median", spread.median}, {"low", spread.low}, {"high", spread.high}};
}

QJsonObject toJson(const CrowdTimes& crowd, const PathTimes& path)
{
    return {{"content", crowd.content->name},
            {"path", QString::fromStdString(path.name)},
            {"characters", crowd.characters},
            {"vertices", static_cast<qint64>(crowd.vertices)},
            {"frames", static_cast<qint64>(path.milliseconds.size())},
            {"milliseconds", toJson(spreadOf(path.milliseconds))},
            {"allocations", QJsonObject{{"library", perFrame(path.allocations.library, path)},
                                        {"program", perFrame(path.allocations.program, path)},
                                        {"others", perFrame(path.allocations.others, path)}}}};
}

} // namespace

void writeTimes(std::ostream& output, const std::vector<CrowdTimes>& crowds)
{
    Table table({"content", "characters", "vertices", "path", "frames", "ms", "10 %", "90 %",
                 "us/character", "new: library", "program", "others"});
    for (const CrowdTimes& crowd : crowds) {
        for (const PathTimes& path : crowd.paths) {
            const Spread spread = spreadOf(path.milliseconds);
            table.add({crowd.content->name, std::to_string(crowd.characters),
                       std::to_string(crowd.vertices), path.name,
                       std::to_string(path.milliseconds.size()), fixed(spread.median, 3),
                       fixed(spread.low, 3), fixed(spread.high, 3),
                       fixed(1000 * spread.median / crowd.characters, 1),
                       fixed(perFrame(path.allocations.library, path), 1),
                       fixed(perFrame(path.allocations.program, path), 1),
                       fixed(perFrame(path.allocations.others, path), 1)});
        }
    }
    table.write(output);
}

void writeGoals(std::ostream& output, const std::vector<CrowdTimes>& crowds)
{
    Table table({"content", "characters", "comparison", "ratio", "10 %", "90 %", "of the 10 %",
                 "goal", "verdict"});
    for (const Comparison& comparison : comparisonsOf(crowds)) {
        table.add({comparison.content, comparison.crowd, comparison.name,
                   fixed(comparison.ratio.median, 2), fixed(comparison.ratio.low, 2),
                   fixed(comparison.ratio.high, 2), fixed(comparison.undisturbed, 2),
                   limitOf(comparison), verdictOf(comparison)});
    }
    table.write(output);
}

QJsonObject toJson(const std::vector<CrowdTimes>& crowds)
{
    QJsonArray rows;
    for (const CrowdTimes& crowd : crowds) {
        for (const PathTimes& path : crowd.paths)
            rows.append(toJson(crowd, path));
    }
    QJsonArray goals;
    for (const Comparison& comparison : comparisonsOf(crowds)) {
        goals.append(QJsonObject{{"content", QString::fromStdString(comparison.content)},
                                 {"characters", QString::fromStdString(comparison.crowd)},
                                 {"comparison", QString::fromStdString(comparison.name)},
                                 {"ratio", toJson(comparison.ratio)},
                                 {"undisturbed", comparison.undisturbed},
                                 {"goal", QString::fromStdString(limitOf(comparison))},
                                 {"verdict", QString::fromStdString(verdictOf(comparison))}});
    }
    return {{"rows", rows}, {"comparisons", goals}};
}
