// Replaces oneTBB: see global_control.h.
#pragma once

namespace tbb {

class task_arena {
public:
    void initialize() {}
    int max_concurrency() const { return 4; }
    template <typename Function>
    void execute(const Function& function)
    {
        function();
    }
};

namespace this_task_arena {

template <typename Function>
void isolate(const Function& function)
{
    function();
}

} // namespace this_task_arena
} // namespace tbb
