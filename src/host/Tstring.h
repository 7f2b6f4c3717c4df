// The host's byte string.
#pragma once

#include "host/HostExport.h"

#include <string>

// A sequence of bytes, followed by a NUL. Lengths are 32-bit numbers of bytes. One object is used
// by one thread at a time.
class VYRA_HOST_API Tstring {
public:
    Tstring() = default;
    // Copies the NUL-terminated `text`; null is the empty string.
    Tstring(const char* text);

    unsigned int length() const;
    // Truncates the string, or extends it with NUL bytes.
    void setLength(unsigned int length);

    // Return the bytes, valid until the string is changed or destroyed. Never null.
    const char* asChar() const;
    char* data();

    // Returns a 32-bit hash of the bytes; equal strings have equal hashes.
    unsigned int hash() const;

    // Returns the byte index of the first occurrence at or after `from`, or -1.
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
