#include "viewer/app/Report.h"

#include <algorithm>
#include <cmath>
#include <iomanip>
#include <sstream>

namespace viewer {
namespace {

// Writes lines of a label and what belongs to it.
class Lines {
public:
    std::ostream& operator()(const char* label)
    {
        fText << "\n  " << std::left << std::setw(kLabelWidth) << label;
        return fText;
    }
    std::string text() const { return fText.str() + "\n"; }

private:
    static constexpr int kLabelWidth = 22;
    std::ostringstream fText{"vyra-viewer report", std::ios::ate};
};

double perEvaluation(std::size_t commands, std::size_t evaluations)
{
    return evaluations > 0 ? static_cast<double>(commands) / static_cast<double>(evaluations) : 0.0;
}

std::string mebibytes(std::size_t bytes)
{
    constexpr double kBytesPerMebibyte = 1024.0 * 1024.0;
    std::ostringstream text;
    text << std::fixed << std::setprecision(2) << static_cast<double>(bytes) / kBytesPerMebibyte
         << " MiB";
    return text.str();
}

void addOpenCL(const OpenCLFacts& cl, Lines& line)
{
    line("OpenCL device") << cl.device << (cl.doublePrecision ? ", double" : ", single")
                          << " precision";
    line("OpenGL to OpenCL") << cl.graphicsToCL;
    line("OpenCL to OpenGL") << cl.clToGraphics;
}

void addMeshes(const RunFacts& facts, Lines& line)
{
    line("Characters") << facts.characters;
    line("Meshes") << facts.share.meshes << " with " << facts.vertices << " vertices";
    line("Deformers") << facts.deformers;
    line("Deformed by") << deformedBy(facts.share);
}

void addCounts(const OpenCLFacts& cl, Lines& line)
{
    const vyra::EvaluatorCounts& counts = cl.counts;
    line("Acquires per frame") << std::setprecision(3)
                               << perEvaluation(counts.acquires, counts.evaluations);
    line("Releases per frame") << perEvaluation(counts.releases, counts.evaluations);
    line("Kernels") << counts.programsBuilt << " programs built, " << counts.kernelsCreated
                    << " kernels created";
    line("Pool buffers") << counts.buffersCreated << " created, " << counts.buffersReused
                         << " times reused";
    line("Device memory") << mebibytes(cl.deviceBytes) << ", at most "
                          << mebibytes(cl.peakDeviceBytes);
}

void addDeviation(const Deviation& deviation, const MeshShare& share, Lines& line)
{
    line("Largest deviation") << std::scientific << std::setprecision(2) << deviation.position
                              << " of a character's size (bound " << kPositionBound << "), normals "
                              << deviation.normal << " (bound " << deviation.normalBound
                              << "): " << (deviation.withinBound() ? "passed" : "FAILED");
    if (share.allOnCpu())
        line("") << "Nothing ran on OpenCL: the CPU was compared with itself.";
}

} // namespace

double percentile(std::vector<double> values, double part)
{
    if (values.empty())
        return 0;
    std::sort(values.begin(), values.end());
    const double rank = std::ceil(part * static_cast<double>(values.size()));
    const auto index = static_cast<std::size_t>(std::max(rank, 1.0)) - 1;
    return values[std::min(index, values.size() - 1)];
}

std::string reportText(const RunFacts& facts)
{
    Lines line;
    if (facts.openCL)
        addOpenCL(*facts.openCL, line);
    line("OpenGL renderer") << facts.renderer;
    addMeshes(facts, line);
    line("Frames") << facts.evaluationMs.size();
    line("Evaluation time") << std::fixed << std::setprecision(2)
                            << percentile(facts.evaluationMs, 0.5) << " ms median, "
                            << percentile(facts.evaluationMs, 0.95) << " ms 95th percentile"
                            << std::defaultfloat;
    if (facts.openCL)
        addCounts(*facts.openCL, line);
    if (facts.deviation)
        addDeviation(*facts.deviation, facts.share, line);
    return line.text();
}

} // namespace viewer
