#include "viewer/opencl/OpenCLStart.h"

#include "diagnostics/CLWarningSink.h"
#include "host/Environment.h"
#include "loader/OpenCLLibraryName.h"
#include "runtime/EnvironmentVariables.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/NativeContext.h"
#include "standalone/OpenCLPlatforms.h"
#include "viewer/opencl/StartFailure.h"

#include <utility>
#include <vector>

#include <QByteArray>
#include <QLibrary>
#include <QOpenGLContext>
#include <QOpenGLWindow>

namespace viewer {
namespace {

// Records the library's warnings during its lifetime. Only one thread starts the library.
class WarningList {
public:
    WarningList() : fPrevious(setCLWarningSink(record)) { sfTexts.clear(); }
    ~WarningList() { setCLWarningSink(fPrevious); }
    WarningList(const WarningList&) = delete;
    WarningList& operator=(const WarningList&) = delete;

    [[nodiscard]] std::vector<std::string> texts() const { return sfTexts; }

private:
    static void record(const char* text)
    {
        std::string warning = text;
        while (warning.ends_with('\n'))
            warning.pop_back();
        sfTexts.push_back(std::move(warning));
    }

    static inline std::vector<std::string> sfTexts;
    CLWarningSink fPrevious;
};

std::string variable(const char* name)
{
    return qEnvironmentVariable(name).toStdString();
}

StartDiagnostics collectDiagnostics(bool platformIsGiven, bool cpuIsAllowed, unsigned vendorId,
                                    const WarningList& warnings)
{
    StartDiagnostics diagnostics;
    diagnostics.libraryFound = QLibrary(kOpenCLLibraryName).load();
    diagnostics.disabled = qEnvironmentVariableIsSet(kDisableOpenCLVariable);
    diagnostics.platformIsGiven = platformIsGiven;
    diagnostics.cpuIsAllowed = cpuIsAllowed;
    diagnostics.vendorId = vendorId;
    diagnostics.vendor = variable(kPlatformVariable);
    diagnostics.missingLayers = missingOpenCLLayers();
    diagnostics.platforms = openCLPlatforms();
    diagnostics.warnings = warnings.texts();
    return diagnostics;
}

} // namespace

Status startOpenCL(QOpenGLWindow& window, const std::string& platform, bool cpuIsAllowed)
{
    if (!platform.empty())
        qputenv(kPlatformVariable, QByteArray::fromStdString(platform));
    const bool platformIsGiven = qEnvironmentVariableIsSet(kPlatformVariable);
    QOpenGLContext& context = *window.context();
    const unsigned vendorId = chooseOpenCLPlatform(context);

    constexpr bool kUsingDirect3D = false;
    constexpr bool kUsingCoreProfile = true;
    // NOLINTNEXTLINE(performance-no-int-to-ptr): the library takes the window id as a pointer
    void* nativeWindow = reinterpret_cast<void*>(window.winId());
    const WarningList warnings;
    if (TopenCLInfo::initialize(nativeWindow, nativeContext(context), nullptr, kUsingDirect3D,
                                kUsingCoreProfile, vendorId))
        return {};
    return startFailure(collectDiagnostics(platformIsGiven, cpuIsAllowed, vendorId, warnings));
}

} // namespace viewer
