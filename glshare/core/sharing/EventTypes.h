// The command types of the events this program hands out. The runtime made them as markers and user
// events, and would say so.
#pragma once

#include "core/api/OpenCl.h"
#include "core/worker/GlTask.h"

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
        GlTaskPtr kept{};           // as long as the entry
    };
    using Entries = std::map<cl_event, Entry>;

public:
    // An entry without its event, made in advance: adding it allocates nothing. Entries are used
    // again, so that preparing one seldom does.
    using Prepared = Entries::node_type;

    [[nodiscard]] Prepared prepare(cl_command_type type);
    void add(cl_event event, Prepared prepared) noexcept;

    // Takes `task`, to drop it when the event is no longer known; false if it is not now.
    bool keep(cl_event event, GlTaskPtr& task) noexcept;

    void retain(cl_event event);
    void release(cl_event event);
    [[nodiscard]] std::optional<cl_command_type> find(cl_event event);

private:
    // Forgets an entry, with the lock held; the result is dropped without it.
    [[nodiscard]] GlTaskPtr retire(Entries::iterator entry) noexcept;

    std::mutex fMutex; // guards the following
    Entries fEntries;
    std::multimap<cl_event, Entry> fSpares; // all with the key null
    std::atomic<std::size_t> fCount{0};     // lets the events of others pass without the lock
};

} // namespace glshare
