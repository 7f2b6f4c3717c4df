#include "tools/info/diagnostics/StartUpRun.h"

#include "runtime/PlatformSelection.h"
#include "tools/info/diagnostics/CapturedOutput.h"
#include "tools/info/diagnostics/RenderWindow.h"
#include "tools/info/diagnostics/WarningLog.h"

namespace info {
namespace {

// Only Windows looks at the native window.
constexpr void* kNoWindow = nullptr;

// The answer does not reach the decisions here: the library only keeps it for the host.
constexpr bool kUsingCoreProfile = false;

void readOutcome(StartUp& startUp)
{
    const TopenCLInfo& library = TopenCLInfo::theOne();
    startUp.hasDevice = library.openCLDevice() != nullptr;
    startUp.hasContext = library.openCLContext() != nullptr;
    startUp.hasQueue = library.openCLCommandQueue() != nullptr;
    startUp.provider = library.openCLProvider();
    startUp.graphicsToCL = library.graphicsToCLSyncMode();
    startUp.clToGraphics = library.clToGraphicsSyncMode();
    startUp.asyncReadback = library.supportsAsyncReadback();
    startUp.doublePrecision = library.platformSupportsDoublePrecision();
    startUp.threadedSharing = library.supportsThreadedSharing();
    startUp.minimumVertices = library.minimumBufferSize();
}

} // namespace

StartUp runStartUp(const RenderWindow& window, unsigned vendorId, WarningLog& warnings)
{
    StartUp startUp;
    startUp.vendorId = vendorId;
    if (!window.facts().usable)
        return startUp;
    startUp.attempted = true;
    CapturedOutput output;
    startUp.valid = TopenCLInfo::initialize(kNoWindow, window.nativeContext(), nullptr, false,
                                            kUsingCoreProfile, vendorId);
    startUp.output = output.finish();
    startUp.warnings = warnings.take();
    readOutcome(startUp);
    return startUp;
}

std::optional<std::string> wantedVendor(unsigned vendorId)
{
    // The rule says on standard error when it knows no vendor; start-up has said so already.
    const CapturedOutput silence;
    const std::optional<Tstring> vendor = chooseVendor(vendorId);
    return vendor ? std::optional<std::string>(vendor->asChar()) : std::nullopt;
}

} // namespace info
