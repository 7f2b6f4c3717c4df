// The events that glshare has returned to the application, with their command types. The runtime
// created them as markers and user events, and reports those types.
#pragma once

#include "core/api/OpenCl.h"
#include "core/worker/GlTask.h"

#include <atomic>
#include <cstddef>
#include <map>
#include <mutex>
#include <optional>

namespace glshare {

// Holds an entry per event, until the application has released its last reference. It counts the
// application's references itself, since the runtime's count includes those of others. Any thread.
class EventRegistry {
public:
    // Never destroyed: events may be released in exit handlers.
    [[nodiscard]] static EventRegistry& get();

private:
    struct Entry {
        cl_command_type type;
        std::size_t references = 1; // the application's
        GlTaskPtr attached{};       // disposed of with the entry
    };
    using Entries = std::map<cl_event, Entry>;

public:
    // An entry without an event. Creating it may allocate, adding it does not. Entries are reused.
    using PreparedEntry = Entries::node_type;

    [[nodiscard]] PreparedEntry prepareEntry(cl_command_type type);
    void add(cl_event event, PreparedEntry prepared) noexcept;

    // Keeps `task` alive as long as the event's entry. Returns false, and leaves `task` to the
    // caller, if there is none.
    [[nodiscard]] bool attach(cl_event event, GlTaskPtr& task) noexcept;

    // Count the application's references; ignore events without an entry.
    void retain(cl_event event);
    void release(cl_event event);

    // Empty if the event has no entry.
    [[nodiscard]] std::optional<cl_command_type> findCommandType(cl_event event);

private:
    // Called with the lock held. The caller disposes of the result after it has unlocked.
    [[nodiscard]] GlTaskPtr removeEntry(Entries::iterator entry) noexcept;

    std::mutex fMutex; // guards the following
    Entries fEntries;
    std::multimap<cl_event, Entry> fFreeEntries; // all with a null key
    std::atomic<std::size_t> fCount{0};          // of entries; without any, functions need not lock
};

} // namespace glshare
