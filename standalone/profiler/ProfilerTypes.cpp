// The profiler's categories and event types, which do not depend on the profiler.
#include "host/Profiler.h"

#include "standalone/profiler/ProfileLog.h"

namespace {

constinit const profiler::Category kMainCategory{vyra::host::kMainCategoryId};
constinit const profiler::Categories kAllCategories{};

} // namespace

namespace profiler {

const Category& Categories::main() const
{
    return kMainCategory;
}

const Categories& categories()
{
    return kAllCategories;
}

EventType::EventType(const Category& category, Color color, const char* name,
                     const char* description)
    : fCategoryId(category.id()), fColor(color), fName(name), fDescription(description)
{
}

} // namespace profiler
