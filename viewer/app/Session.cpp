#include "viewer/app/Session.h"

#include "evaluator/ProfileScope.h"
#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/DeviceMemory.h"
#include "standalone/ProfileRecorder.h"
#include "viewer/app/LoadProgress.h"
#include "viewer/model/import/ImportProcess.h"
#include "viewer/opencl/DeviceName.h"
#include "viewer/opencl/OpenCLStart.h"
#include "viewer/opencl/SyncModeNames.h"
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

// Evaluations are numbered in 15 bits, which leaves out the one number that names none.
constexpr int kEvaluationNumbers = 0x8000;
// Frames over which the overlay's time is a median: steady, and still of the present.
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

Status statusOf(const vyra::Status& status)
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

// The evaluation first, which waits for OpenCL; then the shared buffers, with the scene; the
// context goes last, with the window.
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
    fWindow.makeCurrent(); // events were handled meanwhile
    return model;
}

Status Session::startOpenCLIfPossible()
{
    Status failure = startOpenCL(fWindow, fOptions);
    if (failure && !fOptions.allowCpu)
        return failure;
    if (failure) {
        std::fprintf(stderr, "vyra-viewer: going on without OpenCL: %s\n", failure->text.c_str());
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
    fScene->pose(0); // the deformers are checked with what they need
    return statusOf(fEvaluator->prepare());
}

Status Session::renderFrame(double seconds)
{
    fScene->pose(seconds);
    if (fCpuTwin)
        fCpuTwin->follow(*fScene);

    const auto begin = std::chrono::steady_clock::now();
    if (Status failure = evaluate())
        return failure;
    const auto end = std::chrono::steady_clock::now();
    fEvaluationMs.push_back(std::chrono::duration<double, std::milli>(end - begin).count());

    // Before the drawing, which takes so long that it would hide a wait that is missing.
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

// The original, and its copy where there is one, on the left and the right.
void Session::draw()
{
    const vyra::ProfileScope scope("Draw");
    const QRect left(QPoint(), viewSize());
    fRenderer->draw(*fScene, fCamera, *fCanvas, left);
    if (fCpuTwin)
        fRenderer->draw(fCpuTwin->scene(), fCamera, *fCanvas, left.translated(left.width(), 0));
}

// From here to the return is what the report calls the evaluation time.
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

// Opens and closes the evaluation itself, as a host does whose graph has other users of the shared
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

// --resize-every changes the level of detail in turn before and during an evaluation; the key does
// so before.
bool Session::levelChangeIsDue(EvaluationState state) const
{
    if (fChangeAll && state == EvaluationState::kClosed)
        return true;
    if (fOptions.resizeEvery == 0 || fFrame == 0 || fFrame % fOptions.resizeEvery != 0)
        return false;
    const bool isOddChange = (fFrame / fOptions.resizeEvery) % 2 == 1;
    return isOddChange == (state == EvaluationState::kOpen);
}

// Of one mesh of each character, a different one each time, so that buffers in the batch and new
// ones outside meet in one evaluation.
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
    return fCpuTwin ? QSize(size.width() / 2, size.height()) : size;
}

void Session::frameScene()
{
    fCamera.frame(fScene->outline(), aspectOf(viewSize()));
}

void Session::toggleCpuTwin()
{
    if (fCpuTwin)
        fCpuTwin.reset();
    else
        fCpuTwin = std::make_unique<CpuTwin>(*fGL, fModel, fAnimation, fOptions.crowd);
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

OpenCLFacts Session::openCLFacts() const
{
    const TopenCLInfo& info = TopenCLInfo::theOne();
    const DeviceMemoryUse memory = deviceMemoryUse();
    OpenCLFacts facts;
    facts.device = deviceName(info.openCLDevice());
    facts.graphicsToCL = nameOf(info.graphicsToCLSyncMode());
    facts.clToGraphics = nameOf(info.clToGraphicsSyncMode());
    facts.doublePrecision = info.supportsDoublePrecision();
    facts.counts = fEvaluator->counts();
    facts.deviceBytes = memory.currentBytes;
    facts.peakDeviceBytes = memory.peakBytes;
    return facts;
}

MeshShare Session::meshShare() const
{
    MeshShare share;
    share.openCLIsUsed = fEvaluator->usesOpenCL();
    if (share.openCLIsUsed)
        share.minimumVertices = TopenCLInfo::theOne().minimumBufferSize();
    share.meshes = fScene->meshes().size();
    for (const CharacterMesh* mesh : fScene->meshes())
        share.meshesOnCpu += mesh->deformable->usesOpenCL() ? 0 : 1;
    return share;
}

OverlayFacts Session::overlayFacts() const
{
    OverlayFacts facts;
    if (fEvaluator->usesOpenCL()) {
        const OpenCLFacts cl = openCLFacts();
        facts.openCL = {cl.device, cl.graphicsToCL, cl.clToGraphics, fEvaluator->batchSize()};
    }
    facts.share = meshShare();
    const std::size_t recent = std::min(fEvaluationMs.size(), kRecentFrames);
    const auto end = fEvaluationMs.end();
    facts.evaluationMs = percentile({end - static_cast<std::ptrdiff_t>(recent), end}, 0.5);
    if (fCpuTwin)
        facts.cpuTwinMs = fCpuTwin->milliseconds();
    facts.deformers = chainText(fScene->deformers());
    return facts;
}

std::string Session::report() const
{
    RunFacts facts;
    if (fEvaluator->usesOpenCL())
        facts.openCL = openCLFacts();
    facts.renderer = reinterpret_cast<const char*>(fGL->glGetString(GL_RENDERER));
    facts.characters = fScene->characters().size();
    facts.share = meshShare();
    for (const CharacterMesh* mesh : fScene->meshes())
        facts.vertices += mesh->mesh().vertexCount();
    facts.deformers = chainText(fScene->deformers());
    facts.evaluationMs = fEvaluationMs;
    facts.deviation = fDeviation;
    return reportText(facts);
}

} // namespace viewer
