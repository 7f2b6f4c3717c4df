#include "frames/Stage.h"

#include "harness/Timing.h"
#include "runtime/TopenCLInfo.h"
#include "viewer/model/DeformerChain.h"
#include "viewer/opencl/Verification.h"

#include <algorithm>
#include <climits>
#include <random>
#include <stdexcept>
#include <utility>

namespace {

// Frames in which memory is allocated and kernels are built.
constexpr int kWarmUp = 5;
// Small crowds have more frames than large ones, since their times vary more.
constexpr int kLeastFrames = 25;
constexpr int kMostFrames = 500;
constexpr int kCharacterFrames = 8000; // frames times characters
constexpr double kSecondsPerFrame = 1.0 / 24;

// One path with its scene.
struct Candidate {
    std::unique_ptr<vyra::Evaluator> evaluator; // outlives the scene
    std::unique_ptr<viewer::Scene> scene;       // null if the path deforms nothing
    std::unique_ptr<Path> path;
    PathTimes times;
};

class Stage {
public:
    Stage(QOpenGLFunctions_3_3_Core& gl, const viewer::Model& model, const Content& content,
          int characters, std::string only)
        : fGL(gl), fModel(model), fContent(content), fCharacters(characters), fOnly(std::move(only))
    {
        addPaths();
        if (fCandidates.empty())
            throw std::runtime_error("there is no path '" + fOnly + "'; --help lists them");
    }

    // Plays the paths in random order in each frame.
    void play(int frames)
    {
        std::vector<std::size_t> order(fCandidates.size());
        for (std::size_t i = 0; i < order.size(); ++i)
            order[i] = i;
        std::mt19937 random(1); // the order is the same in every run
        for (int frame = 0; frame < kWarmUp + frames; ++frame) {
            std::shuffle(order.begin(), order.end(), random);
            for (const std::size_t i : order)
                play(fCandidates[i], frame);
        }
    }

    void verify() const
    {
        for (const Candidate& candidate : fCandidates) {
            if (!candidate.scene)
                continue;
            const viewer::Deviation deviation = viewer::verify(fGL, *candidate.scene);
            if (!(deviation.position <= viewer::kPositionBound &&
                  deviation.normal <= fContent.normalBound)) {
                throw std::runtime_error("the last frame of the path '" + candidate.times.name +
                                         "' deviates from the reference: positions by " +
                                         std::to_string(deviation.position) + ", normals by " +
                                         std::to_string(deviation.normal));
            }
        }
    }

    CrowdTimes times() const
    {
        CrowdTimes crowd{&fContent, fCharacters, vertexCount()};
        for (const Candidate& candidate : fCandidates)
            crowd.paths.push_back(candidate.times);
        return crowd;
    }

private:
    template <typename Make>
    void add(const char* name, bool shares, const Make& make)
    {
        if (!fOnly.empty() && fOnly != name)
            return;
        // Excludes the vertex buffers of the other paths from the batch.
        TopenCLInfo::theOne().setMinimumBufferSize(shares ? 0 : INT_MAX);
        auto evaluator = std::make_unique<vyra::Evaluator>(settings());
        const viewer::Animation* animation =
            fModel.animations.empty() ? nullptr : &fModel.animations.front();
        auto scene = std::make_unique<viewer::Scene>(fGL, fModel, animation, fCharacters);
        scene->attach(*evaluator, viewer::parseDeformers(fContent.deformers).value());
        scene->pose(kSecondsPerFrame); // at time 0 the twist has no pass
        auto path = make(*evaluator, *scene);
        fCandidates.push_back({std::move(evaluator), std::move(scene), std::move(path), {name}});
    }

    void addMemory(const char* name, bool onAllCores)
    {
        if (fOnly.empty() || fOnly == name)
            fCandidates.push_back({{}, {}, makeMemoryPath(vertexCount(), onAllCores), {name}});
    }

    void addPaths()
    {
        add(kShared, true,
            [](vyra::Evaluator& e, viewer::Scene&) { return makeSharedBufferPath(e); });
        add(kReadBack, false,
            [this](vyra::Evaluator&, viewer::Scene& s) { return makeReadBackPath(fGL, s); });
        add(kCpu, false, [this](vyra::Evaluator&, viewer::Scene& s) {
            return makeMappedCpuPath(fGL, s, fContent.deformOnCpu(s));
        });
        if (fContent.deformOnCpuPlainly)
            add(kPlainCpu, false, [this](vyra::Evaluator&, viewer::Scene& s) {
                return makeUploadCpuPath(fGL, s, fContent.deformOnCpuPlainly(s));
            });
        addMemory(kMemoryOneCore, false);
        addMemory(kMemoryAllCores, true);
    }

    void play(Candidate& candidate, int frame)
    {
        const Allocations before = allocationsSoFar();
        if (candidate.scene)
            candidate.scene->pose(frame * kSecondsPerFrame);
        const Nanoseconds time = timed([&] {
            candidate.path->deform();
            fGL.glFinish();
        });
        candidate.path->drawn();
        if (frame < kWarmUp)
            return;
        candidate.times.allocations += allocationsSoFar() - before;
        candidate.times.milliseconds.push_back(
            std::chrono::duration<double, std::milli>(time).count());
    }

    std::size_t vertexCount() const
    {
        std::size_t count = 0;
        for (const viewer::Mesh& mesh : fModel.meshes)
            count += mesh.vertexCount();
        return count * static_cast<std::size_t>(fCharacters);
    }

    vyra::EvaluatorSettings settings()
    {
        vyra::EvaluatorSettings settings;
        settings.finishRenderer = [this] { fGL.glFinish(); };
        settings.flushRenderer = [this] { fGL.glFlush(); };
        return settings;
    }

    QOpenGLFunctions_3_3_Core& fGL;
    const viewer::Model& fModel;
    const Content& fContent;
    int fCharacters;
    std::string fOnly;
    std::vector<Candidate> fCandidates;
};

} // namespace

const PathTimes* CrowdTimes::find(const std::string& name) const
{
    const auto found = std::find_if(paths.begin(), paths.end(),
                                    [&](const PathTimes& path) { return path.name == name; });
    return found == paths.end() ? nullptr : &*found;
}

Spread CrowdTimes::ratio(const std::string& name, const std::string& to) const
{
    const PathTimes* path = find(name);
    const PathTimes* other = find(to);
    if (!path || !other)
        return {};
    std::vector<double> ratios;
    for (std::size_t i = 0; i < path->milliseconds.size(); ++i)
        ratios.push_back(path->milliseconds[i] / other->milliseconds[i]);
    return spreadOf(std::move(ratios));
}

CrowdTimes measure(QOpenGLFunctions_3_3_Core& gl, const viewer::Model& model,
                   const Content& content, int characters, const StageSettings& settings)
{
    Stage stage(gl, model, content, characters, settings.only);
    stage.play(settings.frames
                   ? settings.frames
                   : std::clamp(kCharacterFrames / characters, kLeastFrames, kMostFrames));
    stage.verify();
    return stage.times();
}
