// Fuzzes the two rules that read text from outside: NVIDIA driver versions, and build options with
// include directories. The options are read off the build call of the scripted runtime.
//
// An input's first byte chooses the rule; the rest is the version, or lines: the flags ("-" for
// none given), then one include directory a line.
#include "FakeRuntime.h"

#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/DriverVersion.h"
#include "runtime/TopenCLInfo.h"

#include <cstdint>
#include <cstdlib>
#include <sstream>
#include <string>

namespace {

void require(bool holds)
{
    if (!holds)
        std::abort();
}

void fuzzDriverVersion(const std::string& text)
{
    DriverVersion version;
    try {
        version = parseDriverVersion(text);
    } catch (const std::exception&) {
        return; // an unreadable version is told by an exception of the standard library
    }
    const auto cautious = judgeDriver(version, std::nullopt);
    const auto trusting = judgeDriver(version, 1);
    require(trusting.usable && trusting.implicitSync);
    require(cautious.usable || version.major >= 361);
    require(!cautious.implicitSync || cautious.asyncReadback);
    require(judgeDriver(version, 0).usable && judgeDriver(version, -1).usable == cautious.usable);
}

// The same composition, written another way.
std::string expectedOptions(const std::string& flags, const std::vector<std::string>& directories)
{
    std::ostringstream options;
    options << (flags == "-" ? "-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror"
                             : flags);
    for (const std::string& directory : directories) {
        const auto first = directory.find_first_not_of(' ');
        const auto last = directory.find_last_not_of(' ');
        const std::string trimmed =
            first == std::string::npos ? "" : directory.substr(first, last - first + 1);
        const char* quote = trimmed.find(' ') == std::string::npos ? "" : "\"";
        options << " -I " << quote << trimmed << quote;
    }
    if (TopenCLInfo::theOne().supportsDoublePrecision())
        options << " -D SupportsDoublePrecision";
    return options.str();
}

void fuzzBuildOptions(const std::string& text)
{
    std::istringstream lines(text);
    std::string flags;
    std::getline(lines, flags);
    std::vector<std::string> directories;
    TstringArray array;
    for (std::string line; std::getline(lines, line);) {
        directories.push_back(line);
        array.append(Tstring(line.c_str()));
    }

    TopenCLKernelStore& store = TopenCLInfo::theOne().kernelStore();
    scripted::runtime().takeCalls();
    const AutoCLObject<cl_kernel> kernel = store.getKernelFromString(
        "kernel void skin() {}", "fuzzed", flags == "-" ? nullptr : flags.c_str(), "skin", &array);
    require(kernel.get() != nullptr);
    bool found = false;
    for (const std::string& call : scripted::runtime().takeCalls())
        found |=
            call.find(", \"" + expectedOptions(flags, directories) + "\")") != std::string::npos;
    require(found);
    require(store.freeKernel(kernel));
}

} // namespace

extern "C" int LLVMFuzzerInitialize(int* /*argumentCount*/, char*** /*arguments*/)
{
    scripted::runtime().describe(scripted::World());
    require(TopenCLInfo::initialize(nullptr, nullptr, nullptr, false, false, 0x8086));
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    if (size == 0)
        return 0;
    // Texts end at their first NUL, as everywhere in OpenCL.
    const std::string text(std::string(data + 1, data + size).c_str());
    if (data[0] % 2 == 0)
        fuzzDriverVersion(text);
    else
        fuzzBuildOptions(text);
    return 0;
}
