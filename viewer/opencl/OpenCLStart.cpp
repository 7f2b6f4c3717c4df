#include "viewer/opencl/OpenCLStart.h"

#include "diagnostics/CLWarningSink.h"
#include "host/Environment.h"
#include "loader/OpenCLLibraryName.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/NativeContext.h"
#include "standalone/OpenCLPlatforms.h"
#include "viewer/opencl/StartFailure.h"

#include <string>
#include <vector>

#include <QByteArray>
#include <QLibrary>
#include <QOpenGLContext>
#include <QOpenGLWindow>

namespace viewer {
namespace {

constexpr char kPlatformVariable[] = "VYRA_OPENCL_PLATFORM";

// The library's warnings while an object lives. One thread starts the library.
class WarningList {
public:
    WarningList() : fFormer(setCLWarningSink(keep)) { sfTexts.clear(); }
    ~WarningList() { setCLWarningSink(fFormer); }
    WarningList(const WarningList&) = delete;
    WarningList& operator=(const WarningList&) = delete;

    std::vector<std::string> texts() const { return sfTexts; }

private:
    static void keep(const char* text)
    {
        std::string warning = text;
        while (warning.ends_with('\n'))
            warning.pop_back();
        sfTexts.push_back(std::move(warning));
    }

    static inline std::vector<std::string> sfTexts;
    CLWarningSink fFormer;
};

std::string variable(const char* name)
{
    return qEnvironmentVariable(name).toStdString();
}

StartFacts gatherFacts(const Options& options, bool platformIsGiven, unsigned vendorId,
                       const WarningList& warnings)
{
    StartFacts facts;
    facts.libraryFound = QLibrary(kOpenCLLibraryName).load();
    facts.disabled = qEnvironmentVariableIsSet("VYRA_DISABLE_OPENCL");
    facts.platformIsGiven = platformIsGiven;
    facts.cpuIsAllowed = options.allowCpu;
    facts.vendorId = vendorId;
    facts.vendor = variable(kPlatformVariable);
    facts.missingLayers = missingOpenCLLayers();
    facts.platforms = openCLPlatforms();
    facts.warnings = warnings.texts();
    return facts;
}

} // namespace

Status startOpenCL(QOpenGLWindow& window, const Options& options)
{
    if (!options.platform.empty())
        qputenv(kPlatformVariable, QByteArray::fromStdString(options.platform));
    const bool platformIsGiven = qEnvironmentVariableIsSet(kPlatformVariable);
    QOpenGLContext& context = *window.context();
    const unsigned vendorId = chooseOpenCLPlatform(context);

    constexpr bool kUsingDirect3D = false;
    constexpr bool kUsingCoreProfile = true;
    // NOLINTNEXTLINE(performance-no-int-to-ptr): the library takes a window's number as a pointer
    void* const nativeWindow = reinterpret_cast<void*>(window.winId());
    const WarningList warnings;
    if (TopenCLInfo::initialize(nativeWindow, nativeContext(context), nullptr, kUsingDirect3D,
                                kUsingCoreProfile, vendorId))
        return {};
    return startFailure(gatherFacts(options, platformIsGiven, vendorId, warnings));
}

} // namespace viewer
