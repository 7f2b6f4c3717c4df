#include "core/sharing/EventRegistry.h"

#include <utility>

namespace glshare {

namespace {

// More than the events of sharing commands that an application holds at a time.
constexpr std::size_t kMaxFreeEntries = 64;

} // namespace

EventRegistry& EventRegistry::get()
{
    static auto* const theEvents = new EventRegistry;
    return *theEvents;
}

EventRegistry::PreparedEntry EventRegistry::prepareEntry(cl_command_type type)
{
    PreparedEntry prepared;
    {
        const std::scoped_lock lock(fMutex);
        if (!fFreeEntries.empty())
            prepared = fFreeEntries.extract(fFreeEntries.begin());
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

// The handle may have an entry from an earlier event, whose last release was not counted here.
void EventRegistry::add(cl_event event, PreparedEntry prepared) noexcept
{
    prepared.key() = event;
    GlTaskPtr attached; // disposed of without the lock
    const std::scoped_lock lock(fMutex);
    if (const auto found = fEntries.find(event); found != fEntries.end())
        attached = removeEntry(found);
    fEntries.insert(std::move(prepared));
    fCount = fEntries.size();
}

bool EventRegistry::attach(cl_event event, GlTaskPtr& task) noexcept
{
    const std::scoped_lock lock(fMutex);
    const auto found = fEntries.find(event);
    if (found == fEntries.end())
        return false;
    found->second.attached = std::move(task);
    return true;
}

GlTaskPtr EventRegistry::removeEntry(Entries::iterator entry) noexcept
{
    GlTaskPtr attached = std::move(entry->second.attached);
    if (fFreeEntries.size() < kMaxFreeEntries) {
        PreparedEntry node = fEntries.extract(entry);
        node.key() = nullptr;
        fFreeEntries.insert(std::move(node));
    } else {
        fEntries.erase(entry);
    }
    fCount = fEntries.size();
    return attached;
}

void EventRegistry::retain(cl_event event)
{
    if (fCount == 0)
        return;
    const std::scoped_lock lock(fMutex);
    if (const auto found = fEntries.find(event); found != fEntries.end())
        ++found->second.references;
}

void EventRegistry::release(cl_event event)
{
    if (fCount == 0)
        return;
    GlTaskPtr attached; // disposed of without the lock
    const std::scoped_lock lock(fMutex);
    const auto found = fEntries.find(event);
    if (found != fEntries.end() && --found->second.references == 0)
        attached = removeEntry(found);
}

std::optional<cl_command_type> EventRegistry::findCommandType(cl_event event)
{
    if (fCount == 0)
        return std::nullopt;
    const std::scoped_lock lock(fMutex);
    const auto found = fEntries.find(event);
    return found == fEntries.end() ? std::nullopt : std::optional(found->second.type);
}

} // namespace glshare
