// Replaces oneTBB, which is not built for ThreadSanitizer: its synchronisation would be reported as
// races.
#pragma once

#include <atomic>
#include <cstddef>

namespace tbb {

class global_control {
public:
    enum parameter { max_allowed_parallelism };

    global_control(parameter /*which*/, std::size_t value) { threads() = value; }
    ~global_control() { threads() = kThreads; }

    // That parallel_for starts.
    static std::atomic<std::size_t>& threads()
    {
        static std::atomic<std::size_t> theThreads = kThreads;
        return theThreads;
    }

private:
    static constexpr std::size_t kThreads = 4;
};

} // namespace tbb
