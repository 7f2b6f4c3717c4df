// The host's interned string.
#pragma once

#include "host/HostExport.h"

#include <cstdint>

// A handle of a text that the process holds once: equal texts give equal handles, so comparing is
// comparing pointers. Interned texts live until the process ends. Safe from any thread.
class VYRA_HOST_API TuniqueString {
public:
    // Interns the NUL-terminated `text`; null reads as the empty string.
    explicit TuniqueString(const char* text = "");

    const char* asChar() const;
    // 64-bit hash of the text.
    std::uint64_t hash() const;

    bool operator==(const TuniqueString& other) const = default;

private:
    struct Entry;
    const Entry* fEntry;
};
