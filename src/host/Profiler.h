// The host's profiler.
#pragma once

#include "host/HostExport.h"

#include <cstdint>

namespace profiler {

// Index of a colour in the host's palette.
using Color = std::uint32_t;

namespace Colors {
// The palette's entry for work on shared buffers.
inline constexpr Color kColor14 = 14;
} // namespace Colors

class VYRA_HOST_API Category {
public:
    explicit constexpr Category(std::uint32_t id) : fId(id) {}
    std::uint32_t id() const { return fId; }

private:
    std::uint32_t fId;
};

class VYRA_HOST_API Categories {
public:
    const Category& main() const;
};

// Returns the host's categories. Usable before any static object of the library is constructed.
VYRA_HOST_API const Categories& categories();

// The description of all events of one kind. The texts are borrowed and must outlive the type.
class VYRA_HOST_API EventType {
public:
    EventType(const Category& category, Color color, const char* name, const char* description);

    std::uint32_t categoryId() const { return fCategoryId; }
    Color color() const { return fColor; }
    const char* name() const { return fName; }
    const char* description() const { return fDescription; }

private:
    std::uint32_t fCategoryId;
    Color fColor;
    const char* fName;
    const char* fDescription;
};

// The identifier of an event that has begun and not ended.
using EventId = std::uint64_t;

// Returns whether the profiler records. Safe from any thread, as are the two functions below.
VYRA_HOST_API bool samplingActive();

// Begins an event on the calling thread. `data` points to `dataSize` bytes, or is null.
VYRA_HOST_API EventId eventBegin(std::uint32_t categoryId, Color color, const char* name,
                                 const char* description, const void* data, std::uint32_t dataSize);
VYRA_HOST_API void eventEnd(EventId event);

} // namespace profiler
