// vyra-viewer: shows an animated character that OpenCL deforms in the vertex buffers that OpenGL
// draws from.
#include "viewer/app/Options.h"
#include "viewer/app/Session.h"
#include "viewer/app/ViewerWindow.h"
#include "viewer/model/import/ImportProcess.h"
#include "viewer/system/Interrupt.h"
#include "viewer/system/Process.h"

#include "standalone/ProfileRecorder.h"

#include <cstdio>
#include <cstdlib>
#include <exception>
#include <memory>
#include <new>

#include <QCoreApplication>
#include <QGuiApplication>
#include <QSurfaceFormat>
#include <QTimer>

namespace {

using viewer::ExitCode;
using viewer::Failure;
using viewer::Options;
using viewer::Session;
using viewer::Status;
using viewer::ViewerWindow;

// Animation time between two frames of --frames.
constexpr double kSecondsPerFrame = 1.0 / 30.0;
// Period of checks for Ctrl-C, which also work in a hidden window, which draws no frames.
constexpr int kInterruptPeriodMs = 100;

constexpr char kOutOfMemory[] = "vyra-viewer: there is not enough memory; use a smaller crowd or "
                                "model, or allow the process more\n";

// Returns the exit code.
int printFailure(const Failure& failure)
{
    std::fprintf(stderr, "vyra-viewer: %s\n", failure.text.c_str());
    return static_cast<int>(failure.code);
}

// Handler of Qt's messages. Without a display, Qt ends the process after messages that do not help
// the user; this replaces them.
void exitWithoutDisplay(QtMsgType type, const QMessageLogContext&, const QString&)
{
    if (type != QtFatalMsg)
        return;
    const int code =
        printFailure({ExitCode::kNoGraphics, "there is no display; start one, or run "
                                             "this under a virtual one: xvfb-run -a vyra-viewer"});
    std::_Exit(code);
}

// The same if the display's OpenGL has no usable configuration.
void exitWithoutOpenGL(QtMsgType type, const QMessageLogContext& context, const QString& message)
{
    if (type != QtFatalMsg) {
        std::fprintf(stderr, "%s\n",
                     qFormatLogMessage(type, context, message).toStdString().c_str());
        return;
    }
    const int code =
        printFailure({ExitCode::kNoGraphics,
                      "OpenGL cannot be started on this display (" + message.toStdString() +
                          "); install a graphics driver, or Mesa's software renderer"});
    std::_Exit(code);
}

[[noreturn]] void endWithoutMemory()
{
    std::fputs(kOutOfMemory, stderr);
    std::_Exit(static_cast<int>(ExitCode::kOutOfMemory));
}

// Terminate handler: memory may run out in any thread and callback, where nothing catches the
// exception.
[[noreturn]] void endAfterException()
{
    try {
        if (const std::exception_ptr exception = std::current_exception())
            std::rethrow_exception(exception);
    } catch (const std::bad_alloc&) {
        endWithoutMemory();
    } catch (const std::exception& error) {
        if (viewer::memoryIsShort()) // oneTBB throws other exceptions if a thread gets no stack
            endWithoutMemory();
        std::fprintf(stderr, "vyra-viewer: ended by an error: %s\n", error.what());
    } catch (...) {
        std::fputs("vyra-viewer: ended by an unknown error\n", stderr);
    }
    std::abort();
}

void reportCrashes()
{
    viewer::reportCrashWithoutMemory(kOutOfMemory, static_cast<int>(ExitCode::kOutOfMemory));
}

QSurfaceFormat surfaceFormat(bool waitForDisplay)
{
    QSurfaceFormat format;
    format.setVersion(3, 3);
    format.setProfile(QSurfaceFormat::CoreProfile);
    format.setSwapInterval(waitForDisplay ? 1 : 0);
    return format;
}

[[nodiscard]] Status renderFrames(Session& session, ViewerWindow& window, int frames)
{
    for (int i = 0; i < frames && !viewer::interrupted(); ++i) {
        if (Status failure = session.renderFrame(i * kSecondsPerFrame))
            return failure;
        window.present(session);
        QGuiApplication::processEvents();
        window.makeCurrent();
    }
    return {};
}

[[nodiscard]] Status playInWindow(Session& session, ViewerWindow& window)
{
    window.play(session);
    QTimer timer;
    QObject::connect(&timer, &QTimer::timeout, [] {
        if (viewer::interrupted())
            QGuiApplication::exit();
    });
    timer.start(kInterruptPeriodMs);
    QGuiApplication::exec();
    window.stop();
    return window.failure();
}

[[nodiscard]] Status run(const Options& options, bool& verified)
{
    ViewerWindow window;
    if (Status failure = window.open(options.size))
        return failure;
    window.makeCurrent();
    Session session(options, window);
    if (Status failure = session.start(options.size))
        return failure;
    reportCrashes(); // again: LLVM, which has compiled kernels and shaders, replaced the handlers

    Status failure = options.frames ? renderFrames(session, window, *options.frames)
                                    : playInWindow(session, window);
    verified = session.verified();
    if (!failure && options.verify && !session.usesOpenCL()) {
        failure =
            Failure{ExitCode::kDeviation,
                    "--verify compared nothing that OpenCL deformed: all meshes were deformed "
                    "on the CPU; the report shows why"};
    }
    std::fputs(session.report().c_str(), stdout);
    return failure;
}

[[nodiscard]] Status runTraced(const Options& options, bool& verified)
{
    if (options.trace.empty())
        return run(options, verified);
    ProfileRecorder::nameThread("Main thread");
    ProfileRecorder::start();
    Status failure = run(options, verified);
    ProfileRecorder::stop();
    std::string reason;
    if (!failure && !ProfileRecorder::writeChromeTrace(options.trace, &reason))
        return Failure{ExitCode::kOutput, "the trace '" + options.trace + "' cannot be written: " +
                                              reason + "; choose another file with --trace"};
    return failure;
}

QStringList argumentsOf(int argc, char* argv[])
{
    QStringList arguments;
    for (int i = 0; i < argc; ++i)
        arguments.append(QString::fromLocal8Bit(argv[i]));
    return arguments;
}

} // namespace

