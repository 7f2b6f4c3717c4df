#include "VirtualDisplay.h"

#include <X11/Xlib.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <cstdlib>
#include <string>

namespace {

bool answers()
{
    Display* display = XOpenDisplay(nullptr);
    if (display == nullptr)
        return false;
    XCloseDisplay(display);
    return true;
}

// What the server writes when it is ready, without the line's end; empty if it ends instead.
std::string readLine(int descriptor)
{
    std::string line;
    for (char c = 0; read(descriptor, &c, 1) == 1 && c != '\n';)
        line += c;
    return line;
}

} // namespace

VirtualDisplay::VirtualDisplay() : valid_(answers())
{
    if (valid_)
        return;
    startServer();
    valid_ = answers();
}

VirtualDisplay::~VirtualDisplay()
{
    if (server_ == 0)
        return;
    kill(server_, SIGTERM);
    waitpid(server_, nullptr, 0);
}

// The server chooses a free number and tells it through a pipe. It ends with this process, however
// that ends.
void VirtualDisplay::startServer()
{
    std::array<int, 2> ends{};
    if (pipe(ends.data()) != 0)
        return;
    const std::string descriptor = std::to_string(ends[1]);
    server_ = fork();
    if (server_ == 0) {
        close(ends[0]);
        prctl(PR_SET_PDEATHSIG, SIGKILL);
        // Without -noreset the server would start over whenever its last client leaves.
        execlp("Xvfb", "Xvfb", "-displayfd", descriptor.c_str(), "-screen", "0", "320x240x24",
               "-nolisten", "tcp", "-noreset", nullptr);
        _exit(1);
    }
    close(ends[1]);
    const std::string number = readLine(ends[0]);
    close(ends[0]);
    setenv("DISPLAY", (":" + number).c_str(), 1);
}
