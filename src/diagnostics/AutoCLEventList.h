// A wait list.
#pragma once

#include "VyraOpenCLExport.h"
#include "diagnostics/AutoCLObject.h"

#include <memory>

class TopenCLBuffer;

// An array of events for the wait-list arguments of an enqueue call: `list.size(), list.array()`.
//
// The list borrows: the holders that it is filled from must stay alive, and keep their handles, for
// as long as it is used. Events keep the order of addition; one that is added twice is held twice.
// One list belongs to one thread at a time. Running out of memory raises std::bad_alloc and changes
// nothing.
class VYRA_OPENCL_API AutoCLEventList {
public:
    AutoCLEventList();
    AutoCLEventList(const AutoCLEventList& other);
    // Reuses the present storage when it is large enough.
    AutoCLEventList& operator=(const AutoCLEventList& other);
    ~AutoCLEventList();

    // Appends the event; an empty holder is skipped.
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

    // The first handle, or null when the list is empty.
    const cl_event* array() const;
    // Number of events.
    unsigned int size() const;

private:
    void grow();

    // Not a standard vector, which doubles and whose reserve costs more than the growth itself.
    std::unique_ptr<cl_event[]> fEvents;
    unsigned int fSize = 0;
    unsigned int fCapacity = 0;
};
