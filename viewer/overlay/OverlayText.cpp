#include "viewer/overlay/OverlayText.h"

#include <iomanip>
#include <sstream>

namespace viewer {
namespace {

// Size of the shown part of a build log. The first error usually explains the others.
constexpr std::size_t kMostLines = 16;
constexpr std::size_t kMostColumns = 110;

std::ostream& line(std::ostream& text, const char* label)
{
    constexpr int kLabelWidth = 18;
    return text << std::left << std::setw(kLabelWidth) << label;
}

void addOpenCL(const OverlayContent::OpenCL& cl, std::ostream& text)
{
    line(text, "OpenCL device") << cl.device << '\n';
    line(text, "OpenGL to OpenCL") << cl.graphicsToCL << '\n';
    line(text, "OpenCL to OpenGL") << cl.clToGraphics << '\n';
    line(text, "Batch") << cl.batchSize << " vertex buffers\n";
}

} // namespace

std::string overlayText(const OverlayContent& content)
{
    std::ostringstream text;
    text << std::fixed << std::setprecision(2);
    if (content.framesPerSecond > 0)
        line(text, "Frames per second") << content.framesPerSecond << '\n';
    line(text, "Evaluation") << content.evaluationMs << " ms\n";
    if (content.cpuSceneMs)
        line(text, "CPU, on the right") << *content.cpuSceneMs << " ms\n";
    line(text, "Deformed by") << deformedBy(content.distribution) << '\n';
    if (content.openCL)
        addOpenCL(*content.openCL, text);
    line(text, "Deformers") << content.deformers << '\n';
    line(text, "Time") << (content.paused ? "paused\n" : "running\n");
    text << '\n' << content.keys << '\n';
    return text.str();
}

std::string firstLines(const std::string& text)
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
