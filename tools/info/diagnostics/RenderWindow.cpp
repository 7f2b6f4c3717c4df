#include "tools/info/diagnostics/RenderWindow.h"

#include "standalone/NativeContext.h"
#include "standalone/OpenCLPlatforms.h"
#include "tools/info/diagnostics/Platform.h"

#include <string_view>

#include <QOpenGLFunctions>

namespace info {
namespace {

constexpr char kPlatformVariable[] = "QT_QPA_PLATFORM";

// Qt's warnings during the search for a display: the reason if there is none.
std::string sfWindowSystemErrors;
QtMessageHandler sfPreviousHandler = nullptr;

void keepWindowSystemError(QtMsgType type, const QMessageLogContext& context,
                           const QString& message)
{
    constexpr std::string_view kWindowSystem = "qt.qpa";
    if (type == QtFatalMsg && sfPreviousHandler)
        sfPreviousHandler(type, context, message);
    if (type != QtWarningMsg || !std::string_view(context.category).starts_with(kWindowSystem))
        return;
    sfWindowSystemErrors +=
        (sfWindowSystemErrors.empty() ? "" : "; ") + message.trimmed().toStdString();
}

// Sets the window systems that Qt tries. The last one always works and has no OpenGL; without it Qt
// would end the process if there is no display.
void setWindowSystems()
{
    constexpr char kLastResort[] = "offscreen";
    QByteArray systems = qgetenv(kPlatformVariable);
    if (systems.isEmpty())
        systems = defaultWindowSystems();
    qputenv(kPlatformVariable, systems + ";" + kLastResort);
}

std::unique_ptr<QGuiApplication> makeApplication()
{
    static int argumentCount = 1;
    static char programName[] = "vyra-opencl-info";
    static char* arguments[] = {programName, nullptr};
    setWindowSystems();
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
    sfWindowSystemErrors.clear();
    sfPreviousHandler = qInstallMessageHandler(keepWindowSystemError);
    fApplication = makeApplication();
    fRenderer.windowSystem = QGuiApplication::platformName().toStdString();
    open();
    qInstallMessageHandler(sfPreviousHandler);
}

RenderWindow::~RenderWindow() = default;

void RenderWindow::open()
{
    fContext = std::make_unique<QOpenGLContext>();
    if (!fContext->create()) {
        fRenderer.problem = "no context can be created" +
                            (sfWindowSystemErrors.empty() ? "" : " (" + sfWindowSystemErrors + ")");
        return;
    }
    fWindow = std::make_unique<QWindow>();
    fWindow->setSurfaceType(QSurface::OpenGLSurface);
    fWindow->create();
    if (!fContext->makeCurrent(fWindow.get())) {
        fRenderer.problem = "the context cannot draw into a window";
        return;
    }
    fHost = std::make_unique<GLHost>(*fContext);
    fRenderer.usable = true;
    fRenderer.vendor = glText(*fContext, GL_VENDOR);
    fRenderer.renderer = glText(*fContext, GL_RENDERER);
    fRenderer.version = glText(*fContext, GL_VERSION);
    fRenderer.adapterVendorId = ::adapterVendorId(fRenderer.vendor, fRenderer.renderer);
    fRenderer.syncObjects = fHost->syncObjectsUsable();
}

void* RenderWindow::nativeWindow() const
{
    // NOLINTNEXTLINE(performance-no-int-to-ptr): the library takes a window's number as a pointer
    return fWindow ? reinterpret_cast<void*>(fWindow->winId()) : nullptr;
}

void* RenderWindow::nativeContext() const
{
    return fRenderer.usable ? ::nativeContext(*fContext) : nullptr;
}

} // namespace info
