// A list of events that owns a reference to each.
#pragma once

#include "core/OpenCl.h"

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
        for (cl_event event : events_)
            runtime().clReleaseEvent(event);
        events_.clear();
    }

    // Makes space for `count` events: adding them allocates nothing.
    void reserve(std::size_t count) { events_.reserve(count); }

    // Makes a call that returns an event: `call` gets where to store it, and answers its status.
    // The event becomes the last of the list if the call succeeds. Throws before the call only.
    template <typename Call>
    cl_int add(Call call)
    {
        events_.push_back(nullptr);
        const cl_int error = call(&events_.back());
        if (error != CL_SUCCESS)
            events_.pop_back();
        return error;
    }

    [[nodiscard]] bool empty() const { return events_.empty(); }
    [[nodiscard]] cl_uint size() const { return static_cast<cl_uint>(events_.size()); }
    [[nodiscard]] const cl_event* data() const { return events_.data(); }
    [[nodiscard]] auto begin() const { return events_.begin(); }
    [[nodiscard]] auto end() const { return events_.end(); }
    [[nodiscard]] cl_event back() const { return events_.back(); }

private:
    std::vector<cl_event> events_;
};

} // namespace glshare
