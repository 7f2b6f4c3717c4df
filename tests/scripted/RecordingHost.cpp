// The host functions that the library's static objects call. They record the order in which these
// objects are constructed and destroyed, and replace the stand-in host's definitions.
#include "fake/FakeRuntime.h"
#include "host/Profiler.h"
#include "host/Trace.h"
#include "host/TuniqueString.h"

#include <functional>
#include <iostream>
#include <set>
#include <string>

struct TuniqueString::Entry {
    std::string text;
    bool operator<(const Entry& other) const { return text < other.text; }
};

TuniqueString::TuniqueString(const char* text)
{
    static std::set<Entry> entries;
    fEntry = &*entries.insert({text}).first;
    scripted::runtime().log("name \"" + fEntry->text + '"');
}

const char* TuniqueString::asChar() const
{
    return fEntry->text.c_str();
}

std::uint64_t TuniqueString::hash() const
{
    return std::hash<std::string>()(fEntry->text);
}

TdbTrace::TdbTrace(int level, const char* name, std::ostream& output, const char* description)
    : fLevel(level), fName(name), fOutput(&output), fDescription(description)
{
    scripted::runtime().log("trace " + std::to_string(level) + ' ' + name + ": " + description +
                            (&output == &std::cerr ? "" : ", elsewhere"));
}

TdbTrace::~TdbTrace()
{
    scripted::runtime().log(std::string("trace destroyed: ") + fName);
}

std::ostream& TdebugOutput::sCerr()
{
    return std::cerr;
}

profiler::EventType::EventType(const Category& category, Color color, const char* name,
                               const char* description)
    : fCategoryId(category.id()), fColor(color), fName(name), fDescription(description)
{
    scripted::runtime().log(std::string("event type ") + name);
}

const profiler::Categories& profiler::categories()
{
    static const Categories theCategories;
    return theCategories;
}

const profiler::Category& profiler::Categories::main() const
{
    static const Category theMain(1);
    return theMain;
}
