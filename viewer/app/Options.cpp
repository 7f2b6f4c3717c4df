#include "viewer/app/Options.h"

#include "viewer/app/Controls.h"

#include <algorithm>

#include <QCommandLineParser>
#include <QRegularExpression>

namespace viewer {
namespace {

// Limits of graphics cards and of memory.
constexpr int kLargestPicture = 8192;
constexpr int kLargestCrowd = 10000;
constexpr int kMostFrames = 1000000;
constexpr int kMostVertices = 1000000000;
constexpr int kSmallestPicture = 16; // pixels
constexpr int kLongestLoad = 86400;  // seconds, a day

constexpr char kExitCodes[] =
    R"(
Exit codes:
  0  success
  1  --verify found a deviation above the bound
  2  wrong options
  3  the model cannot be used
  4  no display, or no OpenGL 3.3
  5  no OpenCL that shares buffers with OpenGL
  6  a picture or the trace cannot be written
  7  OpenCL failed while the viewer was running
  8  there is not enough memory
  130  interrupted with Ctrl-C; the report and the trace are written
)";

void describe(QCommandLineParser& parser)
{
    parser.setApplicationDescription(
        "Shows an animated character that OpenCL deforms in the vertex buffers that OpenGL draws "
        "from.");
    parser.addOptions({
        {{"h", "help"}, "Shows this text."},
        {"version", "Shows the version."},
        {"frames", "Renders <n> frames and exits (default: plays in a window).", "n"},
        {"crowd", "Shows <n> characters, each with its own buffers.", "n"},
        {"size", "Size of the picture in pixels (default: 1280x720).", "WxH"},
        {"output", "Writes the frames as PNG into <folder>; needs --frames.", "folder"},
        {"every", "Writes only every <k>-th frame.", "k"},
        {"verify", "Compares every frame with a CPU reference."},
        {"trace", "Writes a timeline for Perfetto to <file>.", "file"},
        {"animation", "Plays the animation <name> (default: the first).", "name"},
        {"deformers",
         QString("Applies these deformers in this order (default: %1), for example "
                 "skin,wave:amplitude=0.1:wavelength=0.5.")
             .arg(kDefaultDeformers),
         "list", kDefaultDeformers},
        {"min-verts", "Deforms meshes with fewer than <n> vertices on the CPU.", "n"},
        {"platform", "Uses the OpenCL platform of this <vendor>.", "vendor"},
        {"allow-cpu", "Deforms on the CPU if OpenCL cannot be used."},
        {"resize-every", "Changes the level of detail every <n> frames.", "n"},
        {"up", "Axis of the file that points up: x, y or z (default: the file's, or y).", "axis"},
        {"crease", "In a model without normals, keeps edges above this angle sharp (default: 60).",
         "degrees"},
        {"load-limit", "Cancels the load of a model after <s> seconds (default: 60).", "s"},
    });
    parser.addPositionalArgument("MODEL", "A model file, or a sample such as X/Testwuson.X.");
}

Failure usageError(const QString& text)
{
    return {ExitCode::kUsage, text.toStdString() + "; see vyra-viewer --help"};
}

// Reads the values of options and keeps the first error.
class Reader {
public:
    explicit Reader(const QCommandLineParser& parser) : fParser(parser) {}

    std::string text(const QString& name)
    {
        const QString value = fParser.value(name);
        if (fParser.isSet(name) && value.isEmpty())
            reject(QString("--%1 takes a value that is not empty").arg(name));
        return value.toStdString();
    }

    std::optional<UpAxis> axis(const QString& name)
    {
        static const QStringList names{"x", "y", "z"};
        if (!fParser.isSet(name))
            return std::nullopt;
        const auto index = names.indexOf(fParser.value(name));
        if (index < 0)
            reject(QString("--%1 takes x, y or z, not '%2'").arg(name, fParser.value(name)));
        return static_cast<UpAxis>(index);
    }

