// A list of events that owns a reference to each. Not synchronised.
#pragma once

#include "core/api/OpenCl.h"

#include <cstddef>
#include <vector>

namespace glshare {

class EventList {
public:
    EventList() = default;

    ~EventList() { clear(); }

    EventList(const EventList&) = delete;
    EventList& operator=(const EventList&) = delete;

    // Releases the events.
    void clear() noexcept
    {
        for (cl_event event : fEvents)
            runtime().clReleaseEvent(event);
        fEvents.clear();
    }

    // Allocates capacity for `count` events.
    void reserve(std::size_t count) { fEvents.reserve(count); }

    // Calls `call` with the place for a new event and returns its status. On success the event is
    // appended. Throws std::bad_alloc, before the call only.
    template <typename Call>
    [[nodiscard]] cl_int add(Call call)
    {
        fEvents.push_back(nullptr);
        const cl_int error = call(&fEvents.back());
        if (error != CL_SUCCESS)
            fEvents.pop_back();
        return error;
    }

    [[nodiscard]] bool empty() const noexcept { return fEvents.empty(); }
    [[nodiscard]] cl_uint size() const noexcept { return static_cast<cl_uint>(fEvents.size()); }
    [[nodiscard]] const cl_event* data() const noexcept { return fEvents.data(); }
    [[nodiscard]] auto begin() const noexcept { return fEvents.begin(); }
    [[nodiscard]] auto end() const noexcept { return fEvents.end(); }
    [[nodiscard]] cl_event back() const noexcept { return fEvents.back(); }

private:
    std::vector<cl_event> fEvents;
};

} // namespace glshare
