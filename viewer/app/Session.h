// One run of the viewer: loads a model, then deforms and draws frames.
#pragma once

#include "viewer/Failure.h"
#include "viewer/app/Options.h"
#include "viewer/app/Report.h"
#include "viewer/model/Model.h"
#include "viewer/opencl/Verification.h"
#include "viewer/overlay/OverlayText.h"
#include "viewer/render/Camera.h"
#include "viewer/render/Canvas.h"
#include "viewer/render/CpuScene.h"
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

// State of an evaluation. While it is open, its batch is acquired.
enum class EvaluationState { kClosed, kOpen };

// The window's OpenGL context must be current in all operations and the destructor.
class Session {
public:
    // Borrows the options and the window, which has a valid context.
    Session(const Options& options, QOpenGLWindow& window);
    ~Session();
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

    // Loads the model and starts OpenCL. Continues without OpenCL if Options::allowCpu. Must
    // succeed before other operations.
    [[nodiscard]] Status start(const QSize& pictureSize);
    // Evaluates and draws one frame; compares it and writes it if the options require it.
    [[nodiscard]] Status renderFrame(double seconds);
    // Sets the size of the picture in pixels.
    void resize(const QSize& pictureSize);
    // Changes the level of detail of every mesh before the next frame.
    void changeDetail() { fChangeAll = true; }
    // Disable or enable deformers from the next frame on, see Scene.
    void toggleDeformers() { fScene->toggleDeformers(); }
    void toggleDeformer(std::size_t index) { fScene->toggleDeformer(index); }
    // Shows or hides a copy that the CPU deforms, on the right half of the picture. Resets zoom and
    // pan of the camera.
    void toggleCpuScene();

    // Returns the folder of the kernel files, empty without OpenCL.
    [[nodiscard]] std::string kernelFolder() const;
    // Calls Evaluator::replaceKernelFile.
    [[nodiscard]] vyra::Status replaceKernelFile(const std::string& file,
                                                 const std::string& source);

    [[nodiscard]] Camera& camera() noexcept { return fCamera; }
    [[nodiscard]] Canvas& canvas() noexcept { return *fCanvas; }
    // Returns false if a frame exceeded the bound of --verify.
    [[nodiscard]] bool verified() const noexcept
    {
        return !fDeviation || fDeviation->withinBound();
    }
    // Returns whether OpenCL deforms any mesh.
    [[nodiscard]] bool usesOpenCL() const { return deformsOnOpenCL(*fScene); }
    // Returns the report for the end of the run.
    [[nodiscard]] std::string report() const;
    // Returns the current values for the overlay, except the fields that Player sets.
    [[nodiscard]] OverlayContent overlayContent() const;

private:
    [[nodiscard]] Status loadModel();
    [[nodiscard]] Result<Model> importChosenModel();
    [[nodiscard]] Status startOpenCLIfPossible();
    vyra::EvaluatorSettings evaluatorSettings();
    [[nodiscard]] Status attachEvaluator();
    [[nodiscard]] Status evaluate();
    void evaluateWithLevelChange(const em::Id& id);
    void draw();
    void frameScene();
    QSize viewSize() const; // size of one scene in the picture
    void changeLevels();
    bool levelChangeIsDue(EvaluationState state) const;
    [[nodiscard]] Status writePicture() const;
    OpenCLStatistics openCLStatistics() const;
    MeshDistribution meshDistribution() const;

    const Options& fOptions;
    QOpenGLWindow& fWindow;
    QOpenGLFunctions_3_3_Core* fGL = nullptr; // owned by the context
    std::unique_ptr<GLHost> fHost;
    Model fModel;
    const Animation* fAnimation = nullptr;       // in fModel; null at rest
    std::unique_ptr<vyra::Evaluator> fEvaluator; // outlives the scene, whose meshes it owns
    std::unique_ptr<Scene> fScene;
    std::unique_ptr<CpuScene> fCpuScene; // null while it is hidden
    std::unique_ptr<Renderer> fRenderer;
    std::unique_ptr<Canvas> fCanvas;
    Camera fCamera;
    bool fChangeAll = false;
    int fFrame = 0;
    std::vector<double> fEvaluationMs;
    std::optional<Deviation> fDeviation;
};

} // namespace viewer
