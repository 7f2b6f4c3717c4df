// An X display for tests: the one of the environment, or else an Xvfb of the test's own.
#pragma once

#include <sys/types.h>

class VirtualDisplay {
public:
    VirtualDisplay();

    // Ends the server that was started.
    ~VirtualDisplay();

    VirtualDisplay(const VirtualDisplay&) = delete;
    VirtualDisplay& operator=(const VirtualDisplay&) = delete;

    // Whether DISPLAY names a display that answers.
    [[nodiscard]] bool valid() const { return valid_; }

private:
    void startServer();

    pid_t server_ = 0;
    bool valid_ = false;
};
