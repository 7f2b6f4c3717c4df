#include "tools/info/diagnostics/StartUpRun.h"

#include "runtime/PlatformSelection.h"
#include "tools/info/diagnostics/CapturedOutput.h"
#include "tools/info/diagnostics/RenderWindow.h"
#include "tools/info/diagnostics/WarningLog.h"

namespace info {
namespace {

// No decision depends on it: the library only stores it for the host.
constexpr bool kUsingCoreProfile = false;

void readResult(StartUp& startUp)
{
    const TopenCLInfo& library = TopenCLInfo::theOne();
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
    if (!window.renderer().usable)
        return startUp;
    startUp.attempted = true;
    CapturedOutput output;
    startUp.valid = TopenCLInfo::initialize(window.nativeWindow(), window.nativeContext(), nullptr,
                                            false, kUsingCoreProfile, vendorId);
    startUp.lastStep = startUpStep();
    startUp.output = output.finish();
    startUp.warnings = warnings.take();
    readResult(startUp);
    return startUp;
}

std::optional<std::string> wantedVendor(unsigned vendorId)
{
    // The function prints a message for an unknown id; start-up has printed it already.
    const CapturedOutput silence;
    const std::optional<Tstring> vendor = chooseVendor(vendorId);
    return vendor ? std::optional<std::string>(vendor->asChar()) : std::nullopt;
}

} // namespace info
