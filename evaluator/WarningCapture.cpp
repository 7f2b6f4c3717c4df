#include "evaluator/WarningCapture.h"

#include "diagnostics/CLWarningSink.h"

#include <atomic>
#include <mutex>

namespace vyra {
namespace {

thread_local std::string* capturedText = nullptr;

std::mutex installation; // guards captures
int captures = 0;        // on all threads
std::atomic<CLWarningSink> hostSink = nullptr;

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
    if (const CLWarningSink sink = hostSink)
        sink(text);
}

} // namespace

WarningCapture::WarningCapture()
{
    const std::scoped_lock lock(installation);
    if (captures++ == 0)
        hostSink = setCLWarningSink(forward);
    capturedText = &fText;
}

WarningCapture::~WarningCapture()
{
    capturedText = nullptr;
    const std::scoped_lock lock(installation);
    if (--captures > 0)
        return;
    // A sink that the host installed meanwhile stays.
    const CLWarningSink installed = setCLWarningSink(hostSink);
    if (installed != forward)
        setCLWarningSink(installed);
}

} // namespace vyra
