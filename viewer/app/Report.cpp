#include "viewer/app/Report.h"

#include <algorithm>
#include <cmath>
#include <iomanip>
#include <sstream>

namespace viewer {
namespace {

// Writes lines of a label and a value.
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

void addOpenCL(const OpenCLStatistics& cl, Lines& line)
{
    line("OpenCL device") << cl.device << (cl.doublePrecision ? ", double" : ", single")
                          << " precision";
    line("OpenGL to OpenCL") << cl.graphicsToCL;
    line("OpenCL to OpenGL") << cl.clToGraphics;
}

void addMeshes(const RunStatistics& run, Lines& line)
{
    line("Characters") << run.characters;
    line("Meshes") << run.distribution.meshes << " with " << run.vertices << " vertices";
    line("Deformers") << run.deformers;
    line("Deformed by") << deformedBy(run.distribution);
}

void addCounts(const OpenCLStatistics& cl, Lines& line)
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

void addDeviation(const Deviation& deviation, const MeshDistribution& distribution, Lines& line)
{
    line("Largest deviation") << std::scientific << std::setprecision(2) << deviation.position
                              << " of a character's size (bound " << kPositionBound << "), normals "
                              << deviation.normal << " (bound " << deviation.normalBound
                              << "): " << (deviation.withinBound() ? "passed" : "FAILED");
    if (distribution.allOnCpu())
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

std::string reportText(const RunStatistics& run)
{
    Lines line;
    if (run.openCL)
        addOpenCL(*run.openCL, line);
    line("OpenGL renderer") << run.renderer;
    addMeshes(run, line);
    line("Frames") << run.evaluationMs.size();
    line("Evaluation time") << std::fixed << std::setprecision(2)
                            << percentile(run.evaluationMs, 0.5) << " ms median, "
                            << percentile(run.evaluationMs, 0.95) << " ms 95th percentile"
                            << std::defaultfloat;
    if (run.openCL)
        addCounts(*run.openCL, line);
    if (run.deviation)
        addDeviation(*run.deviation, run.distribution, line);
    return line.text();
}

} // namespace viewer