    std::optional<int> number(const QString& name, int lowest, int highest)
    {
        if (!fParser.isSet(name))
            return std::nullopt;
        bool isNumber = false;
        const int value = fParser.value(name).toInt(&isNumber);
        if (isNumber && value >= lowest && value <= highest)
            return value;
        reject(QString("--%1 takes a whole number from %2 to %3, not '%4'")
                   .arg(name)
                   .arg(lowest)
                   .arg(highest)
                   .arg(fParser.value(name)));
        return std::nullopt;
    }

    QSize size(QSize fallback)
    {
        if (!fParser.isSet("size"))
            return fallback;
        static const QRegularExpression pattern("^([0-9]{1,5})x([0-9]{1,5})$");
        const auto match = pattern.match(fParser.value("size"));
        const QSize size(match.captured(1).toInt(), match.captured(2).toInt());
        if (std::min(size.width(), size.height()) < kSmallestPicture ||
            std::max(size.width(), size.height()) > kLargestPicture) {
            reject(QString("--size takes WIDTHxHEIGHT, each from %1 to %2, not '%3'")
                       .arg(kSmallestPicture)
                       .arg(kLargestPicture)
                       .arg(fParser.value("size")));
        }
        return size;
    }

    std::vector<DeformerChoice> deformers()
    {
        Result<std::vector<DeformerChoice>> chain = parseDeformers(text("deformers"));
        if (chain)
            return std::move(chain.value());
        reject(QString::fromStdString(chain.failure().text));
        return {};
    }

    void reject(const QString& text)
    {
        if (!fFailure)
            fFailure = usageError(text);
    }

    const Status& failure() const { return fFailure; }

private:
    const QCommandLineParser& fParser;
    Status fFailure;
};

Options read(const QCommandLineParser& parser, Reader& reader)
{
    Options options;
    options.animation = reader.text("animation");
    options.frames = reader.number("frames", 1, kMostFrames);
    options.crowd = reader.number("crowd", 1, kLargestCrowd).value_or(options.crowd);
    options.size = reader.size(options.size);
    options.output = reader.text("output");
    options.every = reader.number("every", 1, kMostFrames).value_or(options.every);
    options.verify = parser.isSet("verify");
    options.trace = reader.text("trace");
    options.minimumVertices = reader.number("min-verts", 0, kMostVertices);
    options.platform = reader.text("platform");
    options.allowCpu = parser.isSet("allow-cpu");
    options.resizeEvery = reader.number("resize-every", 1, kMostFrames).value_or(0);
    options.deformers = reader.deformers();
    options.import.up = reader.axis("up");
    options.import.creaseAngle =
        reader.number("crease", 0, 180).value_or(static_cast<int>(options.import.creaseAngle));
    options.loadLimit = reader.number("load-limit", 1, kLongestLoad).value_or(options.loadLimit);

    const QStringList models = parser.positionalArguments();
    if (models.size() == 1 && !models.front().isEmpty())
        options.model = models.front().toStdString();
    else
        reader.reject(models.size() > 1 ? "more than one model is given" : "the model is missing");
    if (!options.output.empty() && !parser.isSet("frames"))
        reader.reject("--output needs --frames, the number of frames to render");
    return options;
}

} // namespace

Result<Options> parseOptions(const QStringList& arguments)
{
    QCommandLineParser parser;
    describe(parser);
    if (!parser.parse(arguments))
        return usageError(parser.errorText().remove('.'));
    if (parser.isSet("help") || parser.isSet("version")) {
        Options options;
        options.help = parser.isSet("help");
        options.version = !options.help;
        return options;
    }
    Reader reader(parser);
    Options options = read(parser, reader);
    if (reader.failure())
        return *reader.failure();
    return options;
}

std::string helpText()
{
    QCommandLineParser parser;
    describe(parser);
    return parser.helpText().toStdString() + "\nDeformers and their parameters:\n" +
           deformerHelp() +
           "\nIn the window: drag to orbit, drag with Shift or the right button to pan, wheel to "
           "zoom, and the keys\n" +
           keyHelp() + kExitCodes;
}

} // namespace viewer
