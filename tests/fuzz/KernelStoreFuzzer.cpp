// Fuzzes sequences of requests to the kernel store, with build options, and of kernel files that
// are edited while the viewer runs. Each kernel must come from the text and the options that were
// requested, and nothing is left in the end. Some OpenCL calls fail.
#include "Require.h"
#include "fake/FakeRuntime.h"

#include "evaluator/KernelLibrary.h"
#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <fstream>
#include <iterator>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include <QTemporaryDir>
#include <fuzzer/FuzzedDataProvider.h>

namespace {

using Kernel = AutoCLObject<cl_kernel>;

constexpr unsigned kMostSteps = 64;
const std::string kTexts[] = {"skin", "twist", "skin twist", "skin // edited", "#error skin"};
const std::string kNames[] = {"skin", "twist"}; // of kernels, and of their files
const char kLibraryFlags[] = "-cl-no-signed-zeros -Werror";
const char* const kCalls[] = {"clCreateProgramWithSource", "clBuildProgram", "clCreateKernel"};

bool contains(const std::string& text, const std::string& part)
{
    return text.find(part) != std::string::npos;
}

// The programs that the runtime has seen, read from its log.
class Log {
public:
    struct Program {
        std::string text;
        std::string options;
    };

    // Reads the calls since the last time, and returns the number of builds.
    unsigned read()
    {
        unsigned builds = 0;
        for (const std::string& call : scripted::runtime().takeCalls()) {
            const auto open = call.find('(') + 1;
            const std::string first = call.substr(open, call.find(',') - open);
            const auto quote = call.find('"') + 1;
            const std::string quoted = call.substr(quote, call.rfind('"') - quote);
            const std::string result = call.substr(call.rfind(' ') + 1);
            if (call.starts_with("clCreateProgramWithSource"))
                fPrograms[result] = {quoted, ""};
            if (call.starts_with("clBuildProgram")) {
                fPrograms[first].options = quoted;
                ++builds;
            }
            if (call.starts_with("clCreateKernel"))
                fKernels[result] = first;
        }
        return builds;
    }
    const Program& programOf(cl_kernel kernel)
    {
        read();
        return fPrograms.at(fKernels.at(scripted::runtime().name(kernel)));
    }

private:
    std::map<std::string, Program> fPrograms;
    std::map<std::string, std::string> fKernels; // to their programs
};
Log theLog;

// A directory with the kernel files.
const std::string& directory()
{
    static const QTemporaryDir folder;
    static const std::string path = folder.path().toStdString();
    return path;
}

struct Request {
    std::string program;
    std::string text;
    std::optional<std::string> flags = kLibraryFlags;
    std::vector<std::string> directories = {directory()};

    // The composition of options, written another way than the library's.
    std::string options() const
    {
        std::string options =
            flags.value_or("-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror");
        for (const std::string& each : directories) {
            const auto first = std::min(each.find_first_not_of(' '), each.size());
            const std::string trimmed = each.substr(first, each.find_last_not_of(' ') + 1 - first);
            const char* quote = contains(trimmed, " ") ? "\"" : "";
            options += " -I " + (quote + trimmed) + quote;
        }
        return options + " -D SupportsDoublePrecision";
    }

    Kernel send(const std::string& kernel) const
    {
        TstringArray list;
        for (const std::string& each : directories)
            list.append(Tstring(each.c_str()));
        return store().getKernelFromString(text.c_str(), program.c_str(),
                                           flags ? flags->c_str() : nullptr, kernel.c_str(),
                                           directories.empty() ? nullptr : &list);
    }
    static TopenCLKernelStore& store() { return TopenCLInfo::theOne().kernelStore(); }
};

class Session {
public:
    explicit Session(FuzzedDataProvider& data) : fData(data) {}

    void run()
    {
        for (unsigned step = 0; step < kMostSteps && fData.remaining_bytes() > 0; ++step) {
            theLog.read();
            const auto failing = fData.ConsumeIntegralInRange<unsigned>(0, 11);
            fFails = failing < std::size(kCalls);
            if (fFails)
                scripted::runtime().plan({.function = kCalls[failing]});
            const auto steps = {&Session::request, &Session::giveBack, &Session::useFile,
                                &Session::replaceFile};
            (this->*steps.begin()[fData.ConsumeIntegralInRange(0, 3)])();
            scripted::runtime().clearFaults();
        }
        while (!fHeld.empty())
            giveBack();
        fOfFiles.clear();
        fLibrary.reset();
        // A program that no kernel could be made of stays in the store until one is given back;
        // every text has the kernel of the empty name.
        for (const std::string& fileName : kNames)
            fSent.push_back({directory() + "/" + fileName, ""});
        for (const Request& sent : fSent)
            require(Request::store().freeKernel(sent.send("")) || contains(sent.text, "#error"));
    }

private:
    struct File {
        std::string text;
        std::set<std::string> requested{};
        std::set<std::string> created{};
    };

