// A list of events that owns a reference to each.
#pragma once

#include "core/OpenCl.h"

#include <vector>

namespace glshare {

class EventList {
public:
    EventList() = default;

    ~EventList()
    {
        for (cl_event event : events_)
            runtime().clReleaseEvent(event);
    }

    EventList(const EventList&) = delete;
    EventList& operator=(const EventList&) = delete;

    // Makes a call that returns an event: `call` gets where to store it, and answers its status.
    // The event becomes the last of the list if the call succeeds.
    template <typename Call>
    cl_int add(Call call)
    {
        cl_event event = nullptr;
        const cl_int error = call(&event);
        if (error == CL_SUCCESS)
            events_.push_back(event);
        return error;
    }

    [[nodiscard]] bool empty() const { return events_.empty(); }
    [[nodiscard]] cl_uint size() const { return static_cast<cl_uint>(events_.size()); }
    [[nodiscard]] const cl_event* data() const { return events_.data(); }
    [[nodiscard]] cl_event back() const { return events_.back(); }

private:
    std::vector<cl_event> events_;
};

} // namespace glshare
