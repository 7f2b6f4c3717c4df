// Measures whole frames of the library and of what an application would do without it.
#include "fixtures/Runtime.h"
#include "frames/Allocations.h"
#include "frames/Content.h"
#include "frames/FrameReport.h"
#include "frames/Stage.h"
#include "harness/Report.h"
#include "viewer/model/import/ModelImport.h"

#include <cstdio>
#include <iostream>
#include <sstream>
#include <stdexcept>
#include <string_view>

#include <QJsonObject>
#include <QOpenGLVersionFunctionsFactory>
#include <QSurfaceFormat>

namespace {

constexpr const char* kUsage = R"(Usage: vyra-opencl-bench-frames [OPTION...] [MODEL]

Deforms crowds of a model (X/Testwuson.X), frame after frame, and compares the paths into the vertex
buffers:

  shared             through the library, on OpenCL in the vertex buffers themselves
  read back          on OpenCL, read back, and uploaded by glBufferSubData
  CPU                without OpenCL: all threads, vector instructions over sixteen vertices, written
                     straight into mapped vertex buffers
  plain CPU          the same as one would write it first: skinned vertex by vertex, and uploaded by
                     glBufferSubData
  memory, ...        no deformer: only writes as many bytes to memory as the vertex buffers have, the
                     physical limit, on one core and on all

A time ends when OpenGL has finished. Nothing is drawn. At the end each path is compared with the
reference of the deformers.

  --content NAME     one content only: skin-twist; double-skin, with the skin in double precision;
                     morph-smooth, eight targets and ten iterations
  --crowds N,N,...   numbers of characters (skin-twist: 1,2,5,16,50,156,500,1560)
  --frames N         frames per path after the first five (500 to 25, by the size of the crowd)
  --only PATH        one path only
  --json FILE        also writes the results as JSON
  --help             this text
)";

struct Options {
    std::string model = "X/Testwuson.X";
    std::string content; // empty: all
    std::vector<int> crowds;
    StageSettings stage;
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
        if (argument == "--content")
            options.content = contentOf(value()).name;
        else if (argument == "--crowds")
            options.crowds = crowdsOf(value());
        else if (argument == "--frames")
            options.stage.frames = positive(value());
        else if (argument == "--only")
            options.stage.only = value();
        else if (argument == "--json")
            options.json = value();
        else if (argument == "--help")
            options.help = true;
        else if (!argument.starts_with('-'))
            options.model = argument;
        else
            throw std::runtime_error("unknown argument " + std::string(argument) +
                                     "; --help lists all");
    }
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
    std::cout << processorName() << "; " << Runtime::platformName() << "; " << Runtime::deviceName()
              << "; " << renderer << "\n\n";
    writeTimes(std::cout, crowds);
    std::cout << '\n';
    writeGoals(std::cout, crowds);
    QJsonObject json = toJson(crowds);
    json["processor"] = QString::fromStdString(processorName());
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
