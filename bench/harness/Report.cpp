#include "harness/Report.h"

#include "harness/Table.h"

#include <cmath>
#include <cstdio>
#include <fstream>
#include <stdexcept>

#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>

namespace {

// The key of a case, in files of instruction counts and of results.
std::string keyOf(const GroupResult& group, const CaseResult& subject)
{
    return group.name + ": " + subject.name;
}

std::string number(double value, int decimals)
{
    char text[32];
    std::snprintf(text, sizeof text, "%.*f", decimals, value);
    return text;
}

// Formats a duration in the unit that fits.
std::string duration(double nanoseconds)
{
    if (nanoseconds >= 1e6)
        return number(nanoseconds / 1e6, 2) + " ms";
    if (nanoseconds >= 1e4)
        return number(nanoseconds / 1e3, 1) + " us";
    return number(nanoseconds, 1) + " ns";
}

std::string range(const Spread& spread, int decimals)
{
    return number(spread.low, decimals) + " - " + number(spread.high, decimals);
}

std::string text(const std::optional<double>& value, int decimals)
{
    return value ? number(*value, decimals) : "";
}

// The goals apply to this library only.
std::string verdictText(const CaseResult& subject)
{
    return subject.thirdParty.empty() ? textOf(judge(subject.goal, subject.measurement))
                                      : "third party";
}

QJsonObject toJson(const Spread& spread)
{
    return {{"median", spread.median}, {"p10", spread.low}, {"p90", spread.high}};
}

QJsonObject toJson(const CaseResult& subject)
{
    const Measurement& measured = subject.measurement;
    QJsonObject json{{"name", QString::fromStdString(subject.name)},
                     {"nanoseconds", toJson(measured.nanoseconds)},
                     {"ratio", toJson(measured.ratio)},
                     {"goal", QString::fromStdString(textOf(subject.goal))},
                     {"verdict", QString::fromStdString(verdictText(subject))}};
    if (!subject.thirdParty.empty())
        json["thirdParty"] = QString::fromStdString(subject.thirdParty);
    if (measured.instructions)
        json["instructions"] = *measured.instructions;
    if (measured.instructionRatio)
        json["instructionRatio"] = *measured.instructionRatio;
    return json;
}

} // namespace

std::string cpuName()
{
    constexpr std::string_view kKey = "model name";
    std::ifstream file("/proc/cpuinfo");
    for (std::string line; std::getline(file, line);) {
        if (line.starts_with(kKey))
            return line.substr(line.find(':') + 2);
    }
    return "unknown CPU";
}

void addInstructionCounts(std::vector<GroupResult>& results,
                          const std::map<std::string, double>& counts)
{
    for (GroupResult& group : results) {
        std::optional<double> baseline;
        for (CaseResult& subject : group.cases) {
            const auto found = counts.find(keyOf(group, subject));
            if (found == counts.end())
                continue;
            subject.measurement.instructions = found->second;
            if (&subject == &group.cases.front())
                baseline = found->second;
            if (baseline && *baseline > 0)
                subject.measurement.instructionRatio = found->second / *baseline;
        }
    }
}

void writeTable(std::ostream& output, const std::vector<GroupResult>& results)
{
    Table table({"operation", "time", "ratio", "p10 - p90", "instructions", "ratio by count",
                 "goal", "verdict"});
    for (const GroupResult& group : results) {
        table.add({"**" + group.name + "**", "", "", range(group.control, 2), "", "", "", "A/A"});
        for (const CaseResult& subject : group.cases) {
            const Measurement& measured = subject.measurement;
            const bool isBaseline = &subject == &group.cases.front();
            table.add({subject.name, duration(measured.nanoseconds.median),
                       isBaseline ? "" : number(measured.ratio.median, 3),
                       isBaseline ? "" : range(measured.ratio, 2), text(measured.instructions, 0),
                       isBaseline ? "" : text(measured.instructionRatio, 3),
                       isBaseline ? "" : textOf(subject.goal), verdictText(subject)});
        }
    }
    table.write(output);
}

QJsonObject toJson(const RunDescription& run, const std::vector<GroupResult>& results)
{
    QJsonArray groups;
    for (const GroupResult& group : results) {
        QJsonArray cases;
        for (const CaseResult& subject : group.cases)
            cases.append(toJson(subject));
        groups.append(QJsonObject{{"name", QString::fromStdString(group.name)},
                                  {"control", toJson(group.control)},
                                  {"cases", cases}});
    }
    return {{"cpu", QString::fromStdString(run.cpu)},
            {"platform", QString::fromStdString(run.platform)},
            {"device", QString::fromStdString(run.device)},
            {"rounds", run.effort.rounds},
            {"sampleNanoseconds", run.effort.sample.count()},
            {"groups", groups}};
}

bool writeJson(const std::filesystem::path& path, const QJsonObject& json)
{
    QFile file(path);
    return file.open(QIODevice::WriteOnly) && file.write(QJsonDocument(json).toJson()) > 0;
}

std::map<std::string, double> readRatios(const std::filesystem::path& path)
{
    QFile file(path);
    if (!file.open(QIODevice::ReadOnly))
        throw std::runtime_error(path.string() + " cannot be read");
    const QJsonObject json = QJsonDocument::fromJson(file.readAll()).object();
    if (!json["groups"].isArray())
        throw std::runtime_error(path.string() + " holds no results of a run");

    std::map<std::string, double> ratios;
    for (const auto& group : json["groups"].toArray()) {
        for (const auto& subject : group.toObject()["cases"].toArray()) {
            const QString key =
                group.toObject()["name"].toString() + ": " + subject.toObject()["name"].toString();
            ratios[key.toStdString()] = subject.toObject()["ratio"].toObject()["median"].toDouble();
        }
    }
    return ratios;
}

void writeChanges(std::ostream& output, const std::vector<GroupResult>& results,
                  const std::map<std::string, double>& earlier)
{
    Table table({"operation", "ratio before", "ratio now", "change", ""});
    for (const GroupResult& group : results) {
        for (auto subject = group.cases.begin() + 1; subject < group.cases.end(); ++subject) {
            const auto found = earlier.find(keyOf(group, *subject));
            if (found == earlier.end() || found->second <= 0)
                continue;
            const Spread& ratio = subject->measurement.ratio;
            const bool isBeyondNoise = found->second < ratio.low || found->second > ratio.high;
            const double percent = 100 * (ratio.median / found->second - 1);
            const char* change = percent < 0 ? "faster" : "SLOWER";
            table.add({keyOf(group, *subject), number(found->second, 3), number(ratio.median, 3),
                       number(percent, 1) + " %", isBeyondNoise ? change : ""});
        }
    }
    table.write(output);
}
