// Measures whole frames of the library, and of the alternatives without it.
#include "fixtures/Runtime.h"
#include "frames/Allocations.h"
#include "frames/Content.h"
#include "frames/FrameReport.h"
#include "frames/Stage.h"
#include "harness/CommandLine.h"
#include "harness/Report.h"
#include "viewer/model/import/ModelImport.h"

#include <cstdio>
#include <iostream>
#include <sstream>
#include <stdexcept>

#include <QJsonObject>
#include <QOpenGLVersionFunctionsFactory>
#include <QSurfaceFormat>

namespace {

constexpr const char* kDescription =
    R"(Deforms crowds of a model, frame after frame, and compares the paths into the vertex buffers:

  shared         the library: OpenCL works directly in the vertex buffers
  read back      OpenCL, read back, and uploaded with glBufferSubData
  CPU            without OpenCL: all threads, vector instructions over sixteen vertices, written
                 into mapped vertex buffers
  plain CPU      without OpenCL and without hand-written vector code: skinned vertex by vertex, and
                 uploaded with glBufferSubData
  memory, ...    the physical limit, without deformers: writes as many bytes to memory as the vertex
                 buffers have, on one core and on all

A time ends when OpenGL has finished. Nothing is drawn. At the end each path is compared with the
reference of the deformers.)";

struct Options {
    std::string model = "X/Testwuson.X";
    std::string content; // empty: all
    std::vector<int> crowds;
    StageSettings stage;
    std::string json;
};

void addOptions(QCommandLineParser& parser)
{
    parser.setApplicationDescription(kDescription);
    parser.addPositionalArgument("MODEL", "The model (default: X/Testwuson.X).", "[MODEL]");
    parser.addOptions({
        {"content",
         "Measure one content only: skin-twist; double-skin, with the skin in double precision; "
         "morph-smooth, eight targets and ten iterations.",
         "NAME"},
        {"crowds", "Numbers of characters (skin-twist: 1,2,5,16,50,156,500,1560).", "N,N,..."},
        {"frames", "Frames per path after the first five (500 to 25, by the size of the crowd).",
         "N"},
        {"only", "Measure one path only.", "PATH"},
        {"json", "Also write the results as JSON.", "FILE"},
    });
}

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

Options readOptions(const QCommandLineParser& parser)
{
    const auto value = [&parser](const char* name) { return parser.value(name).toStdString(); };
    Options options;
    if (parser.isSet("content"))
        options.content = contentOf(value("content")).name;
    options.crowds = crowdsOf(value("crowds"));
    if (parser.isSet("frames"))
        options.stage.frames = positive(value("frames"));
    options.stage.only = value("only");
    options.json = value("json");
    if (!parser.positionalArguments().isEmpty())
        options.model = parser.positionalArguments().first().toStdString();
    return options;
}

std::vector<CrowdTimes> measureAll(const Options& options, QOpenGLFunctions_3_3_Core& gl)
{
    std::vector<CrowdTimes> all;
    for (const Content& content : contents()) {
        if (!options.content.empty() && options.content != content.name)
            continue;
        viewer::Result<viewer::Model> model = viewer::importModel(options.model);
        if (!model)
            throw std::runtime_error(model.failure().text);
        content.prepare(model.value());
        for (const int characters : options.crowds.empty() ? content.crowds : options.crowds) {
            std::fprintf(stderr, "%s: %d characters\n", content.name, characters);
            all.push_back(measure(gl, model.value(), content, characters, options.stage));
        }
    }
    return all;
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
    if (!gl)
        throw std::runtime_error("the graphics driver has no OpenGL 3.3");

    startCounting();
    const std::vector<CrowdTimes> crowds = measureAll(options, *gl);
    const char* renderer = reinterpret_cast<const char*>(gl->glGetString(GL_RENDERER));
    std::cout << cpuName() << "; " << Runtime::platformName() << "; " << Runtime::deviceName()
              << "; " << renderer << "\n\n";
    writeTimes(std::cout, crowds);
    std::cout << '\n';
    writeGoals(std::cout, crowds);
    QJsonObject json = toJson(crowds);
    json["cpu"] = QString::fromStdString(cpuName());
    json["platform"] = QString::fromStdString(Runtime::platformName());
    json["device"] = QString::fromStdString(Runtime::deviceName());
    json["renderer"] = renderer;
    json["model"] = QString::fromStdString(options.model);
    if (!options.json.empty() && !writeJson(options.json, json))
        throw std::runtime_error(options.json + " cannot be written");
}

} // namespace

int main(int argumentCount, char** arguments)
{
    try {
        QCommandLineParser parser;
        addOptions(parser);
        parseCommandLine(parser, argumentCount, arguments, 1);
        if (!printHelp(parser, argumentCount, arguments))
            run(readOptions(parser), argumentCount, arguments);
        return 0;
    } catch (const std::exception& error) {
        std::fprintf(stderr, "vyra-opencl-bench-frames: %s\n", error.what());
        return 1;
    }
}
