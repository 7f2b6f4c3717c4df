// A wait list.
#pragma once

#include "VyraOpenCLExport.h"
#include "diagnostics/AutoCLObject.h"

#include <memory>

class TopenCLBuffer;

// An array of events for the wait-list arguments of an enqueue call: `list.size(), list.array()`.
//
// Borrows the events: the holders that they come from must stay alive and keep their handles while
// the list is used. Keeps the order of addition; an event added twice is listed twice. One list is
// used by one thread at a time. Throws std::bad_alloc when memory runs out, and is then unchanged.
class VYRA_OPENCL_API AutoCLEventList {
public:
    AutoCLEventList();
    AutoCLEventList(const AutoCLEventList& other);
    // Reuses its storage if that is large enough.
    AutoCLEventList& operator=(const AutoCLEventList& other);
    ~AutoCLEventList();

    // Appends the event; skips an empty holder.
    void add(const AutoCLObject<cl_event>& event)
    {
        if (!event.get())
            return;
        if (fSize == fCapacity)
            grow();
        fEvents[fSize++] = event.get();
    }
    // Appends the event of the buffer's last transfer, if it has one.
    void add(TopenCLBuffer& buffer);

    // Returns the address of the first handle, or null if the list is empty. Valid until the list
    // changes.
    const cl_event* array() const;
    // Returns the number of events.
    unsigned int size() const;

private:
    void grow();

    // Not a standard vector, which doubles and whose reserve costs more than the growth itself.
    std::unique_ptr<cl_event[]> fEvents;
    unsigned int fSize = 0;
    unsigned int fCapacity = 0;
};
