#include "tools/info/selftest/SelfTestRun.h"

#include "runtime/TopenCLInfo.h"
#include "tools/info/diagnostics/RenderWindow.h"
#include "tools/info/diagnostics/WarningLog.h"
#include "tools/info/selftest/SelfTestEvaluation.h"

#include <algorithm>

#include <QFile>
#include <QOpenGLExtraFunctions>

namespace info {
namespace {

constexpr std::size_t kVertices = 10000; // a character's face; above every default minimum
// Enough for a median; the whole test takes well under a second on a CPU.
constexpr int kEvaluations = 15;

double median(std::vector<double> values)
{
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    return *middle;
}

std::string kernelText()
{
    QFile file(":/kernels/self_test.cl");
    return file.open(QIODevice::ReadOnly) ? file.readAll().toStdString() : std::string();
}

// Runs the evaluations without waits, as a host does, and then again with a wait after each stage,
// to measure the stages.
void runEvaluations(SelfTestEvaluation& evaluation, SelfTest& test)
{
    std::vector<double> whole, acquire, kernel, release, read;
    for (int index = 0; index < 2 * kEvaluations; ++index) {
        const bool inStages = index >= kEvaluations;
        const EvaluationTimes times = evaluation.run(index, inStages);
        if (!evaluation.problem().empty())
            break;
        ++test.evaluations;
        read.push_back(times.read);
        if (inStages) {
            acquire.push_back(times.acquire);
            kernel.push_back(times.kernel);
            release.push_back(times.release);
        } else {
            whole.push_back(times.whole);
        }
    }
    test.problem = evaluation.problem();
    test.status = evaluation.status();
    if (!test.problem.empty())
        return;
    test.passed = true;
    test.times.firstEvaluation = whole.front();
    test.times.evaluation = median(whole);
    test.times.acquire = median(acquire);
    test.times.kernel = median(kernel);
    test.times.release = median(release);
    test.times.read = median(read);
}

} // namespace

SelfTest runSelfTest(RenderWindow& window, WarningLog& warnings)
{
    SelfTest test;
    test.vertices = kVertices;
    {
        // The self-test uses OpenCL whatever the minimum number of vertices.
        TopenCLInfo::theOne().setUseMinimumBufferSize(false);
        SelfTestEvaluation evaluation(*window.context().extraFunctions(), kVertices, kernelText());
        const Stopwatch building;
        evaluation.prepare();
        test.times.kernelBuild = building.milliseconds();
        test.problem = evaluation.problem();
        test.status = evaluation.status();
        if (test.problem.empty())
            runEvaluations(evaluation, test);
        TopenCLInfo::theOne().setUseMinimumBufferSize(true);
    }
    test.warnings = warnings.take();
    return test;
}

} // namespace info
