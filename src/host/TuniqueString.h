// The host's interned string.
#pragma once

#include "host/HostExport.h"

#include <cstdint>

// A handle of a text that the process stores once: equal texts have equal handles, so a comparison
// compares pointers. Interned texts live until the process ends. Safe from any thread.
class VYRA_HOST_API TuniqueString {
public:
    // Interns the NUL-terminated `text`; null is the empty string.
    explicit TuniqueString(const char* text = "");

    const char* asChar() const;
    // Returns a 64-bit hash of the text.
    std::uint64_t hash() const;

    bool operator==(const TuniqueString& other) const = default;

private:
    struct Entry;
    const Entry* fEntry;
};
