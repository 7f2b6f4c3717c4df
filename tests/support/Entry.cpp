#include "Entry.h"

#include <array>
#include <cstring>
#include <sstream>

namespace scripted {
namespace {

// What a runtime answers to a handle of the kind that is not alive, in the order of Kind.
constexpr std::array<cl_int, kKindCount> kInvalid = {
    CL_INVALID_PLATFORM,      CL_INVALID_DEVICE,     CL_INVALID_CONTEXT,
    CL_INVALID_COMMAND_QUEUE, CL_INVALID_MEM_OBJECT, CL_INVALID_EVENT,
    CL_INVALID_PROGRAM,       CL_INVALID_KERNEL,     CL_INVALID_VALUE};

} // namespace

void Entry::begin(const char* function, std::initializer_list<std::string> arguments)
{
    fFunction = function;
    fLine += '(';
    for (const std::string& argument : arguments)
        fLine += (fLine.back() == '(' ? "" : ", ") + argument;
    fLine += ')';

    ++fRuntime.fCallCount;
    if (const Fault* fault = fRuntime.meetFault(fFunction)) {
        fStatus = fault->status;
        fWithHandle = fault->withHandle;
        fEmptyHanded = fault->status == CL_SUCCESS;
    }
}

Entry::~Entry()
{
    if (!fCreated.empty())
        fLine += " = " + fCreated;
    if (fStatus != CL_SUCCESS)
        fLine += " ! " + std::to_string(fStatus);
    fRuntime.fCalls.push_back(std::move(fLine));
}

bool Entry::require(bool holds, cl_int status, const std::string& note)
{
    if (holds)
        return true;
    fRuntime.fMisuse.push_back(fFunction + ": " + note);
    if (fStatus == CL_SUCCESS)
        fStatus = status;
    return false;
}

Object* Entry::object(Kind kind, const void* handle)
{
    Object* found = fRuntime.fLedger.alive(kind, handle);
    require(found, kInvalid[static_cast<std::size_t>(kind)],
            fRuntime.name(handle) + (handle ? " is dead" : ""));
    return found;
}

void Entry::requireWaitList(const WaitList& list)
{
    if (!require((list.count == 0) == (list.items == nullptr), CL_INVALID_EVENT_WAIT_LIST,
                 "count and pointer of the wait list disagree"))
        return;
    for (cl_uint i = 0; i < list.count; ++i)
        require(fRuntime.fLedger.alive(Kind::kEvent, list.items[i]), CL_INVALID_EVENT_WAIT_LIST,
                fRuntime.name(list.items[i]) + " in the wait list");
}

cl_int Entry::retain(Kind kind, const void* handle)
{
    if (Object* found = object(kind, handle))
        ++found->references;
    return fStatus;
}

cl_int Entry::release(Kind kind, const void* handle)
{
    if (object(kind, handle))
        fRuntime.fLedger.release(handle);
    return fStatus;
}

void* Entry::createHandle(Kind kind)
{
    if (fEmptyHanded || (!ok() && !fWithHandle))
        return nullptr;
    void* handle = fRuntime.fLedger.create(kind);
    fCreated = fRuntime.name(handle);
    return handle;
}

cl_int Entry::command(cl_command_queue queue, const WaitList& list, cl_event* event)
{
    object(Kind::kQueue, queue);
    requireWaitList(list);
    if (ok() && event) {
        *event = create<cl_event>(Kind::kEvent);
        if (*event)
            fRuntime.fLedger.alive(Kind::kEvent, *event)->statuses = fRuntime.fEventStatuses;
    }
    return fStatus;
}

// "0x2008: 5, 0x1084: platform#1"
std::string Entry::text(const PropertyList& list) const
{
    std::string pairs;
    for (const cl_context_properties* item = list.items; *item != 0; item += 2) {
        std::ostringstream pair;
        pair << (pairs.empty() ? "" : ", ") << "0x" << std::hex << item[0] << std::dec << ": ";
        // NOLINTNEXTLINE(performance-no-int-to-ptr): a handle is opaque, nobody looks behind it.
        const std::string name = fRuntime.name(reinterpret_cast<const void*>(item[1]));
        pairs += pair.str() + (name == "ptr" || name == "null" ? std::to_string(item[1]) : name);
    }
    return '{' + pairs + '}';
}

unsigned Entry::nextClientWait()
{
    constexpr unsigned kConditionSatisfied = 0x911C; // GL_CONDITION_SATISFIED
    if (fRuntime.fClientWaits.empty())
        return kConditionSatisfied;
    const unsigned result = fRuntime.fClientWaits.front();
    fRuntime.fClientWaits.pop_front();
    return result;
}

cl_int Entry::answer(cl_uint query, const void* data, std::size_t size, std::size_t room,
                     void* value, std::size_t* sizeReturned)
{
    if (ok() && world().emptyAnswers.contains(query)) {
        if (sizeReturned)
            *sizeReturned = 0;
        return fStatus;
    }
    if (!ok() || !require(!value || room >= size, CL_INVALID_VALUE, "no room for the answer"))
        return fStatus;
    if (value && size > 0)
        std::memcpy(value, data, size);
    if (sizeReturned)
        *sizeReturned = size;
    return fStatus;
}

} // namespace scripted
