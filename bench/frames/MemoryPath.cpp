#include "frames/Path.h"

#include <algorithm>
#include <vector>

#include <tbb/blocked_range.h>
#include <tbb/parallel_for.h>

namespace {

constexpr std::size_t kFloatsPerVertex = 6; // position and normal
constexpr std::size_t kGrain = 16384;       // floats per task

class MemoryPath : public Path {
public:
    MemoryPath(std::size_t vertexCount, bool onAllCores)
        : fFloats(vertexCount * kFloatsPerVertex), fOnAllCores(onAllCores)
    {
    }

    void deform() override
    {
        fValue += 1; // different bytes in each frame
        const auto write = [this](std::size_t begin, std::size_t end) {
            std::fill(fFloats.data() + begin, fFloats.data() + end, fValue);
        };
        using Range = tbb::blocked_range<std::size_t>;
        if (fOnAllCores)
            tbb::parallel_for(Range(0, fFloats.size(), kGrain),
                              [&](const Range& range) { write(range.begin(), range.end()); });
        else
            write(0, fFloats.size());
    }

private:
    std::vector<float> fFloats;
    float fValue = 0;
    bool fOnAllCores;
};

} // namespace

std::unique_ptr<Path> makeMemoryPath(std::size_t vertexCount, bool onAllCores)
{
    return std::make_unique<MemoryPath>(vertexCount, onAllCores);
}
