// The host's array of strings.
#pragma once

#include "host/HostExport.h"
#include "host/Tstring.h"

#include <vector>

// One object belongs to one thread at a time.
class VYRA_HOST_API TstringArray {
public:
    unsigned int length() const;
    // `index` is below length().
    const Tstring& operator[](unsigned int index) const;
    void append(const Tstring& text);

private:
    std::vector<Tstring> fTexts;
};
