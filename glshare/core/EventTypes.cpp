#include "core/EventTypes.h"

namespace glshare {

EventTypes& EventTypes::get()
{
    static auto* const theTypes = new EventTypes;
    return *theTypes;
}

void EventTypes::add(cl_event event, cl_command_type type)
{
    const std::scoped_lock lock(mutex_);
    entries_.insert_or_assign(event, Entry{type});
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
