#include "core/EventTypes.h"

#include <utility>

namespace glshare {

EventTypes& EventTypes::get()
{
    static auto* const theTypes = new EventTypes;
    return *theTypes;
}

EventTypes::Prepared EventTypes::prepare(cl_command_type type)
{
    Entries entries;
    entries.emplace(nullptr, Entry{type});
    return entries.extract(entries.begin());
}

// The handle may have been another event's, whose end was not seen here.
void EventTypes::add(cl_event event, Prepared prepared) noexcept
{
    prepared.key() = event;
    const std::scoped_lock lock(mutex_);
    entries_.erase(event);
    entries_.insert(std::move(prepared));
    count_ = entries_.size();
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
    const std::scoped_lock lock(mutex_);
    const auto found = entries_.find(event);
    if (found == entries_.end() || --found->second.references > 0)
        return;
    entries_.erase(found);
    count_ = entries_.size();
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
