// The host's byte string.
#pragma once

#include "host/HostExport.h"

#include <string>

// A sequence of bytes with a NUL behind the last one. Lengths are 32-bit and count bytes. One
// object belongs to one thread at a time.
class VYRA_HOST_API Tstring {
public:
    Tstring() = default;
    // A copy of the NUL-terminated `text`; null reads as the empty string.
    Tstring(const char* text);

    unsigned int length() const;
    // Cuts the string, or extends it with NUL bytes.
    void setLength(unsigned int length);

    // Valid until the string is changed or destroyed. Never null.
    const char* asChar() const;
    char* data();

    // 32-bit hash of the bytes; equal strings have equal hashes.
    unsigned int hash() const;

    // Index of the first occurrence at or behind `from`, or -1.
    int findMB(const char* text, int from = 0) const;
    int findMB(wchar_t character, int from = 0) const;

    // Removes spaces (code 32 only) at both ends.
    void removeInitialAndFinalSpaces();

    Tstring& operator+=(const Tstring& other);
    Tstring& operator+=(const char* text);
    bool operator==(const Tstring& other) const = default;

private:
    std::string fText;
};