    // An option or a directory: often one of a few, so that requests meet again.
    std::string text()
    {
        if (fData.ConsumeIntegralInRange(0, 3) > 0)
            return fData.PickValueInArray({"-w", "include", " more includes ", "\"quoted\""});
        return fData.ConsumeRandomLengthString(24).c_str(); // up to its first NUL
    }
    std::string name() { return fData.PickValueInArray(kNames); }

    // A program of one name always has one text.
    void request()
    {
        Request request{"", fData.PickValueInArray(kTexts), std::nullopt, {}};
        request.program = "program " + request.text;
        if (fData.ConsumeBool())
            request.flags = text();
        while (fData.ConsumeBool())
            request.directories.push_back(text());
        const std::string function = name();
        const bool held = std::ranges::any_of(fHeld, [&](const Kernel& kernel) {
            const Log::Program& program = theLog.programOf(kernel.get());
            return program.text == request.text && program.options == request.options();
        });
        const Kernel kernel = request.send(function);
        fSent.push_back(request);
        require(theLog.read() <= (held ? 0 : 1));
        const bool good = !contains(request.text, "#error") && contains(request.text, function);
        require(good ? kernel.get() || fFails : !kernel.get());
        if (!kernel.get())
            return;
        require(theLog.programOf(kernel.get()).text == request.text);
        require(theLog.programOf(kernel.get()).options == request.options());
        fHeld.push_back(kernel);
    }

    void giveBack()
    {
        if (fHeld.empty())
            return;
        const auto held = fHeld.begin() + fData.ConsumeIntegral<std::uint8_t>() % std::ssize(fHeld);
        require(Request::store().freeKernel(*held) && !Request::store().freeKernel(*held));
        fHeld.erase(held);
    }

    // Requests a kernel of a file from the library.
    void useFile()
    {
        const std::string fileName = name(), function = name();
        File& file = fFiles.try_emplace(fileName, File{fileName}).first->second;
        vyra::LibraryKernel created = fLibrary->create({fileName, function});
        file.requested.insert(function);
        require(created.status.ok() == (created.kernel.get() != nullptr));
        require(contains(file.text, function) ? created.status.ok() || fFails
                                              : !created.status.ok());
        if (!created.status.ok())
            return;
        require(theLog.programOf(created.kernel.get()).text == file.text);
        require(theLog.programOf(created.kernel.get()).options == Request().options());
        file.created.insert(function);
        fOfFiles.push_back(std::move(created.kernel));
    }

    // Every kernel that was created must fit, and one at least of those that were requested.
    void replaceFile()
    {
        scripted::runtime().clearFaults();
        const std::string fileName = name(), text = fData.PickValueInArray(kTexts);
        const auto has = [&](const std::string& function) { return contains(text, function); };
        File& file = fFiles.try_emplace(fileName, File{fileName}).first->second;
        const bool fits = !has("#error") && std::ranges::all_of(file.created, has) &&
                          std::ranges::any_of(file.requested, has);
        const bool accepted = fLibrary->replaceFile(fileName, text).ok();
        fSent.push_back({fileName + ", change " + std::to_string(++fReplaced), text});
        require(accepted == (fits || file.requested.empty()));
        if (!fits)
            return;
        file.text = text;
        std::ranges::copy_if(file.requested, std::inserter(file.created, file.created.end()), has);
    }

    FuzzedDataProvider& fData;
    bool fFails = false; // a call of this step
    std::vector<Request> fSent;
    std::vector<Kernel> fHeld;
    std::vector<vyra::StoreKernel> fOfFiles;
    std::map<std::string, File> fFiles;
    unsigned fReplaced = 0;
    vyra::OpenCLFunctions fFunctions{.clGetKernelInfo = clGetKernelInfo};
    std::optional<vyra::KernelLibrary> fLibrary{std::in_place, fFunctions,
                                                std::vector{directory()}};
};

} // namespace

extern "C" int LLVMFuzzerInitialize(int* /*argumentCount*/, char*** /*arguments*/)
{
    scripted::runtime().describe(scripted::Machine());
    require(TopenCLInfo::initialize(nullptr, nullptr, nullptr, false, false, 0x8086));
    for (const std::string& name : kNames)
        std::ofstream(directory() + "/" + name) << name;
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::vector<std::string> before = scripted::runtime().balance();
    FuzzedDataProvider input(data, size);
    Session(input).run();
    theLog = Log();
    scripted::runtime().takeCalls();
    require(scripted::runtime().balance() == before);
    require(scripted::runtime().takeMisuse().empty());
    scripted::runtime().forgetDead();
    return 0;
}
