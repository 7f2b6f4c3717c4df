// Measures whole frames: the library beside what an application would do without it.
#include "Allocations.h"
#include "Path.h"
#include "Runtime.h"
#include "harness/Report.h"
#include "harness/Statistics.h"
#include "harness/Table.h"
#include "runtime/TopenCLInfo.h"
#include "viewer/DeformerChain.h"
#include "viewer/ModelImport.h"
#include "viewer/Verification.h"

#include <algorithm>
#include <climits>
#include <cstdio>
#include <iostream>
#include <random>
#include <sstream>
#include <stdexcept>
#include <string_view>

#include <QJsonArray>
#include <QJsonDocument>
#include <QOpenGLVersionFunctionsFactory>
#include <QSurfaceFormat>

namespace {

constexpr const char* kUsage = R"(Usage: vyra-opencl-bench-frames [OPTION...] [MODEL]

Deforms crowds of a model (X/Testwuson.X), frame after frame, on three paths: through the library in
the vertex buffers themselves ("shared"); on OpenCL with the vertices read back and uploaded by
glBufferSubData ("read back"); on the CPU, with all its threads and vector instructions, and uploaded
("CPU"). A time ends when OpenGL has finished. Nothing is drawn. At the end each path is compared with
the reference of the deformers.

  --crowds N,N,...   numbers of characters (1,2,5,16,50,156,500,1560)
  --frames N         frames per path, of which the first are left out (25)
  --only PATH        one path only
  --json FILE        also writes the results as JSON
  --help             this text
)";

// Frames until memory and kernels are there.
constexpr int kWarmUp = 5;
constexpr double kSecondsPerFrame = 1.0 / 24;
constexpr const char* kDeformers = "skin,twist";

struct Options {
    std::string model = "X/Testwuson.X";
    std::vector<int> crowds{1, 2, 5, 16, 50, 156, 500, 1560};
    int frames = 25;
    std::string only;
    std::string json;
    bool help = false;
};

int positive(const std::string& text)
{
    std::size_t end = 0;
    int number = 0;
    try {
        number = std::stoi(text, &end);
    } catch (const std::exception&) {
    }
    if (end != text.size() || number < 1)
        throw std::runtime_error("'" + text + "' is not a number above 0");
    return number;
}

std::vector<int> crowdsOf(const std::string& list)
{
    std::vector<int> crowds;
    std::istringstream items(list);
    for (std::string item; std::getline(items, item, ',');)
        crowds.push_back(positive(item));
    return crowds;
}

Options parse(int count, char** arguments)
{
    Options options;
    for (int index = 1; index < count; ++index) {
        const std::string_view argument = arguments[index];
        const auto value = [&]() -> std::string {
            if (++index == count)
                throw std::runtime_error(std::string(argument) + " needs a value");
            return arguments[index];
        };
        if (argument == "--crowds")
            options.crowds = crowdsOf(value());
        else if (argument == "--frames")
            options.frames = positive(value());
        else if (argument == "--only")
            options.only = value();
        else if (argument == "--json")
            options.json = value();
        else if (argument == "--help")
            options.help = true;
        else if (!argument.starts_with('-'))
            options.model = argument;
        else
            throw std::runtime_error("unknown argument " + std::string(argument) +
                                     "; --help tells all");
    }
    if (options.frames <= kWarmUp)
        throw std::runtime_error("--frames must be above " + std::to_string(kWarmUp));
    return options;
}

// One path with its scene and its times.
struct Candidate {
    std::unique_ptr<vyra::Evaluator> evaluator; // outlives the scene
    std::unique_ptr<viewer::Scene> scene;
    std::unique_ptr<Path> path;
    std::vector<double> milliseconds{};
    Allocations allocations{}; // in the frames that were timed
};

struct Crowd {
    int characters;
    std::size_t vertices;
    std::vector<Candidate> candidates;
};

class Stage {
public:
    Stage(QOpenGLFunctions_3_3_Core& gl, const viewer::Model& model) : fGL(gl), fModel(model) {}

    // The times of `frames` frames, the paths in random order in each. With `only`, of one path.
    Crowd measure(int characters, int frames, const std::string& only)
    {
        Crowd crowd{characters, 0, candidates(characters, only)};
        for (const viewer::CharacterMesh* mesh : crowd.candidates.front().scene->meshes())
            crowd.vertices += mesh->mesh().vertexCount();
        std::mt19937 random(1); // the order is the same in every run
        for (int frame = 0; frame < frames; ++frame) {
            std::shuffle(crowd.candidates.begin(), crowd.candidates.end(), random);
            for (Candidate& candidate : crowd.candidates)
                play(candidate, frame);
        }
        for (Candidate& candidate : crowd.candidates) {
            if (!viewer::verify(fGL, *candidate.scene).withinBound())
                throw std::runtime_error(std::string("a frame of the path '") +
                                         candidate.path->name() + "' is wrong");
        }
        const auto byName = [](const Candidate& a, const Candidate& b) {
            return std::string_view(a.path->name()) > b.path->name();
        };
        std::sort(crowd.candidates.begin(), crowd.candidates.end(), byName);
        return crowd;
    }

private:
    std::unique_ptr<viewer::Scene> scene(int characters)
    {
        const viewer::Animation* animation =
            fModel.animations.empty() ? nullptr : &fModel.animations.front();
        return std::make_unique<viewer::Scene>(fGL, fModel, animation, characters);
    }

