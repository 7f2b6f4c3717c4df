// The kernel store: cache hits, and the release of kernels.
#include "baselines/ThirdPartyBaseline.h"
#include "cases/Cases.h"
#include "diagnostics/AutoCLObject.h"
#include "fixtures/Programs.h"
#include "harness/TwoThreads.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <numeric>
#include <random>
#include <stdexcept>

namespace {

using Kernel = AutoCLObject<cl_kernel>;

TopenCLKernelStore& store()
{
    return TopenCLInfo::theOne().kernelStore();
}

Kernel getKernel(const KernelRequest& request)
{
    return store().getKernel(request.path.c_str(), request.flags.c_str(),
                             KernelRequest::kKernelName, &request.includeDirs);
}

cl_kernel createKernel(cl_program program)
{
    cl_int status = CL_SUCCESS;
    return clCreateKernel(program, KernelRequest::kKernelName, &status);
}

bool sameTexts(const KernelRequest& one, const KernelRequest& other)
{
    bool same = std::strlen(one.path.c_str()) == other.path.size() && one.path == other.path &&
                std::strlen(one.flags.c_str()) == other.flags.size() && one.flags == other.flags &&
                one.includeDirs.length() == other.includeDirs.length();
    for (unsigned int index = 0; same && index < one.includeDirs.length(); ++index)
        same = one.includeDirs[index] == other.includeDirs[index];
    return same;
}

// Programs that stay cached, since one kernel of each is held.
struct CachedPrograms {
    Programs programs;
    std::vector<Kernel> held;
    std::vector<cl_kernel> heldDirectly;
    std::vector<KernelRequest> copies; // of the requests

    CachedPrograms(std::size_t count, Programs::Texts texts)
        : programs(count, texts), copies(programs.requests())
    {
        for (const KernelRequest& request : programs.requests()) {
            held.push_back(getKernel(request));
            if (!held.back().get())
                throw std::runtime_error("the store has no kernel of " + request.path);
        }
        for (cl_program program : programs.built())
            heldDirectly.push_back(createKernel(program));
    }
    ~CachedPrograms()
    {
        for (const Kernel& kernel : held)
            store().freeKernel(kernel);
        for (cl_kernel kernel : heldDirectly)
            clReleaseKernel(kernel);
    }
    CachedPrograms(const CachedPrograms&) = delete;
    CachedPrograms& operator=(const CachedPrograms&) = delete;

    // Gets and frees a kernel of each program in turn.
    void takeTurns(std::size_t count) const
    {
        const auto& requests = programs.requests();
        for (std::size_t index = 0; index < count; ++index)
            store().freeKernel(getKernel(requests[index % requests.size()]));
    }
    // Makes the OpenCL calls of takeTurns() directly.
    void takeTurnsDirectly(std::size_t count) const
    {
        for (std::size_t index = 0; index < count; ++index)
            takeTurnDirectly(index % programs.built().size());
    }
    // The same, with a comparison of every byte of the key: the minimum for a cache, which would
    // have to find the right entry at once.
    void takeTurnsAndCompare(std::size_t count) const
    {
        const auto& requests = programs.requests();
        for (std::size_t index = 0; index < count; ++index) {
            const std::size_t turn = index % requests.size();
            keep(sameTexts(requests[turn], copies[turn]));
            takeTurnDirectly(turn);
        }
    }

private:
    void takeTurnDirectly(std::size_t turn) const
    {
        cl_kernel kernel = createKernel(programs.built()[turn]);
        clRetainKernel(kernel);
        clReleaseKernel(kernel);
        clReleaseKernel(kernel);
    }
};

Group hits(const std::string& name, std::size_t keys, Programs::Texts texts, double limit)
{
    const auto cached = std::make_shared<CachedPrograms>(keys, texts);
    Group group{
        name,
        {{"create, retain, 2 releases",
          [cached](std::size_t count) { return timed([&] { cached->takeTurnsDirectly(count); }); }},
         {"the same, texts compared",
          [cached](std::size_t count) {
              return timed([&] { cached->takeTurnsAndCompare(count); });
          }},
         {"getKernel, freeKernel",
          [cached](std::size_t count) { return timed([&] { cached->takeTurns(count); }); },
          Goal::ratio(limit)}}};
    addThirdPartyBaselines(group, [&](const ThirdPartyBaseline& library) {
        return library.kernelHits(cached->programs);
    });
    return group;
}

// Per call of either thread.
Group hitsOnTwoThreads(const std::string& name)
{
    constexpr double kLimit = 2;
    const auto cached = std::make_shared<CachedPrograms>(1, Programs::Texts::kShort);
    const auto threads = std::make_shared<TwoThreads>();
    return {name,
            {{"one thread",
              [cached](std::size_t count) { return timed([&] { cached->takeTurns(count); }); }},
             {"two threads",
              [cached, threads](std::size_t count) {
                  return threads->timedTogether([&](std::size_t) { cached->takeTurns(count); });
              },
              Goal::ratio(kLimit)},
             {"direct calls, two threads",
              [cached, threads](std::size_t count) {
                  return threads->timedTogether(
                      [&](std::size_t) { cached->takeTurnsDirectly(count); });
              }}},
            true};
}

// A number of kernels in use, of programs that stay cached. Some are freed and replaced by new
// ones, repeatedly and in random order.
class OutstandingKernels {
public:
    static constexpr std::size_t kPrograms = 64;
    static constexpr std::size_t kBatch = 8; // freed in one timed part

