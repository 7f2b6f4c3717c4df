#include "viewer/model/import/ImportProcess.h"

#include "viewer/model/import/ModelFile.h"
#include "viewer/model/import/ModelSerialisation.h"
#include "viewer/system/Process.h"

#include <chrono>
#include <cstdlib>
#include <cstring>
#include <new>
#include <thread>

#include <QElapsedTimer>
#include <QProcess>
#include <QStringList>

namespace viewer {
namespace {

// First argument of the child. The time limit, the up axis, the crease angle and the model's name
// follow.
constexpr char kChildOption[] = "--import-child";
enum ChildArgument { kOption = 1, kTimeLimit, kUpAxis, kCreaseAngle, kName, kChildArguments };
constexpr int kNoUpAxis = -1;

// Exit codes of the child, besides 0.
constexpr int kTimedOut = 124;
constexpr int kNoOutput = 125;

// Milliseconds between two calls of the progress function.
constexpr int kPollPeriodMs = 50;
// Milliseconds after the time limit in which the child should end by itself.
constexpr qint64 kGracePeriodMs = 5000;

QStringList childArguments(const std::string& name, const ImportSettings& settings, int timeLimit)
{
    const int up = settings.up ? static_cast<int>(*settings.up) : kNoUpAxis;
    return {kChildOption, QString::number(timeLimit), QString::number(up),
            QString::number(settings.creaseAngle), QString::fromStdString(name)};
}

Failure failure(const std::string& name, const std::string& text)
{
    return {ExitCode::kModel, "the model '" + name + "' " + text};
}

Failure timedOut(const std::string& name, int timeLimit)
{
    return failure(name, "takes longer than " + std::to_string(timeLimit) +
                             " s to load; it may be damaged: export it again, or allow more time "
                             "with --load-limit");
}

// Ends this process after the time limit, whatever other threads do.
void startWatchdog(int seconds)
{
    std::thread([seconds] {
        std::this_thread::sleep_for(std::chrono::seconds(seconds));
        std::_Exit(kTimedOut);
    }).detach();
}

Result<Model> importOrReportMemory(const std::string& name, const ImportSettings& settings)
{
    try {
        return importModel(name, settings);
    } catch (const std::bad_alloc&) {
        return Failure{ExitCode::kOutOfMemory, "there is not enough memory for the model '" + name +
                                                   "'; it may be damaged, else use a smaller one "
                                                   "or a machine with more memory"};
    }
}

} // namespace

Result<Model> importInChild(const ImportChild& child, const std::string& name,
                            const ImportSettings& settings)
{
    const Result<std::string> file = findModelFile(name);
    if (!file)
        return file.failure();
    QProcess process;
    process.setStandardInputFile(QProcess::nullDevice());
    process.setStandardErrorFile(QProcess::nullDevice());
    QElapsedTimer timer;
    timer.start();
    process.start(QString::fromStdString(child.program),
                  childArguments(name, settings, child.timeLimit));
    if (!process.waitForStarted())
        return failure(file.value(), "cannot be imported: the process for it does not start (" +
                                         process.errorString().toStdString() + ")");
    const qint64 limitMs = child.timeLimit * qint64{1000} + kGracePeriodMs;
    while (!process.waitForFinished(kPollPeriodMs) && process.state() != QProcess::NotRunning) {
        const bool goOn = child.progress(static_cast<int>(timer.elapsed() / 1000));
        if (goOn && timer.elapsed() < limitMs)
            continue;
        process.kill();
        process.waitForFinished();
        if (goOn)
            return timedOut(file.value(), child.timeLimit);
        return Failure{ExitCode::kInterrupted, "interrupted while the model was loaded"};
    }
    if (process.exitStatus() == QProcess::NormalExit && process.exitCode() == kTimedOut)
        return timedOut(file.value(), child.timeLimit);
    if (process.exitStatus() == QProcess::NormalExit && process.exitCode() == 0) {
        if (auto result = deserialiseModel(process.readAllStandardOutput()))
            return std::move(*result);
    }
    return failure(
        file.value(),
        "makes Assimp crash (" +
            std::string(process.exitStatus() == QProcess::CrashExit ? "signal " : "exit code ") +
            std::to_string(process.exitCode()) +
            "); it is probably damaged: export it again, best as glTF");
}

bool isImportChild(int argc, char* argv[]) noexcept
{
    return argc == kChildArguments && std::strcmp(argv[kOption], kChildOption) == 0;
}

int runImportChild(char* argv[])
{
    std::FILE* output = takeStandardOutput();
    if (!output)
        return kNoOutput;
    limitResources();
    startWatchdog(std::atoi(argv[kTimeLimit]));
    ImportSettings settings;
    const int up = std::atoi(argv[kUpAxis]);
    if (up != kNoUpAxis)
        settings.up = static_cast<UpAxis>(up);
    settings.creaseAngle = std::atof(argv[kCreaseAngle]);
    const QByteArray bytes = serialiseModel(importOrReportMemory(argv[kName], settings));
    const auto size = static_cast<std::size_t>(bytes.size());
    const bool written = std::fwrite(bytes.constData(), 1, size, output) == size;
    return std::fclose(output) == 0 && written ? 0 : kNoOutput;
}

} // namespace viewer
