#include "fake/CommandOrder.h"

#include <algorithm>
#include <utility>

namespace scripted {

// Adds a command, and all commands before it, to the commands before another one.
void CommandOrder::merge(std::map<const void*, unsigned>& after, unsigned number) const
{
    if (number == 0)
        return;
    const Command& earlier = command(number);
    for (const auto& [queue, last] : earlier.after)
        after[queue] = std::max(after[queue], last);
    after[earlier.queue] = std::max(after[earlier.queue], number);
}

CommandOrder::Command CommandOrder::next(const void* queue,
                                         const std::vector<unsigned>& waits) const
{
    Command command{.queue = queue, .after = fSeenByHost, .mems = {}};
    if (const auto last = fLast.find(queue); last != fLast.end())
        merge(command.after, last->second);
    for (const unsigned wait : waits)
        merge(command.after, wait);
    return command;
}

unsigned CommandOrder::add(Command command)
{
    fCommands.push_back(std::move(command));
    const auto number = static_cast<unsigned>(fCommands.size());
    fLast[fCommands.back().queue] = number;
    if (fHold)
        fPending.insert(number);
    return number;
}

bool CommandOrder::precedes(unsigned first, const Command& second) const
{
    if (first == 0 || fGone.contains(command(first).queue))
        return true;
    const auto last = second.after.find(command(first).queue);
    return last != second.after.end() && last->second >= first;
}

void CommandOrder::observe(unsigned number)
{
    merge(fSeenByHost, number);
    std::erase_if(fPending, [this](unsigned pending) {
        const auto seen = fSeenByHost.find(command(pending).queue);
        return seen != fSeenByHost.end() && seen->second >= pending;
    });
}

void CommandOrder::observeQueue(const void* queue)
{
    if (const auto last = fLast.find(queue); last != fLast.end())
        observe(last->second);
}

void CommandOrder::forget(const void* queue)
{
    fGone.insert(queue);
    fLast.erase(queue);
    fSeenByHost.erase(queue);
    for (const auto& [other, last] : fLast)
        fCommands[last - 1].after.erase(queue);
}

bool CommandOrder::isInUse(const void* mem) const
{
    return std::ranges::any_of(fPending, [&](unsigned number) {
        return std::ranges::find(command(number).mems, mem) != command(number).mems.end();
    });
}

} // namespace scripted