    explicit OutstandingKernels(std::size_t count) : fCached(kPrograms, Programs::Texts::kShort)
    {
        for (std::size_t index = 0; index < count; ++index) {
            fKernels.push_back(getKernel(request(index)));
            fDirectly.push_back(createDirectly(index));
        }
        fOrder.resize(count);
        std::iota(fOrder.begin(), fOrder.end(), 0);
        std::shuffle(fOrder.begin(), fOrder.end(), std::mt19937(1));
    }
    ~OutstandingKernels()
    {
        for (const Kernel& kernel : fKernels)
            store().freeKernel(kernel);
        for (cl_kernel kernel : fDirectly) {
            clReleaseKernel(kernel);
            clReleaseKernel(kernel);
        }
    }
    OutstandingKernels(const OutstandingKernels&) = delete;
    OutstandingKernels& operator=(const OutstandingKernels&) = delete;

    Nanoseconds replace()
    {
        const Nanoseconds time = timed([&] {
            for (std::size_t step = 0; step < kBatch; ++step)
                store().freeKernel(fKernels[at(step)]);
        });
        for (std::size_t step = 0; step < kBatch; ++step)
            fKernels[at(step)] = getKernel(request(at(step)));
        fNext += kBatch;
        return time;
    }

    // Of the two references, the timed one is the store's.
    Nanoseconds replaceDirectly()
    {
        const Nanoseconds time = timed([&] {
            for (std::size_t step = 0; step < kBatch; ++step)
                clReleaseKernel(fDirectly[at(step)]);
        });
        for (std::size_t step = 0; step < kBatch; ++step) {
            clReleaseKernel(fDirectly[at(step)]);
            fDirectly[at(step)] = createDirectly(at(step));
        }
        fNext += kBatch;
        return time;
    }

private:
    std::size_t at(std::size_t step) const { return fOrder[(fNext + step) % fOrder.size()]; }
    const KernelRequest& request(std::size_t index) const
    {
        return fCached.programs.requests()[index % kPrograms];
    }
    cl_kernel createDirectly(std::size_t index) const
    {
        cl_kernel kernel = createKernel(fCached.programs.built()[index % kPrograms]);
        clRetainKernel(kernel);
        return kernel;
    }

    CachedPrograms fCached;
    std::vector<Kernel> fKernels;
    std::vector<cl_kernel> fDirectly;
    std::vector<std::size_t> fOrder;
    std::size_t fNext = 0;
};

Group releaseOutstanding(const std::string& name, std::size_t count, Goal goal)
{
    const auto outstanding = std::make_shared<OutstandingKernels>(count);
    const auto repeat = [outstanding](Nanoseconds (OutstandingKernels::*replace)()) {
        return [outstanding, replace](std::size_t iterations) {
            Nanoseconds time{0};
            for (std::size_t index = 0; index < iterations; ++index)
                time += (*outstanding.*replace)();
            return time;
        };
    };
    return {
        name,
        {{"release", repeat(&OutstandingKernels::replaceDirectly), {}, OutstandingKernels::kBatch},
         {"freeKernel", repeat(&OutstandingKernels::replace), goal, OutstandingKernels::kBatch}}};
}

} // namespace

std::vector<GroupFactory> kernelGroups()
{
    constexpr double kOneKey = 1.2;
    constexpr double kManyKeys = 1.35;
    const auto factory = [](const std::string& name, auto make, auto... arguments) {
        return GroupFactory{name, [=] { return make(name, arguments...); }};
    };
    std::vector<GroupFactory> groups{
        factory("getKernel hit, 1 key", hits, 1u, Programs::Texts::kShort, kOneKey),
        factory("getKernel hit, 32 keys, long texts", hits, 32u, Programs::Texts::kLong, kManyKeys),
        factory("getKernel hit, two threads", hitsOnTwoThreads)};
    for (const std::size_t count : {16u, 64u, 256u, 1024u}) {
        const Goal goal = count == 256 ? Goal::extraNanoseconds(1000) : Goal();
        groups.push_back(factory("freeKernel, " + std::to_string(count) + " outstanding",
                                 releaseOutstanding, count, goal));
    }
    return groups;
}
