// Wait lists, and the status of events.
#include "baselines/ThirdPartyBaseline.h"
#include "cases/Cases.h"
#include "diagnostics/AutoCLEventList.h"
#include "fixtures/Runtime.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <memory>

namespace {

using Event = AutoCLObject<cl_event>;

Event completeEvent()
{
    cl_int status = CL_SUCCESS;
    Event event;
    event.adopt(clCreateUserEvent(Runtime::context(), &status));
    clSetUserEventStatus(event.get(), CL_COMPLETE);
    return event;
}

// A minimal wait list: a plain array of handles that grows by one half.
class HandleArray {
public:
    void add(const Event& event)
    {
        if (fSize == fCapacity)
            grow();
        fHandles[fSize++] = event.get();
    }
    const cl_event* data() const { return fHandles.get(); }

private:
    void grow()
    {
        fCapacity = std::max(fCapacity + fCapacity / 2, fSize + 1);
        std::unique_ptr<cl_event[]> grown(new cl_event[fCapacity]);
        std::copy_n(fHandles.get(), fSize, grown.get());
        fHandles = std::move(grown);
    }

    std::unique_ptr<cl_event[]> fHandles;
    std::size_t fSize = 0;
    std::size_t fCapacity = 0;
};

template <typename List>
Body filling(const std::shared_ptr<std::vector<Event>>& events)
{
    return [events](std::size_t count) {
        return timedLoop(count, [&] {
            List list;
            for (const Event& event : *events)
                list.add(event);
            keep(list);
        });
    };
}

Group waitList(const std::string& name, std::size_t size)
{
    constexpr double kLimit = 1.1;
    const auto events = std::make_shared<std::vector<Event>>();
    for (std::size_t index = 0; index < size; ++index)
        events->push_back(completeEvent());
    const auto perEvent = static_cast<double>(size);
    Group group{
        name,
        {{"array that grows by one half", filling<HandleArray>(events), {}, perEvent},
         {"AutoCLEventList", filling<AutoCLEventList>(events), Goal::ratio(kLimit), perEvent}}};
    std::vector<cl_event> handles;
    for (const Event& event : *events)
        handles.push_back(event.get());
    addThirdPartyBaselines(
        group, [&](const ThirdPartyBaseline& library) { return library.waitList(handles); });
    return group;
}

Group completion(const std::string& name)
{
    constexpr double kLimit = 5;
    const auto event = std::make_shared<Event>(completeEvent());
    return {name,
            {{"clGetEventInfo",
              [event](std::size_t count) {
                  return timedLoop(count, [&] {
                      cl_int state = 0;
                      clGetEventInfo(event->get(), CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof state,
                                     &state, nullptr);
                      keep(state);
                  });
              }},
             {"IsEventComplete",
              [event](std::size_t count) {
                  return timedLoop(count,
                                   [&] { keep(TopenCLInfo::IsEventComplete(event->get())); });
              },
              Goal::extraNanoseconds(kLimit)}}};
}

} // namespace

std::vector<GroupFactory> eventGroups()
{
    std::vector<GroupFactory> groups;
    for (const std::size_t size : {4u, 64u, 1024u}) {
        const std::string name = "wait list of " + std::to_string(size);
        groups.push_back({name, [=] { return waitList(name, size); }});
    }
    const std::string name = "IsEventComplete";
    groups.push_back({name, [=] { return completion(name); }});
    return groups;
}
