// The data map relative to the concurrent map that it uses.
#include "buffers/TopenCLData.h"
#include "cases/Cases.h"
#include "fixtures/Runtime.h"
#include "harness/TwoThreads.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <memory>
#include <random>

namespace {

using Key = TopenCLData::Key;

// The concurrent map with the same key and hash, and a value of one word.
class PlainMap {
public:
    void set(const Key& key)
    {
        const auto [entry, inserted] = fMap.emplace(key, 1);
        if (!inserted)
            entry->second = 1;
    }
    void get(const Key& key) const
    {
        const auto entry = fMap.find(key);
        keep(entry == fMap.end() ? 0 : entry->second);
    }

private:
    tbb::concurrent_unordered_map<Key, std::uintptr_t, TopenCLData::KeyHash, std::equal_to<Key>,
                                  tbb::tbb_allocator<std::pair<const Key, std::uintptr_t>>>
        fMap;
};

// Returns one buffer for all entries: with memory and without an event, like those of the pool.
const TopenCLDataBuffer& sharedBuffer()
{
    static const TopenCLDataBuffer theBuffer = [] {
        cl_int status = CL_SUCCESS;
        AutoCLObject<cl_mem> memory;
        memory.adopt(clCreateBuffer(Runtime::context(), CL_MEM_READ_WRITE, 16, nullptr, &status));
        TopenCLDataBuffer buffer;
        buffer.setBuffer(memory, 16);
        return buffer;
    }();
    return theBuffer;
}

class LibraryMap {
public:
    void set(const Key& key) { fData.setData(key.first, key.second, sharedBuffer()); }
    void get(const Key& key) const { keep(fData.getData(key.first, key.second)); }

private:
    TopenCLData fData;
};

// Returns one key per name and plug, in random order.
std::vector<Key> makeKeys(std::size_t count)
{
    const std::array names{TopenCLData::sPositionsName(), TopenCLData::sNormalsName(),
                           TopenCLData::sGeometryMatrixName(),
                           TopenCLData::sInverseGeometryMatrixName()};
    std::vector<Key> keys;
    for (std::size_t index = 0; index < count; ++index)
        keys.emplace_back(names[index % names.size()], Tplug(index / names.size(), 7));
    std::shuffle(keys.begin(), keys.end(), std::mt19937(1));
    return keys;
}

struct Workload {
    std::vector<Key> keys;
    std::size_t threads = 1;
    std::unique_ptr<TwoThreads> pair; // null for one thread

    // Calls `use` for every key; each of two threads handles one half.
    template <typename Use>
    Nanoseconds forEach(const Use& use) const
    {
        const auto share = [&](std::size_t thread) {
            const std::size_t each = keys.size() / threads;
            for (std::size_t index = thread * each; index < (thread + 1) * each; ++index)
                use(keys[index]);
        };
        return pair ? pair->timedTogether(share) : timed([&] { share(0); });
    }
};

using WorkloadPointer = std::shared_ptr<const Workload>;

template <typename Map>
Body getting(const WorkloadPointer& workload)
{
    const auto map = std::make_shared<Map>();
    for (const Key& key : workload->keys)
        map->set(key);
    return [=](std::size_t sweeps) {
        Nanoseconds time{0};
        for (std::size_t sweep = 0; sweep < sweeps; ++sweep)
            time += workload->forEach([&](const Key& key) { map->get(key); });
        return time;
    };
}

template <typename Map>
Body settingNew(const WorkloadPointer& workload)
{
    return [=](std::size_t sweeps) {
        Nanoseconds time{0};
        for (std::size_t sweep = 0; sweep < sweeps; ++sweep) {
            Map map;
            time += workload->forEach([&](const Key& key) { map.set(key); });
        }
        return time;
    };
}

template <typename Map>
Body settingAgain(const WorkloadPointer& workload)
{
    const auto map = std::make_shared<Map>();
    for (const Key& key : workload->keys)
        map->set(key);
    return [=](std::size_t sweeps) {
        Nanoseconds time{0};
        for (std::size_t sweep = 0; sweep < sweeps; ++sweep)
            time += workload->forEach([&](const Key& key) { map->set(key); });
        return time;
    };
}

// One operation of both maps.
struct Operation {
    const char* name;
    Body (*plain)(const WorkloadPointer&);
    Body (*library)(const WorkloadPointer&);
    Goal goal;
};

std::string nameOf(const Operation& operation, std::size_t entries, std::size_t threads)
{
    return std::string(operation.name) + ", " + std::to_string(entries) + " entries, " +
           std::to_string(threads) + (threads == 1 ? " thread" : " threads");
}

Group mapGroup(const Operation& operation, std::size_t entries, std::size_t threads)
{
    auto pair = threads == 2 ? std::make_unique<TwoThreads>() : nullptr;
    const auto workload =
        std::make_shared<Workload>(Workload{makeKeys(entries), threads, std::move(pair)});
    const auto perEntry = static_cast<double>(entries);
    return {nameOf(operation, entries, threads),
            {{"TBB map", operation.plain(workload), {}, perEntry},
             {"TopenCLData", operation.library(workload), operation.goal, perEntry}},
            threads > 1};
}

} // namespace

std::vector<GroupFactory> dataMapGroups()
{
    constexpr double kGetLimit = 1.3;
    const std::array operations{
        Operation{"getData", getting<PlainMap>, getting<LibraryMap>, Goal::ratio(kGetLimit)},
        Operation{"setData, new", settingNew<PlainMap>, settingNew<LibraryMap>, {}},
        Operation{"setData, again", settingAgain<PlainMap>, settingAgain<LibraryMap>, {}}};

    std::vector<GroupFactory> groups;
    for (const Operation& operation : operations) {
        for (const std::size_t entries : {256u, 4096u, 65536u}) {
            for (const std::size_t threads : {1u, 2u})
                groups.push_back({nameOf(operation, entries, threads),
                                  [=] { return mapGroup(operation, entries, threads); }});
        }
    }
    return groups;
}
