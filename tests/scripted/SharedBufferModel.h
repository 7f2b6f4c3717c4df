// A plain model of the shared-buffer manager: what each operation calls, and what is held then.
//
// It knows objects by their names in the runtime's log, and predicts the names of new ones.
#pragma once

#include "ScriptedTest.h"

#include <map>
#include <optional>

namespace scripted {

// How many objects the runtime has made so far.
struct Created {
    unsigned mems = 0;
    unsigned events = 0;
    unsigned syncs = 0;
};

class SharedBufferModel {
public:
    struct Record {
        std::string mem;
        std::uintptr_t handle; // its order among the records
        bool inBatch = false;
        bool acquired = false; // on its own
    };

    SharedBufferModel(int graphicsToCL, int clToGraphics, bool batching, Created& created)
        : fGraphicsToCL(graphicsToCL), fCLToGraphics(clToGraphics), fBatching(batching),
          fCreated(created)
    {
    }

    // The operations. Each returns the calls that it makes. `index` is the place in records(); the
    // events handed over are the test's own.
    Lines create();
    void setHandle(std::uintptr_t handle); // of the record made last
    Lines destroy(std::size_t index);
    Lines destroyBatched(std::size_t index);
    Lines preEvaluate(unsigned id);
    Lines acquire(std::size_t index);
    Lines handOver(const Lines& events);
    Lines releaseAlone(std::size_t index); // with an event, which the test keeps
    Lines postEvaluate();
    Lines renderingComplete();
    Lines waitForFence();
    Lines end(); // the manager's destruction

    // What the last operation returned, or left for the caller.
    int status() const { return fStatus; }
    const std::string& callersEvent() const { return fCallersEvent; }

    const std::vector<Record>& records() const { return fRecords; }
    std::optional<unsigned> openId() const { return fEvaluation; }
    bool anyAcquiredAlone() const;
    // The event at the address that handing over returns.
    const std::string& releaseEvent() const { return fReleaseEvent; }
    // References of every object that the manager or the test's acquires hold.
    const std::map<std::string, int>& references() const { return fReferences; }

    // The test's own references.
    void drop(const std::string& name) { fReferences[name]--; }

private:
    bool explicitFence() const { return fGraphicsToCL == 2; }
    bool syncObjects() const { return fCLToGraphics == 3; }
    std::string newEvent();
    void retain(Lines& lines, const char* kind, const std::string& name);
    void release(Lines& lines, const char* kind, const std::string& name);
    void dropBatch(Lines& lines);
    void rebuild(Lines& lines);
    void graphicsWait(Lines& lines, const std::string& event);
    void append(Lines& lines, const Lines& more) const
    {
        lines.insert(lines.end(), more.begin(), more.end());
    }

    int fGraphicsToCL;
    int fCLToGraphics;
    bool fBatching;
    Created& fCreated;

    std::vector<Record> fRecords; // in the order of their handles
    Lines fBatch;
    Lines fWaitEvents;
    Lines fGraphicsEvents;
    std::optional<unsigned> fEvaluation;
    bool fDirty = false;
    bool fAcquired = false;
    std::string fAcquireEvent = "null";
    std::string fReleaseEvent = "null";
    std::string fFence;
    std::string fNewest;
    std::map<std::string, int> fReferences;
    int fStatus = 0;
    std::string fCallersEvent = "null";
};

} // namespace scripted
