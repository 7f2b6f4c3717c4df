#include "viewer/app/Session.h"

#include "evaluator/ProfileScope.h"
#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/DeviceMemory.h"
#include "standalone/ProfileRecorder.h"
#include "viewer/app/LoadProgress.h"
#include "viewer/model/import/ImportProcess.h"
#include "viewer/opencl/OpenCLNames.h"
#include "viewer/opencl/OpenCLStart.h"
#include "viewer/system/FileOutput.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <filesystem>

#include <QBuffer>
#include <QByteArray>
#include <QOpenGLContext>
#include <QOpenGLVersionFunctionsFactory>

namespace viewer {
namespace {

// Evaluation ids have 15 bits here, which excludes the invalid id.
constexpr int kEvaluationNumbers = 0x8000;
// Frames whose median the overlay shows: enough for a steady value, few enough to follow changes.
constexpr std::size_t kRecentFrames = 30;

float aspectOf(const QSize& size)
{
    return static_cast<float>(size.width()) / static_cast<float>(std::max(size.height(), 1));
}

Result<const Animation*> chooseAnimation(const Model& model, const std::string& name)
{
    if (name.empty())
        return model.animations.empty() ? nullptr : &model.animations.front();
    std::string known;
    for (const Animation& animation : model.animations) {
        if (animation.name == name)
            return &animation;
        known += (known.empty() ? "'" : ", '") + animation.name + "'";
    }
    return Failure{ExitCode::kModel,
                   "the model has no animation '" + name + "'; " +
                       (known.empty() ? "it has none at all" : "it has " + known)};
}

[[nodiscard]] Status statusOf(const vyra::Status& status)
{
    if (status.ok())
        return {};
    if (status.openCL == CL_OUT_OF_HOST_MEMORY || status.openCL == CL_MEM_OBJECT_ALLOCATION_FAILURE)
        return Failure{ExitCode::kOutOfMemory,
                       status.message +
                           "; use a smaller crowd or model, or allow the process more"};
    return Failure{ExitCode::kOpenCLError, status.message};
}

} // namespace

Session::Session(const Options& options, QOpenGLWindow& window) : fOptions(options), fWindow(window)
{
}

// The order of the members matters: the scene removes its meshes from the evaluator, which outlives
// it.
Session::~Session() = default;

Status Session::start(const QSize& pictureSize)
{
    fGL = QOpenGLVersionFunctionsFactory::get<QOpenGLFunctions_3_3_Core>(fWindow.context());
    if (!fGL)
        return Failure{ExitCode::kNoGraphics, "the graphics driver has no OpenGL 3.3; update it, "
                                              "or install Mesa's software renderer"};
    if (Status failure = loadModel())
        return failure;
    fHost = std::make_unique<GLHost>(fWindow);
    fScene = std::make_unique<Scene>(*fGL, fModel, fAnimation, fOptions.crowd);
    if (!fScene->hasExtent())
        return Failure{ExitCode::kModel, "the model '" + fOptions.model +
                                             "' has no extent, or one that is not finite, so it "
                                             "cannot be shown; check its transforms"};
    if (Status failure = startOpenCLIfPossible())
        return failure;
    if (Status failure = attachEvaluator())
        return failure;
    fRenderer = std::make_unique<Renderer>(*fGL);
    if (Status failure = fRenderer->initialize())
        return failure;
    resize(pictureSize);
    frameScene();
    return {};
}

Status Session::loadModel()
{
    Result<Model> model = importChosenModel();
    if (!model)
        return model.failure();
    fModel = std::move(model.value());
    const Result<const Animation*> animation = chooseAnimation(fModel, fOptions.animation);
    if (!animation)
        return animation.failure();
    fAnimation = animation.value();
    return {};
}

Result<Model> Session::importChosenModel()
{
    if (fOptions.importProgram.empty())
        return importModel(fOptions.model, fOptions.import);
    LoadProgress progress(fWindow, fOptions.model);
    const ImportChild child{fOptions.importProgram, fOptions.loadLimit,
                            [&progress](int seconds) { return progress.show(seconds); }};
    Result<Model> model = importInChild(child, fOptions.model, fOptions.import);
    fWindow.makeCurrent(); // event handlers may have changed the context
    return model;
}

Status Session::startOpenCLIfPossible()
{
    Status failure = startOpenCL(fWindow, fOptions.platform, fOptions.allowCpu);
    if (failure && !fOptions.allowCpu)
        return failure;
    if (failure) {
        std::fprintf(stderr, "vyra-viewer: continuing without OpenCL: %s\n", failure->text.c_str());
        return {};
    }
    if (fOptions.minimumVertices)
        TopenCLInfo::theOne().setMinimumBufferSize(*fOptions.minimumVertices);
    return {};
}

vyra::EvaluatorSettings Session::evaluatorSettings()
{
    vyra::EvaluatorSettings settings;
    settings.finishRenderer = [this] { fGL->glFinish(); };
    settings.flushRenderer = [this] { fGL->glFlush(); };
    settings.writeVertices = [this](vyra::DeformableMesh& deformable,
                                    const vyra::Surface& surface) {
        const CharacterMesh& mesh = fScene->meshOf(deformable);
        mesh.positions.write(*fGL, surface.positions);
        mesh.normals.write(*fGL, surface.normals);
    };
    settings.traceClock = ProfileRecorder::nowNs;
    settings.traceCommand = [](const std::string& track, const char* name, std::int64_t begin,
                               std::int64_t end) {
        ProfileRecorder::record(track, name, begin, end);
    };
    return settings;
}

Status Session::attachEvaluator()
{
    fEvaluator = std::make_unique<vyra::Evaluator>(evaluatorSettings());
    fScene->attach(*fEvaluator, fOptions.deformers);
    fScene->pose(0); // prepare() checks the input of the deformers
    return statusOf(fEvaluator->prepare());
}

Status Session::renderFrame(double seconds)
{
    fScene->pose(seconds);
    if (fCpuScene)
        fCpuScene->update(*fScene);

    const auto begin = std::chrono::steady_clock::now();
    if (Status failure = evaluate())
        return failure;
    const auto end = std::chrono::steady_clock::now();
    fEvaluationMs.push_back(std::chrono::duration<double, std::milli>(end - begin).count());

    // Verify before drawing, whose duration would hide a missing wait.
    if (fOptions.verify) {
        const vyra::ProfileScope scope("Verify");
        if (!fDeviation)
            fDeviation.emplace();
        fDeviation->include(verify(*fGL, *fScene));
    }
    draw();
    fEvaluator->renderingComplete();
    Status failure = writePicture();
    ++fFrame;
    return failure;
}

// Draws the scene, or the scene on the left and its CPU copy on the right.
void Session::draw()
{
    const vyra::ProfileScope scope("Draw");
    const QRect left(QPoint(), viewSize());
    fRenderer->draw(*fScene, fCamera, *fCanvas, left);
    if (fCpuScene)
        fRenderer->draw(fCpuScene->scene(), fCamera, *fCanvas, left.translated(left.width(), 0));
}

// The report's evaluation time is the duration of this function.
Status Session::evaluate()
{
    const vyra::ProfileScope scope("Evaluate");
    const em::Id id(static_cast<std::uint16_t>(fFrame % kEvaluationNumbers));
    if (levelChangeIsDue(EvaluationState::kClosed))
        changeLevels();
    if (fEvaluator->usesOpenCL() && levelChangeIsDue(EvaluationState::kOpen))
        evaluateWithLevelChange(id);
    else
        fEvaluator->evaluate(id);
    if (Status failure = statusOf(fEvaluator->status()))
        return failure;
    const vyra::ProfileScope waiting("Wait for OpenCL");
    fEvaluator->waitUntilDrawable();
    return {};
}

// Opens and closes the evaluation itself, like a host whose graph has other users of shared
// buffers.
void Session::evaluateWithLevelChange(const em::Id& id)
{
    TopenCLInfo& info = TopenCLInfo::theOne();
    if (info.useGLFinish())
        fGL->glFinish();
    info.sharedBufferMgr().PreEvaluate(id);
    changeLevels();
    fEvaluator->deform();
    info.sharedBufferMgr().PostEvaluate(id);
    TopenCLInfo::flush();
}

// --resize-every changes the level of detail alternately before and during an evaluation, the key
// only before.
bool Session::levelChangeIsDue(EvaluationState state) const
{
    if (fChangeAll && state == EvaluationState::kClosed)
        return true;
    if (fOptions.resizeEvery == 0 || fFrame == 0 || fFrame % fOptions.resizeEvery != 0)
        return false;
    const bool isOddChange = (fFrame / fOptions.resizeEvery) % 2 == 1;
    return isOddChange == (state == EvaluationState::kOpen);
}

// Changes one mesh of each character, a different one each time. So an evaluation has both old
// buffers in the batch and new ones outside it.
void Session::changeLevels()
{
    const std::size_t count = fScene->meshesPerCharacter();
    const auto change = static_cast<std::size_t>(fFrame / std::max(fOptions.resizeEvery, 1));
    for (std::size_t i = 0; i < fScene->meshes().size(); ++i) {
        if (fChangeAll || i % count == change % count)
            fScene->changeLevel(*fScene->meshes()[i]);
    }
    fChangeAll = false;
}

void Session::resize(const QSize& pictureSize)
{
    fCanvas = std::make_unique<Canvas>(pictureSize);
    fCamera.setAspect(aspectOf(viewSize()));
}

QSize Session::viewSize() const
{
    const QSize size = fCanvas->size();
    return fCpuScene ? QSize(size.width() / 2, size.height()) : size;
}

void Session::frameScene()
{
    fCamera.frame(fScene->outline(), aspectOf(viewSize()));
}

void Session::toggleCpuScene()
{
    if (fCpuScene)
        fCpuScene.reset();
    else
        fCpuScene = std::make_unique<CpuScene>(*fGL, fModel, fAnimation, fOptions.crowd);
    frameScene();
}

std::string Session::kernelFolder() const
{
    return fEvaluator->usesOpenCL() ? vyra::Evaluator::kernelDirectory() : std::string();
}

vyra::Status Session::replaceKernelFile(const std::string& file, const std::string& source)
{
    return fEvaluator->replaceKernelFile(file, source);
}

Status Session::writePicture() const
{
    if (fOptions.output.empty() || fFrame % fOptions.every != 0)
        return {};
    std::error_code error;
    std::filesystem::create_directories(fOptions.output, error);
    const std::string file = QString("%1/frame-%2.png")
                                 .arg(QString::fromStdString(fOptions.output))
                                 .arg(fFrame, 4, 10, QChar('0'))
                                 .toStdString();
    QByteArray bytes;
    QBuffer buffer(&bytes);
    fCanvas->image().save(&buffer, "PNG");
    const std::optional<std::string> reason = writeFile(file, bytes);
    if (!reason)
        return {};
    return Failure{ExitCode::kOutput, "the picture '" + file + "' cannot be written: " + *reason +
                                          "; choose another folder with --output"};
}

OpenCLStatistics Session::openCLStatistics() const
{
    const TopenCLInfo& info = TopenCLInfo::theOne();
    const DeviceMemoryUse memory = deviceMemoryUse();
    OpenCLStatistics statistics;
    statistics.device = deviceName(info.openCLDevice());
    statistics.graphicsToCL = nameOf(info.graphicsToCLSyncMode());
    statistics.clToGraphics = nameOf(info.clToGraphicsSyncMode());
    statistics.doublePrecision = info.supportsDoublePrecision();
    statistics.counts = fEvaluator->counts();
    statistics.deviceBytes = memory.currentBytes;
    statistics.peakDeviceBytes = memory.peakBytes;
    return statistics;
}

MeshDistribution Session::meshDistribution() const
{
    MeshDistribution distribution;
    distribution.openCLIsUsed = fEvaluator->usesOpenCL();
    if (distribution.openCLIsUsed)
        distribution.minimumVertices = TopenCLInfo::theOne().minimumBufferSize();
    distribution.meshes = fScene->meshes().size();
    for (const CharacterMesh* mesh : fScene->meshes())
        distribution.meshesOnCpu += mesh->deformable->usesOpenCL() ? 0 : 1;
    return distribution;
}

OverlayContent Session::overlayContent() const
{
    OverlayContent content;
    if (fEvaluator->usesOpenCL()) {
        const OpenCLStatistics cl = openCLStatistics();
        content.openCL = {cl.device, cl.graphicsToCL, cl.clToGraphics, fEvaluator->batchSize()};
    }
    content.distribution = meshDistribution();
    const std::size_t recent = std::min(fEvaluationMs.size(), kRecentFrames);
    const auto end = fEvaluationMs.end();
    content.evaluationMs = percentile({end - static_cast<std::ptrdiff_t>(recent), end}, 0.5);
    if (fCpuScene)
        content.cpuSceneMs = fCpuScene->milliseconds();
    content.deformers = chainText(fScene->deformers());
    return content;
}

std::string Session::report() const
{
    RunStatistics run;
    if (fEvaluator->usesOpenCL())
        run.openCL = openCLStatistics();
    run.renderer = reinterpret_cast<const char*>(fGL->glGetString(GL_RENDERER));
    run.characters = fScene->characters().size();
    run.distribution = meshDistribution();
    for (const CharacterMesh* mesh : fScene->meshes())
        run.vertices += mesh->mesh().vertexCount();
    run.deformers = chainText(fScene->deformers());
    run.evaluationMs = fEvaluationMs;
    run.deviation = fDeviation;
    return reportText(run);
}

} // namespace viewer