    std::vector<Candidate> candidates(int characters, const std::string& only)
    {
        std::vector<Candidate> all;
        const auto add = [&](const char* name, bool shares, auto&& make) {
            if (!only.empty() && only != name)
                return;
            // Vertex buffers that a path does not share must not be in the batch.
            TopenCLInfo::theOne().setMinimumBufferSize(shares ? 0 : INT_MAX);
            auto evaluator = std::make_unique<vyra::Evaluator>(settings());
            auto stage = scene(characters);
            stage->attach(*evaluator, viewer::parseDeformers(kDeformers).value());
            stage->pose(kSecondsPerFrame); // at 0 the twist has no pass
            auto path = make(*evaluator, *stage);
            all.push_back({std::move(evaluator), std::move(stage), std::move(path)});
        };
        add("shared", true,
            [](vyra::Evaluator& e, viewer::Scene&) { return makeSharedBufferPath(e); });
        add("read back", false,
            [this](vyra::Evaluator&, viewer::Scene& s) { return makeReadBackPath(fGL, s); });
        add("CPU", false,
            [this](vyra::Evaluator&, viewer::Scene& s) { return makeCpuPath(fGL, s); });
        if (all.empty())
            throw std::runtime_error("there is no path '" + only + "'; --help lists them");
        return all;
    }

    void play(Candidate& candidate, int frame)
    {
        const Allocations before = allocationsSoFar();
        candidate.scene->pose(frame * kSecondsPerFrame);
        const Nanoseconds time = timed([&] {
            candidate.path->deform();
            fGL.glFinish();
        });
        candidate.path->drawn();
        if (frame < kWarmUp)
            return;
        candidate.allocations += allocationsSoFar() - before;
        candidate.milliseconds.push_back(std::chrono::duration<double, std::milli>(time).count());
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
};

std::string fixed(double value, int digits)
{
    char text[32];
    std::snprintf(text, sizeof text, "%.*f", digits, value);
    return text;
}

double perFrame(std::size_t count, const Candidate& candidate)
{
    return static_cast<double>(count) / static_cast<double>(candidate.milliseconds.size());
}

void addRows(Table& table, const Crowd& crowd)
{
    for (const Candidate& candidate : crowd.candidates) {
        const Spread spread = spreadOf(candidate.milliseconds);
        table.add({std::string(candidate.path->name()), std::to_string(crowd.characters),
                   std::to_string(crowd.vertices), fixed(spread.median, 2), fixed(spread.low, 2),
                   fixed(spread.high, 2), fixed(1000 * spread.median / crowd.characters, 1),
                   fixed(perFrame(candidate.allocations.library, candidate), 1),
                   fixed(perFrame(candidate.allocations.program, candidate), 1),
                   fixed(perFrame(candidate.allocations.others, candidate), 1)});
    }
}

QJsonArray toJson(const Crowd& crowd)
{
    QJsonArray rows;
    for (const Candidate& candidate : crowd.candidates) {
        const Spread spread = spreadOf(candidate.milliseconds);
        rows.append(QJsonObject{
            {"path", candidate.path->name()},
            {"characters", crowd.characters},
            {"vertices", static_cast<qint64>(crowd.vertices)},
            {"milliseconds",
             QJsonObject{{"median", spread.median}, {"low", spread.low}, {"high", spread.high}}},
            {"allocations",
             QJsonObject{{"library", perFrame(candidate.allocations.library, candidate)},
                         {"program", perFrame(candidate.allocations.program, candidate)},
                         {"others", perFrame(candidate.allocations.others, candidate)}}}});
    }
    return rows;
}

void run(const Options& options, int& argumentCount, char** arguments)
{
    QSurfaceFormat format;
    format.setVersion(3, 3);
    format.setProfile(QSurfaceFormat::CoreProfile);
    QSurfaceFormat::setDefaultFormat(format);
    Runtime runtime(argumentCount, arguments);
    auto* gl = QOpenGLVersionFunctionsFactory::get<QOpenGLFunctions_3_3_Core>(
        QOpenGLContext::currentContext());
    const viewer::Result<viewer::Model> model = viewer::importModel(options.model);
    if (!gl)
        throw std::runtime_error("the graphics driver has no OpenGL 3.3");
    if (!model)
        throw std::runtime_error(model.failure().text);

    startCounting();
    Stage stage(*gl, model.value());
    Table table({"Path", "characters", "vertices", "ms", "10 %", "90 %", "us/character",
                 "new: library", "program", "others"});
    QJsonArray rows;
    for (const int characters : options.crowds) {
        std::fprintf(stderr, "%d characters\n", characters);
        const Crowd crowd = stage.measure(characters, options.frames, options.only);
        addRows(table, crowd);
        for (const QJsonValue row : toJson(crowd))
            rows.append(row);
    }
    const char* renderer = reinterpret_cast<const char*>(gl->glGetString(GL_RENDERER));
    std::cout << processorName() << "; " << Runtime::platformName() << "; " << Runtime::deviceName()
              << "; " << renderer << "\n\n";
    table.write(std::cout);
    const QJsonObject json{{"processor", QString::fromStdString(processorName())},
                           {"platform", QString::fromStdString(Runtime::platformName())},
                           {"device", QString::fromStdString(Runtime::deviceName())},
                           {"renderer", renderer},
                           {"model", QString::fromStdString(options.model)},
                           {"rows", rows}};
    if (!options.json.empty() && !writeJson(options.json, json))
        throw std::runtime_error(options.json + " cannot be written");
}

} // namespace

int main(int argumentCount, char** arguments)
{
    try {
        const Options options = parse(argumentCount, arguments);
        if (options.help)
            std::cout << kUsage;
        else
            run(options, argumentCount, arguments);
        return 0;
    } catch (const std::exception& error) {
        std::fprintf(stderr, "vyra-opencl-bench-frames: %s\n", error.what());
        return 1;
    }
}
