// Fuzzes sequences of requests to the kernel store, with build options, and of kernel files that
// are edited while the viewer runs. Each kernel must come from the program text and the options
// that a model of the rules expects. Some OpenCL calls fail.
#include "FakeRuntime.h"

#include "evaluator/KernelLibrary.h"
#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <iostream>
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
// Texts of programs: '*' stands for an argument of their kernels, "#error" does not build.
const std::string kTexts[] = {"skin(*)", "twist(*)", "skin(*) twist", "skin(**)", "#error skin(*)"};
const std::string kNames[] = {"skin", "twist"}; // of kernels, and of their files
const char kLastOption[] = " -D SupportsDoublePrecision";
const char* const kCalls[] = {"clCreateProgramWithSource", "clBuildProgram", "clCreateKernel"};

void require(bool holds, int line = __builtin_LINE())
{
    if (holds)
        return;
    std::cerr << "The requirement in line " << line << " does not hold.\n";
    std::abort();
}

bool compiles(const std::string& text)
{
    return text.find("#error") == std::string::npos;
}

cl_uint argumentsOf(const std::string& text)
{
    return static_cast<cl_uint>(std::count(text.begin(), text.end(), '*'));
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
            const std::string function = call.substr(0, open - 1);
            const std::string first = call.substr(open, call.find(',') - open);
            const auto made = call.rfind(" = ");
            const std::string result = made == std::string::npos ? "" : call.substr(made + 3);
            if (function == "clCreateProgramWithSource")
                fPrograms[result] = {quoted(call), ""};
            if (function == "clBuildProgram") {
                fPrograms[first].options = quoted(call);
                ++builds;
            }
            if (function == "clCreateKernel")
                fKernels[result] = first;
        }
        return builds;
    }
    const Program& programOf(cl_kernel kernel) const
    {
        return fPrograms.at(fKernels.at(scripted::runtime().name(kernel)));
    }
    void clear()
    {
        fPrograms.clear();
        fKernels.clear();
    }

private:
    // The text between the outermost double quotes.
    static std::string quoted(const std::string& call)
    {
        const auto first = call.find('"') + 1;
        return call.substr(first, call.rfind('"') - first);
    }

    std::map<std::string, Program> fPrograms;
    std::map<std::string, std::string> fKernels; // to their programs
};
Log theLog;

cl_int CL_API_CALL kernelInfo(cl_kernel kernel, cl_kernel_info, std::size_t, void* value,
                              std::size_t*)
{
    theLog.read();
    *static_cast<cl_uint*>(value) = argumentsOf(theLog.programOf(kernel).text);
    return CL_SUCCESS;
}

// A directory with the kernel files.
const std::string& directory()
{
    static const QTemporaryDir folder;
    static const std::string path = folder.path().toStdString();
    return path;
}

struct Request {
    std::string program = "program skin";
    std::string kernel = "skin";
    std::string source = "skin(*)";
    std::optional<std::string> flags = std::nullopt;
    std::vector<std::string> directories{};
};

// The composition of options, written another way than the library's.
std::string expectedOptions(const Request& request)
{
    std::string options =
        request.flags.value_or("-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror");
    for (const std::string& directory : request.directories) {
        const auto first = directory.find_first_not_of(' ');
        const auto last = directory.find_last_not_of(' ');
        const std::string trimmed =
            first == std::string::npos ? "" : directory.substr(first, last - first + 1);
        const char* quote = trimmed.find(' ') == std::string::npos ? "" : "\"";
        options += " -I " + (quote + trimmed) + quote;
    }
    return options + kLastOption;
}

class Session {
public:
    explicit Session(FuzzedDataProvider& data) : fData(data) {}

    void run()
    {
        for (unsigned step = 0; step < kMostSteps && fData.remaining_bytes() > 0; ++step) {
            scripted::runtime().clearFaults();
            theLog.read();
            fFailing = fData.ConsumeIntegralInRange<unsigned>(0, 11);
            if (fails())
                scripted::runtime().plan({.function = kCalls[fFailing]});
            switch (fData.ConsumeIntegralInRange(0, 3)) {
            case 0:
                request();
                break;
            case 1:
                giveBack();
                break;
            case 2:
                useFile();
                break;
            default:
                replaceFile();
                break;
            }
        }
        scripted::runtime().clearFaults();
        while (!fHeld.empty())
            giveBack();
        fLibrary.reset();
        dropPrograms();
    }

private:
    using Key = std::pair<std::string, std::string>; // name and options of a program
    struct Cached {
        std::string text;
        unsigned kernels = 0; // handed out
    };
    struct Held {
        Kernel kernel;
        std::optional<Key> key; // none for a kernel of a file
    };
    struct File {
        std::string text;
        std::set<std::string> functions{}; // that were created

        bool canBecome(const std::string& other) const
        {
            return compiles(other) && argumentsOf(other) == argumentsOf(text) &&
                   std::all_of(functions.begin(), functions.end(), [&](const auto& function) {
                       return other.find(function) != std::string::npos;
                   });
        }
    };

    // An option or a directory: often one of a few, so that requests meet again.
    std::string text()
    {
        if (fData.ConsumeIntegralInRange(0, 3) > 0)
            return fData.PickValueInArray({"-w", "include", " more includes ", "\"quoted\""});
        return fData.ConsumeRandomLengthString(24).c_str(); // up to its first NUL
    }
    std::string name() { return fData.PickValueInArray(kNames); }
    static TopenCLKernelStore& store() { return TopenCLInfo::theOne().kernelStore(); }
    bool fails(unsigned call) const { return fFailing == call; }
    bool fails() const { return fFailing < std::size(kCalls); }
    // What the library requests for a program.
    static Request ofLibrary(const std::string& program)
    {
        return {program, "", "", "-cl-no-signed-zeros -Werror", {directory()}};
    }

