#include "evaluator/WarningCapture.h"

#include "diagnostics/CLWarningSink.h"

#include <mutex>

namespace vyra {
namespace {

thread_local std::string* capturedText = nullptr;

std::mutex installation; // guards the two below and the library's sink
int captures = 0;        // on all threads
CLWarningSink hostSink = nullptr;

// Returns the host's sink; waits while another thread exchanges it.
CLWarningSink currentHostSink()
{
    const std::scoped_lock lock(installation);
    return hostSink;
}

void forward(const char* text)
{
    if (capturedText) {
        try {
            *capturedText += text;
            *capturedText += '\n';
        } catch (...) {
            // A sink must not throw; the host still receives the warning.
        }
    }
    if (const CLWarningSink sink = currentHostSink())
        sink(text);
}

} // namespace

WarningCapture::WarningCapture()
{
    const std::scoped_lock lock(installation);
    if (captures++ == 0) {
        // A host that replaced the sink during a capture and then restored it has installed ours.
        const CLWarningSink former = setCLWarningSink(forward);
        if (former != forward)
            hostSink = former;
    }
    capturedText = &fText;
}

WarningCapture::~WarningCapture()
{
    capturedText = nullptr;
    const std::scoped_lock lock(installation);
    if (--captures > 0)
        return;
    // A sink that the host has installed since then stays.
    const CLWarningSink installed = setCLWarningSink(hostSink);
    if (installed != forward)
        setCLWarningSink(installed);
}

} // namespace vyra
