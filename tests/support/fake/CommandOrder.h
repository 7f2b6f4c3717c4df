// The order of enqueued commands, and which of them are not complete.
#pragma once

#include <map>
#include <set>
#include <vector>

namespace scripted {

// Queues are in order. A command comes after another one if it is later on the same queue, if its
// wait list contains it, directly or through other commands, or if the host had seen the other one
// complete when it was enqueued.
class CommandOrder {
public:
    struct Command {
        const void* queue = nullptr;
        std::map<const void*, unsigned> after; // by queue: the last command that comes before
        std::vector<const void*> mems;         // memory objects that it uses
    };

    // Commands that are added while `hold` is true complete when the host waits for them, or with
    // completeAll. Others are complete at once, though the host has not seen it.
    void hold(bool hold) { fHold = hold; }

    // Returns a command on `queue` after these commands.
    Command next(const void* queue, const std::vector<unsigned>& waits) const;
    // Adds it, and returns its number, counted from 1.
    unsigned add(Command command);
    bool precedes(unsigned first, const Command& second) const;

    // Records that the host has seen a command, and all before it, complete; 0 is none.
    void observe(unsigned number);
    void observeQueue(const void* queue);
    void completeAll() { fPending.clear(); }
    // Removes a queue; its commands count as complete.
    void forget(const void* queue);

    bool isPending(unsigned number) const { return fPending.contains(number); }
    // Returns whether an incomplete command uses a memory object.
    bool isInUse(const void* mem) const;

private:
    const Command& command(unsigned number) const { return fCommands[number - 1]; }
    void merge(std::map<const void*, unsigned>& after, unsigned number) const;

    bool fHold = false;
    std::vector<Command> fCommands;              // by number
    std::set<unsigned> fPending;                 // numbers
    std::map<const void*, unsigned> fLast;       // by queue
    std::set<const void*> fGone;                 // queues
    std::map<const void*, unsigned> fSeenByHost; // by queue: the last that the host saw complete
};

} // namespace scripted
