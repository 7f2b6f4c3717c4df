// The host's trace channels.
#pragma once

#include "host/HostExport.h"

#include <iosfwd>

// A named channel for developers' traces, registered with the host while it exists.
class VYRA_HOST_API TdbTrace {
public:
    // The texts and the stream are borrowed and must outlive the channel.
    TdbTrace(int level, const char* name, std::ostream& output, const char* description);
    ~TdbTrace();
    TdbTrace(const TdbTrace&) = delete;
    TdbTrace& operator=(const TdbTrace&) = delete;

    int level() const { return fLevel; }
    const char* name() const { return fName; }
    const char* description() const { return fDescription; }

private:
    int fLevel;
    const char* fName;
    std::ostream* fOutput;
    const char* fDescription;
};

class VYRA_HOST_API TdebugOutput {
public:
    // Returns the host's error stream, which lives until the process ends.
    static std::ostream& sCerr();
};
