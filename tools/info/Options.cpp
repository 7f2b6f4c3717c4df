#include "tools/info/Options.h"

#include "tools/info/text/TextFormatting.h"

#include <charconv>
#include <string_view>

namespace info {
namespace {

constexpr char kHelp[] =
    R"(Usage: vyra-opencl-info [OPTION...]

Tells whether the library's OpenCL is on, and why: what it finds on this machine, what it decides
and which environment variables had a say. A self-test deforms one shared buffer and checks it in
OpenGL's memory. Nothing is shown on the screen, and nothing on the machine is changed.

  --platform NAME     use the OpenCL platform of this vendor, as VYRA_OPENCL_PLATFORM does
  --device-vendor ID  the PCI vendor id of the GPU that draws, such as 0x10de; by default it
                      follows from OpenGL's own texts
  --json              print one JSON object, described by info.schema.json
  --version           print the version
  --help              print this text

Exit codes:
  0  OpenCL is on and the self-test is right
  1  OpenCL is off; the report says why and what helps
  2  wrong options
  3  OpenCL is on and the self-test failed
  4  no display, or no OpenGL on it
)";

// Decimal, or hexadecimal behind "0x".
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

// Reads the arguments from first to last and stops at the first problem.
class Reader {
public:
    Reader(const std::vector<std::string>& arguments, std::string& problem)
        : fArguments(arguments), fProblem(problem)
    {
    }

    std::optional<Options> read()
    {
        while (fNext < fArguments.size()) {
            if (!readOne(fArguments[fNext++]))
                return std::nullopt;
        }
        return fOptions;
    }

private:
    bool readOne(const std::string& argument)
    {
        const std::size_t equals = argument.find('=');
        const std::string name = argument.substr(0, equals);
        if (name == "--platform")
            return readPlatform(name, argument, equals);
        if (name == "--device-vendor")
            return readDeviceVendor(name, argument, equals);
        if (argument == "--json")
            return fOptions.json = true;
        if (argument == "--help" || argument == "-h")
            return fOptions.help = true;
        if (argument == "--version")
            return fOptions.version = true;
        fProblem = "there is no option " + quoted(argument);
        return false;
    }

    // The text behind "=", or the next argument.
    std::optional<std::string> value(const std::string& name, const std::string& argument,
                                     std::size_t equals)
    {
        if (equals != std::string::npos)
            return argument.substr(equals + 1);
        if (fNext < fArguments.size())
            return fArguments[fNext++];
        fProblem = name + " needs a value";
        return std::nullopt;
    }

    bool readPlatform(const std::string& name, const std::string& argument, std::size_t equals)
    {
        fOptions.platform = value(name, argument, equals);
        if (fOptions.platform && fOptions.platform->empty()) {
            fProblem = name + " takes a value that is not empty";
            return false;
        }
        return fOptions.platform.has_value();
    }

    bool readDeviceVendor(const std::string& name, const std::string& argument, std::size_t equals)
    {
        const std::optional<std::string> text = value(name, argument, equals);
        if (!text)
            return false;
        fOptions.deviceVendor = parseId(*text);
        if (!fOptions.deviceVendor)
            fProblem = name + " takes a number such as 0x10de, not " + quoted(*text);
        return fOptions.deviceVendor.has_value();
    }

    const std::vector<std::string>& fArguments;
    std::string& fProblem;
    std::size_t fNext = 0;
    Options fOptions;
};

} // namespace

std::optional<Options> parseOptions(const std::vector<std::string>& arguments, std::string& problem)
{
    return Reader(arguments, problem).read();
}

const char* helpText()
{
    return kHelp;
}

} // namespace info
