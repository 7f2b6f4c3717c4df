#include "viewer/WarningCapture.h"

#include "diagnostics/CLWarningSink.h"

#include <atomic>
#include <mutex>
#include <new>

namespace viewer {
namespace {

thread_local std::string* collected = nullptr;

std::mutex installation; // guards captures
int captures = 0;        // on all threads
std::atomic<CLWarningSink> sinkBefore = nullptr;

void collectAndForward(const char* text)
{
    if (collected) {
        try {
            if (!collected->empty())
                *collected += '\n';
            *collected += text;
        } catch (const std::bad_alloc&) {
            // A sink must not throw; the sink before still receives the warning.
        }
    }
    if (const CLWarningSink sink = sinkBefore)
        sink(text);
}

} // namespace

WarningCapture::WarningCapture()
{
    const std::scoped_lock lock(installation);
    if (captures++ == 0)
        sinkBefore = setCLWarningSink(collectAndForward);
    collected = &fText;
}

WarningCapture::~WarningCapture()
{
    collected = nullptr;
    const std::scoped_lock lock(installation);
    if (--captures > 0)
        return;
    // A sink that was installed meanwhile stays.
    const CLWarningSink installed = setCLWarningSink(sinkBefore);
    if (installed != collectAndForward)
        setCLWarningSink(installed);
}

} // namespace viewer
