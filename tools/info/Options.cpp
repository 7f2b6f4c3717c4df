#include "tools/info/Options.h"

#include "tools/info/text/TextFormatting.h"

#include <charconv>
#include <string_view>

#include <QCommandLineParser>

namespace info {
namespace {

constexpr char kDescription[] =
    R"(Reports whether the library's OpenCL is on, and why: the OpenCL of this machine, the decisions
of start-up, and the environment variables that affect them. A self-test deforms one shared buffer
and checks the result in OpenGL's memory. Nothing is shown on the screen, and nothing on the machine
is changed.

Exit codes:
  0  OpenCL is on and the self-test passed
  1  OpenCL is off; the report gives the reason and a remedy
  2  wrong options
  3  OpenCL is on and the self-test failed
  4  no display, or no OpenGL on it)";

constexpr char kPlatform[] = "platform";
constexpr char kDeviceVendor[] = "device-vendor";
constexpr char kJson[] = "json";
constexpr char kVersion[] = "version";
constexpr char kHelp[] = "help";

void addOptions(QCommandLineParser& parser)
{
    parser.setApplicationDescription(kDescription);
    parser.addOptions({
        {kPlatform, "Use the OpenCL platform of this vendor, like VYRA_OPENCL_PLATFORM.", "NAME"},
        {kDeviceVendor,
         "PCI vendor id of the GPU that draws, such as 0x10de. By default it is derived from "
         "OpenGL's texts.",
         "ID"},
        {kJson, "Print one JSON object, described by info.schema.json."},
        {kVersion, "Print the version."},
        {{"h", kHelp}, "Print this text."},
    });
}

// Parses a decimal number, or a hexadecimal one after "0x".
std::optional<unsigned> parseId(std::string_view text)
{
    int base = 10;
    if (text.starts_with("0x") || text.starts_with("0X")) {
        text.remove_prefix(2);
        base = 16;
    }
    unsigned value = 0;
    const char* end = text.data() + text.size();
    const auto [parsed, error] = std::from_chars(text.data(), end, value, base);
    return error == std::errc() && parsed == end ? std::optional<unsigned>(value) : std::nullopt;
}

// Returns the reason why parsing failed. Empty if it succeeded and there are only options.
std::string problemOf(const QCommandLineParser& parser)
{
    const QStringList unknown = parser.unknownOptionNames();
    if (!unknown.isEmpty())
        return "there is no option " + quoted("--" + unknown.first().toStdString());
    if (!parser.positionalArguments().isEmpty())
        return "unexpected argument " + quoted(parser.positionalArguments().first().toStdString());
    QString error = parser.errorText(); // a sentence: "Missing value after '--platform'."
    if (error.isEmpty())
        return "";
    error[0] = error[0].toLower();
    if (error.endsWith(u'.'))
        error.chop(1);
    return error.toStdString();
}

} // namespace

std::optional<Options> parseOptions(const QStringList& arguments, std::string& problem)
{
    QCommandLineParser parser;
    parser.setSingleDashWordOptionMode(QCommandLineParser::ParseAsLongOptions);
    addOptions(parser);
    parser.parse(arguments);
    problem = problemOf(parser);
    Options options;
    options.help = parser.isSet(kHelp);
    options.version = parser.isSet(kVersion);
    options.json = parser.isSet(kJson);
    if (problem.empty() && parser.isSet(kPlatform)) {
        options.platform = parser.value(kPlatform).toStdString();
        if (options.platform->empty())
            problem = "--platform requires a value that is not empty";
    }
    if (problem.empty() && parser.isSet(kDeviceVendor)) {
        const std::string id = parser.value(kDeviceVendor).toStdString();
        options.deviceVendor = parseId(id);
        if (!options.deviceVendor)
            problem = "--device-vendor requires a number such as 0x10de, not " + quoted(id);
    }
    return problem.empty() ? std::optional<Options>(options) : std::nullopt;
}

std::string helpText()
{
    QCommandLineParser parser;
    addOptions(parser);
    return parser.helpText().toStdString();
}

} // namespace info