int main(int argc, char* argv[])
{
    if (viewer::isImportChild(argc, argv))
        return viewer::runImportChild(argv);
    std::set_terminate(endAfterException);
    reportCrashes();
    viewer::Result<Options> options = viewer::parseOptions(argumentsOf(argc, argv));
    if (!options)
        return printFailure(options.failure());
    if (options.value().version) {
        std::puts("vyra-viewer " VYRA_VERSION);
        return static_cast<int>(ExitCode::kSuccess);
    }
    if (options.value().help) {
        const QCoreApplication application(argc, argv);
        std::fputs(viewer::helpText().c_str(), stdout);
        return static_cast<int>(ExitCode::kSuccess);
    }

    const bool plays = !options.value().frames;
    QSurfaceFormat::setDefaultFormat(surfaceFormat(plays));
    qInstallMessageHandler(exitWithoutDisplay);
    // Passes only the program's name, because Qt has an option --platform, too.
    int ownArguments = 1;
    const QGuiApplication application(ownArguments, argv);
    qInstallMessageHandler(exitWithoutOpenGL);
    options.value().importProgram = QGuiApplication::applicationFilePath().toStdString();
    viewer::catchInterrupt();

    bool verified = true;
    if (const Status failure = runTraced(options.value(), verified))
        return printFailure(*failure);
    if (!verified)
        return printFailure({ExitCode::kDeviation,
                             "a frame deviates from the CPU reference by more than "
                             "the bound; see the report"});
    if (viewer::interrupted())
        return printFailure({ExitCode::kInterrupted, "interrupted"});
    return static_cast<int>(ExitCode::kSuccess);
}
