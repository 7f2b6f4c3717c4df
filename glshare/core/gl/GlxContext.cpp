// Implements GlContext for GLX.
//
// The context uses the application's display connection, since drivers share objects only between
// contexts of one connection. The connection's screen object must outlive the storage of buffers.
// Xlib is thread-safe by default since 1.8; before, multi-threaded applications call XInitThreads.
// Xlib calls an extension's hook when the application closes the connection.
#include "core/gl/GlContext.h"
#include "core/gl/GlxFunctions.h"

#include <array>
#include <functional>
#include <map>
#include <mutex>
#include <new>
#include <span>
#include <utility>
#include <vector>

namespace glshare {

namespace {

void* resolveGl(const char* name)
{
    return reinterpret_cast<void*>(glx().getProcAddress(reinterpret_cast<const GLubyte*>(name)));
}

// The open display connections that contexts use, and the listeners to call when one closes. Any
// thread.
class OpenDisplays {
public:
    using Listener = std::function<void()>;

    // Installs the hook that runs when the display closes, once per display.
    void open(Display* display);

    // Calls `listener` before the display closes, until the context is destroyed.
    void listen(Display* display, GLXContext context, Listener listener);

    // Destroys a context, unless its display is closed or closing.
    void destroy(Display* display, GLXContext context);

    // Keeps a reference to an abandoned context, so that leak checkers find it.
    void keep(GLXContext context) noexcept;

private:
    // Runs in XCloseDisplay before GLX's hook, since Xlib calls the newest extension first.
    static int closing(Display* display, XExtCodes* codes);

    std::mutex fMutex; // guards the rest
    std::map<Display*, std::map<GLXContext, Listener>> fListeners;
    std::vector<GLXContext> fKept;
};

OpenDisplays& openDisplays()
{
    // Never destroyed: displays may be closed in exit handlers.
    static auto* const theDisplays = new OpenDisplays;
    return *theDisplays;
}

void OpenDisplays::open(Display* display)
{
    const std::scoped_lock lock(fMutex);
    if (!fListeners.try_emplace(display).second)
        return;
    if (const XExtCodes* codes = glx().addExtension(display); codes != nullptr)
        glx().setCloseDisplay(display, codes->extension, closing);
}

void OpenDisplays::listen(Display* display, GLXContext context, Listener listener)
{
    const std::scoped_lock lock(fMutex);
    fListeners[display].insert_or_assign(context, std::move(listener));
}

// The lock is held throughout, so that the display cannot close in the meantime. An entry without
// listeners stays until its display closes, as a mark that the hook is installed.
void OpenDisplays::destroy(Display* display, GLXContext context)
{
    const std::scoped_lock lock(fMutex);
    const auto entry = fListeners.find(display);
    if (entry == fListeners.end())
        return;
    entry->second.erase(context);
    glx().destroyContext(display, context);
}

void OpenDisplays::keep(GLXContext context) noexcept
{
    const std::scoped_lock lock(fMutex);
    try {
        fKept.push_back(context);
    } catch (const std::bad_alloc&) {
        // A leak checker reports the context; there is no other effect.
    }
}

int OpenDisplays::closing(Display* display, XExtCodes* /*codes*/)
{
    OpenDisplays& displays = openDisplays();
    std::map<GLXContext, Listener> listeners;
    {
        const std::scoped_lock lock(displays.fMutex);
        if (auto entry = displays.fListeners.extract(display))
            listeners = std::move(entry.mapped());
    }
    for (const auto& [context, listener] : listeners)
        listener();
    return 0;
}

class GlxContext final : public GlContext {
public:
    // Owns no context until own() is called.
    explicit GlxContext(Display* display) : fDisplay(display) { openDisplays().open(display); }

    ~GlxContext() override
    {
        if (fContext != nullptr)
            openDisplays().destroy(fDisplay, fContext);
    }

    void own(GLXContext context) { fContext = context; }

    bool makeCurrent() override
    {
        return glx().makeContextCurrent(fDisplay, None, None, fContext) == True;
    }

    void releaseCurrent() override { glx().makeContextCurrent(fDisplay, None, None, nullptr); }

    void abandon() override { openDisplays().keep(std::exchange(fContext, nullptr)); }

    bool callerHasContext() const override { return glx().getCurrentContext() != nullptr; }

    GlFunctions::Resolver resolver() const noexcept override { return resolveGl; }

    void onDisplayClosing(std::function<void()> closing) override
    {
        openDisplays().listen(fDisplay, fContext, std::move(closing));
    }

private:
    Display* fDisplay;
    GLXContext fContext = nullptr;
};

// Ignores X errors while a context is created, the only request here that the server can refuse.
// Xlib ends the process on an unhandled error, and has one handler for all threads.
class ErrorTrap {
public:
    explicit ErrorTrap(Display* display) : fDisplay(display)
    {
        glx().sync(fDisplay, False);
        fPrevious = glx().setErrorHandler([](Display*, XErrorEvent*) { return 0; });
    }
    ~ErrorTrap()
    {
        glx().sync(fDisplay, False);
        glx().setErrorHandler(fPrevious);
    }
    ErrorTrap(const ErrorTrap&) = delete;
    ErrorTrap& operator=(const ErrorTrap&) = delete;

private:
    Display* fDisplay;
    XErrorHandler fPrevious = nullptr;
};

// Returns the framebuffer configuration of a context; null if there is none. Compares ids itself,
// since glXChooseFBConfig does not find every configuration by id.
GLXFBConfig configOf(Display* display, GLXContext context)
{
    int contextId = 0;
    int screen = 0;
    glx().queryContext(display, context, GLX_FBCONFIG_ID, &contextId);
    glx().queryContext(display, context, GLX_SCREEN, &screen);
    int count = 0;
    GLXFBConfig* all = glx().getFBConfigs(display, screen, &count);
    if (all == nullptr)
        return nullptr;
    GLXFBConfig found = nullptr;
    for (GLXFBConfig config : std::span(all, static_cast<std::size_t>(count))) {
        int id = 0;
        glx().getFBConfigAttrib(display, config, GLX_FBCONFIG_ID, &id);
        if (id == contextId)
            found = config;
    }
    glx().free(all);
    return found;
}

} // namespace

// GLX has no query that is safe for an invalid handle.
bool isShareableGlx(void* display, void* context)
{
    return display != nullptr && context != nullptr && glx().complete;
}

std::unique_ptr<GlContext> createGlxContext(void* display, void* shareContext)
{
    if (!isShareableGlx(display, shareContext))
        return nullptr;
    auto* x = static_cast<Display*>(display);
    auto* share = static_cast<GLXContext>(shareContext);

    // 3.3 is the oldest version with all the functions that GlFunctions needs.
    const std::array<int, 7> attributes{GLX_CONTEXT_MAJOR_VERSION_ARB,
                                        3,
                                        GLX_CONTEXT_MINOR_VERSION_ARB,
                                        3,
                                        GLX_CONTEXT_PROFILE_MASK_ARB,
                                        GLX_CONTEXT_CORE_PROFILE_BIT_ARB,
                                        None};
    const ErrorTrap trap(x);
    GLXFBConfig config = configOf(x, share);
    if (config == nullptr)
        return nullptr;
    auto result = std::make_unique<GlxContext>(x);
    GLXContext context = glx().createContextAttribs(x, config, share, True, attributes.data());
    if (context == nullptr)
        return nullptr;
    result->own(context);
    return result;
}

} // namespace glshare
