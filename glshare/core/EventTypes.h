// The command types of the events this program hands out. The runtime made them as markers and user
// events, and would say so.
#pragma once

#include "core/OpenCl.h"

#include <atomic>
#include <cstddef>
#include <map>
#include <mutex>
#include <optional>

namespace glshare {

// Safe from any thread. An event is known from its creation until the application has given back
// its last reference, which is counted here: the runtime's own count has other owners too.
class EventTypes {
public:
    // Never destroyed: events may be released in exit handlers.
    static EventTypes& get();

private:
    struct Entry {
        cl_command_type type;
        std::size_t references = 1; // the application's
    };
    using Entries = std::map<cl_event, Entry>;

public:
    // An entry without its event, made in advance: adding it allocates nothing.
    using Prepared = Entries::node_type;

    [[nodiscard]] static Prepared prepare(cl_command_type type);
    void add(cl_event event, Prepared prepared) noexcept;
    void retain(cl_event event);
    void release(cl_event event);
    [[nodiscard]] std::optional<cl_command_type> find(cl_event event);

private:
    std::mutex mutex_; // guards entries_
    Entries entries_;
    std::atomic<std::size_t> count_{0}; // lets the events of others pass without the lock
};

} // namespace glshare
