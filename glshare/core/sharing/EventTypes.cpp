#include "core/sharing/EventTypes.h"

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
        const std::scoped_lock lock(fMutex);
        if (!fSpares.empty())
            prepared = fSpares.extract(fSpares.begin());
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
    const std::scoped_lock lock(fMutex);
    if (const auto found = fEntries.find(event); found != fEntries.end())
        kept = retire(found);
    fEntries.insert(std::move(prepared));
    fCount = fEntries.size();
}

bool EventTypes::keep(cl_event event, GlTaskPtr& task) noexcept
{
    const std::scoped_lock lock(fMutex);
    const auto found = fEntries.find(event);
    if (found == fEntries.end())
        return false;
    found->second.kept = std::move(task);
    return true;
}

GlTaskPtr EventTypes::retire(Entries::iterator entry) noexcept
{
    GlTaskPtr kept = std::move(entry->second.kept);
    if (fSpares.size() < kSpares) {
        Prepared node = fEntries.extract(entry);
        node.key() = nullptr;
        fSpares.insert(std::move(node));
    } else {
        fEntries.erase(entry);
    }
    fCount = fEntries.size();
    return kept;
}

void EventTypes::retain(cl_event event)
{
    if (fCount == 0)
        return;
    const std::scoped_lock lock(fMutex);
    if (const auto found = fEntries.find(event); found != fEntries.end())
        ++found->second.references;
}

void EventTypes::release(cl_event event)
{
    if (fCount == 0)
        return;
    GlTaskPtr kept; // dropped without the lock
    const std::scoped_lock lock(fMutex);
    const auto found = fEntries.find(event);
    if (found != fEntries.end() && --found->second.references == 0)
        kept = retire(found);
}

std::optional<cl_command_type> EventTypes::find(cl_event event)
{
    if (fCount == 0)
        return std::nullopt;
    const std::scoped_lock lock(fMutex);
    const auto found = fEntries.find(event);
    return found == fEntries.end() ? std::nullopt : std::optional(found->second.type);
}

} // namespace glshare
