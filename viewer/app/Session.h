// One run of the viewer: a model on a stage, deformed and drawn frame after frame.
#pragma once

#include "viewer/Failure.h"
#include "viewer/app/Options.h"
#include "viewer/app/Report.h"
#include "viewer/model/Model.h"
#include "viewer/opencl/Verification.h"
#include "viewer/overlay/OverlayText.h"
#include "viewer/render/Camera.h"
#include "viewer/render/Canvas.h"
#include "viewer/render/CpuTwin.h"
#include "viewer/render/Renderer.h"
#include "viewer/render/Scene.h"

#include "evaluator/Evaluator.h"
#include "evaluator/Status.h"
#include "standalone/GLHost.h"

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <QOpenGLFunctions_3_3_Core>
#include <QOpenGLWindow>

namespace viewer {

// Whether an evaluation is open: its batch is acquired.
enum class EvaluationState { kClosed, kOpen };

// All operations, and the destruction, need the window's context to be current.
class Session {
public:
    // Borrows the options and the window, whose context is valid.
    Session(const Options& options, QOpenGLWindow& window);
    ~Session();
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

    // Loads the model and starts OpenCL, or goes on without it where that is allowed.
    Status start(const QSize& pictureSize);
    // Evaluates, draws and, where asked for, compares and writes one frame.
    Status renderFrame(double seconds);
    // Draws into a picture of this size from now on.
    void resize(const QSize& pictureSize);
    // Before the next frame every mesh changes its level of detail.
    void changeDetail() { fChangeAll = true; }
    // From the next frame on the meshes stay at rest, or are deformed again.
    void toggleDeformers() { fScene->toggleDeformers(); }
    void toggleDeformer(std::size_t number) { fScene->toggleDeformer(number); }
    // Shows a copy that the CPU deforms on the right half of the picture, or no longer. The camera
    // comes to where everything is seen.
    void toggleCpuTwin();

    // Where the kernel files are. Empty without OpenCL.
    std::string kernelFolder() const;
    // Evaluator::replaceKernelFile.
    vyra::Status replaceKernelFile(const std::string& file, const std::string& source);

    Camera& camera() { return fCamera; }
    Canvas& canvas() { return *fCanvas; }
    // False when a frame was beyond the bound of --verify.
    bool verified() const { return !fDeviation || fDeviation->withinBound(); }
    // False if OpenCL deforms no mesh.
    bool usesOpenCL() const { return deformsOnOpenCL(*fScene); }
    std::string report() const;
    // Of the present, all but the pause.
    OverlayFacts overlayFacts() const;

private:
    Status loadModel();
    Result<Model> importChosenModel();
    Status startOpenCLIfPossible();
    vyra::EvaluatorSettings evaluatorSettings();
    Status attachEvaluator();
    Status evaluate();
    void evaluateWithLevelChange(const em::Id& id);
    void draw();
    void frameScene();
    QSize viewSize() const; // of one scene in the picture
    void changeLevels();
    bool levelChangeIsDue(EvaluationState state) const;
    Status writePicture() const;
    OpenCLFacts openCLFacts() const;
    MeshShare meshShare() const;

    const Options& fOptions;
    QOpenGLWindow& fWindow;
    QOpenGLFunctions_3_3_Core* fGL = nullptr; // the context's
    std::unique_ptr<GLHost> fHost;
    Model fModel;
    const Animation* fAnimation = nullptr;       // of fModel
    std::unique_ptr<vyra::Evaluator> fEvaluator; // outlives the scene, whose meshes it owns
    std::unique_ptr<Scene> fScene;
    std::unique_ptr<CpuTwin> fCpuTwin; // null: the scene fills the picture
    std::unique_ptr<Renderer> fRenderer;
    std::unique_ptr<Canvas> fCanvas;
    Camera fCamera;
    bool fChangeAll = false;
    int fFrame = 0;
    std::vector<double> fEvaluationMs;
    std::optional<Deviation> fDeviation;
};

} // namespace viewer
