#include "tools/info/diagnostics/RenderWindow.h"

#include "standalone/NativeContext.h"
#include "standalone/OpenCLPlatforms.h"

#include <string_view>

#include <QOpenGLFunctions>

namespace info {
namespace {

constexpr char kPlatformVariable[] = "QT_QPA_PLATFORM";

// Qt's own words while it looks for a display; the last ones are the reason when there is none.
std::string sfComplaints;

void keepComplaint(QtMsgType type, const QMessageLogContext& context, const QString& message)
{
    constexpr std::string_view kWindowSystem = "qt.qpa";
    if (type != QtWarningMsg || !std::string_view(context.category).starts_with(kWindowSystem))
        return;
    sfComplaints += (sfComplaints.empty() ? "" : "; ") + message.trimmed().toStdString();
}

// Names the window systems to try. The last one always works and has no OpenGL; without it Qt would
// end the process where there is no display.
void nameWindowSystems()
{
    constexpr char kLastResort[] = "offscreen";
    QByteArray systems = qgetenv(kPlatformVariable);
    if (systems.isEmpty())
        systems = qEnvironmentVariableIsSet("WAYLAND_DISPLAY") ? "xcb;wayland" : "xcb";
    qputenv(kPlatformVariable, systems + ";" + kLastResort);
}

std::unique_ptr<QGuiApplication> makeApplication()
{
    static int argumentCount = 1;
    static char programName[] = "vyra-opencl-info";
    static char* arguments[] = {programName, nullptr};
    nameWindowSystems();
    return std::make_unique<QGuiApplication>(argumentCount, arguments);
}

std::string glText(QOpenGLContext& context, unsigned name)
{
    const auto* text = context.functions()->glGetString(name);
    return text ? reinterpret_cast<const char*>(text) : "";
}

} // namespace

RenderWindow::RenderWindow()
{
    sfComplaints.clear();
    const QtMessageHandler former = qInstallMessageHandler(keepComplaint);
    fApplication = makeApplication();
    fFacts.windowSystem = QGuiApplication::platformName().toStdString();
    open();
    qInstallMessageHandler(former);
}

RenderWindow::~RenderWindow() = default;

void RenderWindow::open()
{
    fContext = std::make_unique<QOpenGLContext>();
    if (!fContext->create()) {
        fFacts.problem =
            "no context can be made" + (sfComplaints.empty() ? "" : " (" + sfComplaints + ")");
        return;
    }
    fWindow = std::make_unique<QWindow>();
    fWindow->setSurfaceType(QSurface::OpenGLSurface);
    fWindow->create();
    if (!fContext->makeCurrent(fWindow.get())) {
        fFacts.problem = "the context cannot draw into a window";
        return;
    }
    fHost = std::make_unique<GLHost>(*fContext);
    fFacts.usable = true;
    fFacts.vendor = glText(*fContext, GL_VENDOR);
    fFacts.renderer = glText(*fContext, GL_RENDERER);
    fFacts.version = glText(*fContext, GL_VERSION);
    fFacts.adapterVendorId = ::adapterVendorId(fFacts.vendor, fFacts.renderer);
    fFacts.syncObjects = fHost->syncObjectsUsable();
}

void* RenderWindow::nativeContext() const
{
    return fFacts.usable ? ::nativeContext(*fContext) : nullptr;
}

} // namespace info
