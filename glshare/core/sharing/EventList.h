// A list of events that owns a reference to each.
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

    void clear() noexcept
    {
        for (cl_event event : fEvents)
            runtime().clReleaseEvent(event);
        fEvents.clear();
    }

    // Makes space for `count` events: adding them allocates nothing.
    void reserve(std::size_t count) { fEvents.reserve(count); }

    // Makes a call that returns an event: `call` gets where to store it, and answers its status.
    // The event becomes the last of the list if the call succeeds. Throws before the call only.
    template <typename Call>
    cl_int add(Call call)
    {
        fEvents.push_back(nullptr);
        const cl_int error = call(&fEvents.back());
        if (error != CL_SUCCESS)
            fEvents.pop_back();
        return error;
    }

    [[nodiscard]] bool empty() const { return fEvents.empty(); }
    [[nodiscard]] cl_uint size() const { return static_cast<cl_uint>(fEvents.size()); }
    [[nodiscard]] const cl_event* data() const { return fEvents.data(); }
    [[nodiscard]] auto begin() const { return fEvents.begin(); }
    [[nodiscard]] auto end() const { return fEvents.end(); }
    [[nodiscard]] cl_event back() const { return fEvents.back(); }

private:
    std::vector<cl_event> fEvents;
};

} // namespace glshare
