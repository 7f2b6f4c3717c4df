#include "viewer/overlay/OverlayText.h"

#include "viewer/app/Controls.h"

#include <iomanip>
#include <sstream>

namespace viewer {
namespace {

// So much of a build log can be read at a glance; the first error explains the others.
constexpr std::size_t kMostLines = 16;
constexpr std::size_t kMostColumns = 110;

std::ostream& line(std::ostream& text, const char* label)
{
    constexpr int kLabelWidth = 18;
    return text << std::left << std::setw(kLabelWidth) << label;
}

void addOpenCL(const OverlayFacts::OpenCL& cl, std::ostream& text)
{
    line(text, "OpenCL device") << cl.device << '\n';
    line(text, "OpenGL to OpenCL") << cl.graphicsToCL << '\n';
    line(text, "OpenCL to OpenGL") << cl.clToGraphics << '\n';
    line(text, "Batch") << cl.batchSize << " vertex buffers\n";
}

} // namespace

std::string overlayText(const OverlayFacts& facts)
{
    std::ostringstream text;
    text << std::fixed << std::setprecision(2);
    if (facts.framesPerSecond > 0)
        line(text, "Frames per second") << facts.framesPerSecond << '\n';
    line(text, "Evaluation") << facts.evaluationMs << " ms\n";
    if (facts.cpuTwinMs)
        line(text, "CPU, on the right") << *facts.cpuTwinMs << " ms\n";
    line(text, "Deformed by") << deformedBy(facts.share) << '\n';
    if (facts.openCL)
        addOpenCL(*facts.openCL, text);
    line(text, "Deformers") << facts.deformers << '\n';
    line(text, "Time") << (facts.paused ? "paused\n" : "running\n");
    text << '\n' << keyReminder() << '\n';
    return text.str();
}

std::string beginningOf(const std::string& text)
{
    std::istringstream lines(text);
    std::string beginning;
    std::size_t count = 0;
    for (std::string each; std::getline(lines, each); ++count) {
        if (count < kMostLines)
            beginning += each.substr(0, kMostColumns) + '\n';
    }
    if (count > kMostLines)
        beginning += "... and " + std::to_string(count - kMostLines) + " more lines\n";
    return beginning;
}

} // namespace viewer
