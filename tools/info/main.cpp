// vyra-opencl-info: reports whether the library's OpenCL is on, and why.
#include "tools/info/Options.h"
#include "tools/info/diagnostics/DiagnosticsCollection.h"
#include "tools/info/diagnostics/RenderWindow.h"
#include "tools/info/diagnostics/WarningLog.h"
#include "tools/info/report/JsonReport.h"
#include "tools/info/report/TextReport.h"
#include "tools/info/selftest/SelfTestRun.h"

#include <cstdio>
#include <cstdlib>

#include <QCoreApplication>

namespace {

// Handler of Qt's messages: Qt ends the process if the display's OpenGL has no usable
// configuration.
void exitWithoutOpenGL(QtMsgType type, const QMessageLogContext& context, const QString& message)
{
    if (type != QtFatalMsg) {
        std::fprintf(stderr, "%s\n",
                     qFormatLogMessage(type, context, message).toStdString().c_str());
        return;
    }
    std::fprintf(stderr,
                 "vyra-opencl-info: OpenGL cannot be started on this display (%s); install the "
                 "driver of the GPU that draws, or correct the variable that selects it, such as "
                 "__GLX_VENDOR_LIBRARY_NAME\n",
                 message.toStdString().c_str());
    std::_Exit(static_cast<int>(info::ExitCode::kNoGraphics));
}

info::Diagnostics examineMachine(const info::Options& options)
{
    info::WarningLog warnings;
    info::RenderWindow window;
    info::Diagnostics diagnostics = info::collectDiagnostics(options, window, warnings);
    if (diagnostics.startUp.valid)
        diagnostics.selfTest = info::runSelfTest(window, warnings);
    return diagnostics;
}

} // namespace

int main(int argc, char* argv[])
{
    QStringList arguments;
    for (int i = 0; i < argc; ++i)
        arguments.append(QString::fromLocal8Bit(argv[i]));
    std::string problem;
    const std::optional<info::Options> options = info::parseOptions(arguments, problem);
    if (!options) {
        std::fprintf(stderr, "vyra-opencl-info: %s; see vyra-opencl-info --help\n",
                     problem.c_str());
        return static_cast<int>(info::ExitCode::kUsage);
    }
    if (options->version) {
        std::puts("vyra-opencl-info " VYRA_VERSION);
        return 0;
    }
    if (options->help) {
        // The text begins with the program's name, here without its directory.
        char name[] = "vyra-opencl-info";
        char* names[] = {name, nullptr};
        int count = 1;
        const QCoreApplication application(count, names);
        std::fputs(info::helpText().c_str(), stdout);
        return 0;
    }
    qInstallMessageHandler(exitWithoutOpenGL);
    const info::Explanation explanation = info::explain(examineMachine(*options));
    const std::string report =
        options->json ? info::jsonReport(explanation) : info::textReport(explanation);
    std::fputs(report.c_str(), stdout);
    return static_cast<int>(explanation.exitCode);
}
