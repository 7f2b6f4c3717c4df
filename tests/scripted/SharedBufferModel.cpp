#include "SharedBufferModel.h"

#include <algorithm>

namespace scripted {
namespace {

std::string bracketed(const Lines& names)
{
    std::string text;
    for (const std::string& name : names)
        text += (text.empty() ? "" : ", ") + name;
    return '[' + text + ']';
}

} // namespace

std::string SharedBufferModel::newEvent()
{
    std::string name = "event#" + std::to_string(++fCreated.events);
    fReferences[name] = 1;
    return name;
}

void SharedBufferModel::retain(Lines& lines, const char* kind, const std::string& name)
{
    lines.push_back(std::string("clRetain") + kind + '(' + name + ')');
    ++fReferences[name];
}

void SharedBufferModel::release(Lines& lines, const char* kind, const std::string& name)
{
    if (name == "null")
        return;
    lines.push_back(std::string("clRelease") + kind + '(' + name + ')');
    --fReferences[name];
}

Lines SharedBufferModel::create()
{
    fNewest = "mem#" + std::to_string(++fCreated.mems);
    fReferences[fNewest] = 1;
    fDirty = true;
    return {"clCreateFromGLBuffer(context#1, 1, 7) = " + fNewest};
}

void SharedBufferModel::setHandle(std::uintptr_t handle)
{
    const auto place = std::ranges::upper_bound(fRecords, handle, {}, &Record::handle);
    fRecords.insert(place, {.mem = fNewest, .handle = handle});
}

void SharedBufferModel::dropBatch(Lines& lines)
{
    for (const std::string& mem : fBatch)
        release(lines, "MemObject", mem);
    fBatch.clear();
}

Lines SharedBufferModel::destroy(std::size_t index)
{
    Lines lines;
    fStatus = 0;
    if (fRecords[index].inBatch && fAcquired) {
        fStatus = CL_INVALID_VALUE;
    } else if (fRecords[index].inBatch) {
        if (fReleaseEvent != "null")
            lines.push_back("clWaitForEvents([" + fReleaseEvent + "])");
        dropBatch(lines);
        for (Record& record : fRecords)
            record.inBatch = false;
    }
    release(lines, "MemObject", fRecords[index].mem);
    fRecords.erase(fRecords.begin() + static_cast<std::ptrdiff_t>(index));
    fDirty = true;
    return lines;
}

Lines SharedBufferModel::destroyBatched(std::size_t index)
{
    Lines lines;
    fStatus = 0;
    const std::string mem = fRecords[index].mem;
    const auto member = std::find(fBatch.begin(), fBatch.end(), mem);
    if (fRecords[index].inBatch && member != fBatch.end()) {
        if (fAcquired) {
            const std::string event = newEvent();
            lines.push_back("clEnqueueReleaseGLObjects(queue#1, [" + mem + "], " +
                            bracketed(fWaitEvents) + ") = " + event);
            lines.push_back("clWaitForEvents([" + event + "])");
            release(lines, "Event", event);
        }
        fBatch.erase(member);
        release(lines, "MemObject", mem);
    }
    release(lines, "MemObject", mem);
    fRecords.erase(fRecords.begin() + static_cast<std::ptrdiff_t>(index));
    return lines;
}

void SharedBufferModel::rebuild(Lines& lines)
{
    dropBatch(lines);
    for (Record& record : fRecords) {
        retain(lines, "MemObject", record.mem);
        fBatch.push_back(record.mem);
        record.inBatch = true;
    }
    fDirty = false;
}

Lines SharedBufferModel::waitForFence()
{
    Lines lines{"resourceWindow()"};
    if (!fFence.empty()) {
        lines.push_back("glClientWaitSync(" + fFence + ", 1, 1000000000)");
        lines.push_back("glDeleteSync(" + fFence + ")");
        fReferences[fFence] = 0;
        fFence.clear();
    }
    return lines;
}

Lines SharedBufferModel::preEvaluate(unsigned id)
{
    Lines lines;
    if (!fBatching || fEvaluation == id)
        return lines;
    if (fDirty)
        rebuild(lines);
    fEvaluation = id;
    release(lines, "Event", fReleaseEvent);
    fReleaseEvent = "null";
    if (fBatch.empty())
        return lines;
    fAcquired = true;
    if (explicitFence())
        append(lines, waitForFence());
    release(lines, "Event", fAcquireEvent);
    fAcquireEvent = newEvent();
    lines.push_back("clEnqueueAcquireGLObjects(queue#1, " + bracketed(fBatch) +
                    ", []) = " + fAcquireEvent);
    fWaitEvents.push_back(fAcquireEvent);
    retain(lines, "Event", fAcquireEvent);
    return lines;
}

Lines SharedBufferModel::acquire(std::size_t index)
{
    Lines lines;
    fStatus = 0;
    Record& record = fRecords[index];
    if (record.inBatch) {
        fCallersEvent = fAcquireEvent;
        if (fAcquireEvent != "null")
            retain(lines, "Event", fAcquireEvent);
        return lines;
    }
    if (explicitFence())
        lines = waitForFence();
    fCallersEvent = newEvent();
    record.acquired = true;
    lines.push_back("clEnqueueAcquireGLObjects(queue#1, [" + record.mem +
                    "], []) = " + fCallersEvent);
    return lines;
}

Lines SharedBufferModel::handOver(const Lines& events)
{
    Lines lines;
    if (!fBatching)
        return lines;
    for (const std::string& event : events)
        retain(lines, "Event", event);
    append(fWaitEvents, events);
    return lines;
}

Lines SharedBufferModel::releaseAlone(std::size_t index)
{
    fRecords[index].acquired = false;
    fStatus = 0;
    fCallersEvent = newEvent();
    if (fBatching && syncObjects())
        fGraphicsEvents.push_back(fCallersEvent);
    return {"clEnqueueReleaseGLObjects(queue#1, [" + fRecords[index].mem +
            "], []) = " + fCallersEvent};
}

void SharedBufferModel::graphicsWait(Lines& lines, const std::string& event)
{
    const std::string sync = "sync#" + std::to_string(++fCreated.syncs);
    lines.push_back("glCreateSyncFromCLeventARB(context#1, " + event + ", 0) = " + sync);
    lines.push_back("glWaitSync(" + sync + ", 0, 18446744073709551615)");
    lines.push_back("glDeleteSync(" + sync + ")");
}

Lines SharedBufferModel::postEvaluate()
{
    Lines lines;
    if (!fBatching)
        return lines;
    fEvaluation.reset();
    if (fAcquired && !fBatch.empty()) {
        release(lines, "Event", fReleaseEvent);
        fReleaseEvent = newEvent();
        lines.push_back("clEnqueueReleaseGLObjects(queue#1, " + bracketed(fBatch) + ", " +
                        bracketed(fWaitEvents) + ") = " + fReleaseEvent);
        for (const std::string& event : fWaitEvents)
            release(lines, "Event", event);
        fWaitEvents.clear();
    }
    fAcquired = false;
    if (syncObjects() && fReleaseEvent != "null")
        graphicsWait(lines, fReleaseEvent);
    for (const std::string& event : fGraphicsEvents)
        graphicsWait(lines, event);
    fGraphicsEvents.clear();
    if (fDirty)
        rebuild(lines);
    return lines;
}

Lines SharedBufferModel::renderingComplete()
{
    Lines lines;
    if (!fBatching || !explicitFence())
        return lines;
    if (!fFence.empty()) {
        lines.push_back("glDeleteSync(" + fFence + ")");
        fReferences[fFence] = 0;
    }
    fFence = "sync#" + std::to_string(++fCreated.syncs);
    fReferences[fFence] = 1;
    lines.push_back("glFenceSync(37143, 0) = " + fFence);
    return lines;
}

Lines SharedBufferModel::end()
{
    Lines lines;
    release(lines, "Event", fReleaseEvent);
    release(lines, "Event", fAcquireEvent);
    for (const Record& record : fRecords)
        release(lines, "MemObject", record.mem);
    dropBatch(lines);
    fRecords.clear();
    return lines;
}

bool SharedBufferModel::anyAcquiredAlone() const
{
    return std::ranges::any_of(fRecords, &Record::acquired);
}

} // namespace scripted
