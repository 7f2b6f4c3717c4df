#include "core/EventTypes.h"

#include <utility>

namespace glshare {

namespace {

// More than a program holds events of sharing commands.
constexpr std::size_t kSpares = 64;

} // namespace

EventTypes& EventTypes::get()
{
    static auto* const theTypes = new EventTypes;
    return *theTypes;
}

EventTypes::Prepared EventTypes::prepare(cl_command_type type)
{
    Prepared prepared;
    {
        const std::scoped_lock lock(mutex_);
        if (!spares_.empty())
            prepared = spares_.extract(spares_.begin());
    }
    if (prepared.empty()) {
        Entries entries;
        entries.emplace(nullptr, Entry{});
        prepared = entries.extract(entries.begin());
    }
    prepared.mapped().type = type;
    prepared.mapped().references = 1;
    return prepared;
}

// The handle may have been another event's, whose end was not seen here.
void EventTypes::add(cl_event event, Prepared prepared) noexcept
{
    prepared.key() = event;
    GlTaskPtr kept; // dropped without the lock
    const std::scoped_lock lock(mutex_);
    if (const auto found = entries_.find(event); found != entries_.end())
        kept = retire(found);
    entries_.insert(std::move(prepared));
    count_ = entries_.size();
}

bool EventTypes::keep(cl_event event, GlTaskPtr& task) noexcept
{
    const std::scoped_lock lock(mutex_);
    const auto found = entries_.find(event);
    if (found == entries_.end())
        return false;
    found->second.kept = std::move(task);
    return true;
}

GlTaskPtr EventTypes::retire(Entries::iterator entry) noexcept
{
    GlTaskPtr kept = std::move(entry->second.kept);
    if (spares_.size() < kSpares) {
        Prepared node = entries_.extract(entry);
        node.key() = nullptr;
        spares_.insert(std::move(node));
    } else {
        entries_.erase(entry);
    }
    count_ = entries_.size();
    return kept;
}

void EventTypes::retain(cl_event event)
{
    if (count_ == 0)
        return;
    const std::scoped_lock lock(mutex_);
    if (const auto found = entries_.find(event); found != entries_.end())
        ++found->second.references;
}

void EventTypes::release(cl_event event)
{
    if (count_ == 0)
        return;
    GlTaskPtr kept; // dropped without the lock
    const std::scoped_lock lock(mutex_);
    const auto found = entries_.find(event);
    if (found != entries_.end() && --found->second.references == 0)
        kept = retire(found);
}

std::optional<cl_command_type> EventTypes::find(cl_event event)
{
    if (count_ == 0)
        return std::nullopt;
    const std::scoped_lock lock(mutex_);
    const auto found = entries_.find(event);
    return found == entries_.end() ? std::nullopt : std::optional(found->second.type);
}

} // namespace glshare
