// The host's array of strings.
#pragma once

#include "host/HostExport.h"
#include "host/Tstring.h"

#include <vector>

// An array of strings that grows. One object is used by one thread at a time.
class VYRA_HOST_API TstringArray {
public:
    unsigned int length() const;
    // Returns the string at `index`, which is less than length().
    const Tstring& operator[](unsigned int index) const;
    void append(const Tstring& text);

private:
    std::vector<Tstring> fTexts;
};