    // Changes one part of the last request, so that requests meet again.
    void changeRequest()
    {
        switch (fData.ConsumeIntegralInRange(0, 5)) {
        case 0:
            fRequest.program = "program " + name();
            break;
        case 1:
            fRequest.kernel = name();
            break;
        case 2:
            fRequest.source = fData.PickValueInArray(kTexts);
            break;
        case 3:
            fRequest.flags = fData.ConsumeBool() ? std::optional(text()) : std::nullopt;
            break;
        case 4:
            fRequest.directories.push_back(text());
            break;
        default:
            if (!fRequest.directories.empty())
                fRequest.directories.pop_back();
        }
    }

    static Kernel send(const Request& request)
    {
        TstringArray directories;
        for (const std::string& directory : request.directories)
            directories.append(Tstring(directory.c_str()));
        return store().getKernelFromString(request.source.c_str(), request.program.c_str(),
                                           request.flags ? request.flags->c_str() : nullptr,
                                           request.kernel.c_str(),
                                           request.directories.empty() ? nullptr : &directories);
    }

    void request()
    {
        changeRequest();
        const Request& request = fRequest;
        const Key key{request.program, expectedOptions(request)};
        const Kernel kernel = send(request);
        const bool cached = fCached.contains(key);
        require(theLog.read() == (cached || fails(0) ? 0 : 1));
        if (!cached && compiles(request.source) && !fails(0) && !fails(1))
            fCached[key].text = request.source;
        const auto entry = fCached.find(key);
        const bool served = entry != fCached.end() && !fails(2) &&
                            entry->second.text.find(request.kernel) != std::string::npos;
        require(served == (kernel.get() != nullptr));
        if (!served)
            return;
        require(theLog.programOf(kernel.get()).text == entry->second.text);
        require(theLog.programOf(kernel.get()).options == key.second);
        ++entry->second.kernels;
        fHeld.push_back({kernel, key});
    }

    void giveBack()
    {
        if (fHeld.empty())
            return;
        const auto held = fHeld.begin() + fData.ConsumeIntegralInRange<int>(0, 255) %
                                              static_cast<int>(fHeld.size());
        require(store().freeKernel(held->kernel) && !store().freeKernel(held->kernel));
        if (held->key && --fCached.at(*held->key).kernels == 0)
            fCached.erase(*held->key);
        fHeld.erase(held);
    }

    // Requests a kernel of a file from the library.
    void useFile()
    {
        const std::string fileName = name(), function = name();
        File& file = fFiles.try_emplace(fileName, File{fileName + "(*)"}).first->second;
        const vyra::LibraryKernel created = fLibrary->create({fileName, function});
        const bool served = file.text.find(function) != std::string::npos;
        require(created.status.ok() == (created.kernel.get() != nullptr));
        require(created.status.ok() == served || (served && fails()));
        if (!created.status.ok())
            return;
        theLog.read();
        const Log::Program& program = theLog.programOf(created.kernel.get());
        require(program.text == file.text && program.options == expectedOptions(ofLibrary("")));
        file.functions.insert(function);
        fHeld.push_back({created.kernel, std::nullopt});
    }

    void replaceFile()
    {
        const std::string fileName = name(), text = fData.PickValueInArray(kTexts);
        const bool accepted = fLibrary->replaceFile(fileName, text).ok();
        fReplaced.push_back(fileName + ", change " + std::to_string(fReplaced.size() + 1));
        const auto file = fFiles.find(fileName);
        const bool used = file != fFiles.end() && !file->second.functions.empty();
        const bool good = !used || file->second.canBecome(text);
        require(accepted == good || (good && fails()));
        if (accepted && used)
            file->second.text = text;
    }

    // A program that no kernel could be made of stays in the store until one is given back; every
    // text has the kernel of the empty name.
    void dropPrograms()
    {
        const auto drop = [](const Request& request) {
            require(store().freeKernel(send(request)));
        };
        for (const auto& [key, cached] : fCached)
            drop({key.first, "", "", key.second.substr(0, key.second.rfind(kLastOption))});
        for (const std::string& program : fReplaced)
            drop(ofLibrary(program));
        for (const std::string& fileName : kNames)
            drop(ofLibrary(directory() + "/" + fileName));
    }

    FuzzedDataProvider& fData;
    unsigned fFailing = 0; // the next call of this index in kCalls
    Request fRequest;
    std::vector<Held> fHeld;
    std::map<Key, Cached> fCached;
    std::map<std::string, File> fFiles;
    std::vector<std::string> fReplaced;
    vyra::OpenCLFunctions fFunctions{.clGetKernelInfo = kernelInfo};
    std::optional<vyra::KernelLibrary> fLibrary{std::in_place, fFunctions,
                                                std::vector{directory()}};
};

} // namespace

extern "C" int LLVMFuzzerInitialize(int* /*argumentCount*/, char*** /*arguments*/)
{
    scripted::runtime().describe(scripted::World());
    require(TopenCLInfo::initialize(nullptr, nullptr, nullptr, false, false, 0x8086));
    for (const std::string& name : kNames)
        std::ofstream(directory() + "/" + name) << name << "(*)";
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::vector<std::string> before = scripted::runtime().balance();
    FuzzedDataProvider input(data, size);
    Session(input).run();
    theLog.read();
    require(scripted::runtime().balance() == before);
    require(scripted::runtime().takeMisuse().empty());
    theLog.clear();
    scripted::runtime().forgetDead();
    return 0;
}
