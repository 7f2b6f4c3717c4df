#include "fake/Entry.h"

#include <array>
#include <cstring>
#include <sstream>

namespace scripted {
namespace {

// The status for a handle of the kind that does not exist, in the order of Kind.
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
    if (const Object* found = object(kind, handle)) {
        if (kind == Kind::kMem && found->references == 1)
            require(!fRuntime.fCommands.isInUse(handle), CL_INVALID_OPERATION,
                    found->name + " dies while a command uses it");
        if (kind == Kind::kQueue && found->references == 1)
            fRuntime.fCommands.forget(handle);
        fRuntime.fLedger.release(handle);
    }
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

Object* Entry::usableMem(cl_mem mem)
{
    Object* found = object(Kind::kMem, mem);
    if (found)
        require(!found->shared || found->acquired, CL_INVALID_GL_OBJECT, "used without acquire");
    return found;
}

CommandOrder::Command Entry::nextCommand(cl_command_queue queue, const WaitList& list)
{
    object(Kind::kQueue, queue);
    requireWaitList(list);
    std::vector<unsigned> waits;
    for (cl_uint i = 0; ok() && i < list.count; ++i)
        waits.push_back(fRuntime.fLedger.alive(Kind::kEvent, list.items[i])->command);
    return fRuntime.fCommands.next(queue, waits);
}

unsigned Entry::addCommand(CommandOrder::Command command, cl_event* event)
{
    const bool profiled = fRuntime.fLedger.alive(Kind::kQueue, command.queue)->profiled;
    const unsigned number = fRuntime.fCommands.add(std::move(command));
    if (event)
        *event = create<cl_event>(Kind::kEvent);
    if (event && *event) {
        Object& created = *fRuntime.fLedger.alive(Kind::kEvent, *event);
        created.statuses = fRuntime.fEventStatuses;
        created.command = number;
        created.profiled = profiled;
    }
    return number;
}

cl_int Entry::command(cl_command_queue queue, const WaitList& list, cl_event* event,
                      const Mems& mems, bool blocking)
{
    CommandOrder::Command next = nextCommand(queue, list);
    const bool isOrdered = ok(); // otherwise its wait list is unknown
    std::vector<Object*> shared;
    for (cl_mem mem : mems) {
        Object* used = usableMem(mem);
        if (!used || !used->shared || !isOrdered)
            continue;
        require(fRuntime.fCommands.precedes(used->acquire, next), CL_INVALID_OPERATION,
                used->name + " is used before its acquire is complete");
        shared.push_back(used);
    }
    if (!ok())
        return fStatus;
    next.mems.assign(mems.begin(), mems.end());
    const unsigned number = addCommand(std::move(next), event);
    for (Object* used : shared)
        used->uses.push_back(number);
    if (blocking)
        fRuntime.fCommands.observe(number);
    return fStatus;
}

cl_int Entry::changeSide(cl_command_queue queue, const WaitList& list, cl_event* event,
                         const std::vector<Object*>& objects, bool acquire)
{
    CommandOrder::Command next = nextCommand(queue, list);
    if (!ok())
        return fStatus;
    const auto requireAfter = [&](unsigned earlier, const Object& object, const char* what) {
        require(fRuntime.fCommands.precedes(earlier, next), CL_INVALID_OPERATION,
                object.name + what);
    };
    for (const Object* object : objects) {
        requireAfter(object->acquire, *object, " changes sides before its acquire is complete");
        requireAfter(object->release, *object, " changes sides before its release is complete");
        for (const unsigned use : object->uses)
            requireAfter(use, *object, " is released before a command that uses it is complete");
    }
    if (!ok())
        return fStatus;
    const unsigned number = addCommand(std::move(next), event);
    for (Object* object : objects) {
        object->acquired = acquire;
        (acquire ? object->acquire : object->release) = number;
        object->uses.clear();
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
        // NOLINTNEXTLINE(performance-no-int-to-ptr): a handle is never dereferenced.
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

cl_int Entry::answer(cl_uint query, const void* data, std::size_t size, std::size_t capacity,
                     void* value, std::size_t* sizeReturned)
{
    if (ok() && machine().emptyAnswers.contains(query)) {
        if (sizeReturned)
            *sizeReturned = 0;
        return fStatus;
    }
    if (!ok() || !require(!value || capacity >= size, CL_INVALID_VALUE, "the value is too small"))
        return fStatus;
    if (value && size > 0)
        std::memcpy(value, data, size);
    if (sizeReturned)
        *sizeReturned = size;
    return fStatus;
}

} // namespace scripted
