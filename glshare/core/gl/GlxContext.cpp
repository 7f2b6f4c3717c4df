// Implements GlContext for GLX.
//
// The context lives on the application's own display connection: the drivers share objects between
// contexts of one connection, and each connection has a screen object of its own that must outlive
// the storage. Xlib locks a connection by itself since 1.8; applications on older ones that use
// several threads call XInitThreads anyway. When the application closes the connection, Xlib tells
// us first.
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

// Who must be told when a display connection closes, and with that which connections have our hook.
class OpenDisplays {
public:
    using Listener = std::function<void()>;

    // Sets the hook where there is none yet.
    void open(Display* display);

    void listen(Display* display, GLXContext context, Listener listener);

    // Destroys a context, unless its display is closed or is closing.
    void destroy(Display* display, GLXContext context);

    // For a context that is left behind: remembers it, so that it does not look lost.
    void keep(GLXContext context) noexcept;

private:
    // Xlib's hook: runs in XCloseDisplay, before GLX's own, since the newest extension comes first.
    static int closing(Display* display, XExtCodes* codes);

    std::mutex fMutex; // guards the rest
    std::map<Display*, std::map<GLXContext, Listener>> fListeners;
    std::vector<GLXContext> fKept;
};

OpenDisplays& openDisplays()
{
    // Never destroyed, so that a display closed at exit still finds it.
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

// The lock is held throughout, so that the display cannot go in the meantime. An entry without
// listeners stays as long as its display: it says that the hook is set.
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
        // It looks lost, and nothing else follows from that.
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
    // Owns no context yet.
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

    GlFunctions::Resolver resolver() const override { return resolveGl; }

    void onDisplayClosing(std::function<void()> closing) override
    {
        openDisplays().listen(fDisplay, fContext, std::move(closing));
    }

private:
    Display* fDisplay;
    GLXContext fContext = nullptr;
};

// Xlib ends the process on an error that nobody handles, and has one handler for all threads. This
// one takes its place while a context is created, which is the only request that can be refused.
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

// The configuration of the application's context. It is searched for by hand, since
// glXChooseFBConfig does not return every configuration by its number.
GLXFBConfig configOf(Display* display, GLXContext context)
{
    int wanted = 0;
    int screen = 0;
    glx().queryContext(display, context, GLX_FBCONFIG_ID, &wanted);
    glx().queryContext(display, context, GLX_SCREEN, &screen);
    int count = 0;
    GLXFBConfig* all = glx().getFBConfigs(display, screen, &count);
    if (all == nullptr)
        return nullptr;
    GLXFBConfig found = nullptr;
    for (GLXFBConfig config : std::span(all, static_cast<std::size_t>(count))) {
        int id = 0;
        glx().getFBConfigAttrib(display, config, GLX_FBCONFIG_ID, &id);
        if (id == wanted)
            found = config;
    }
    glx().free(all);
    return found;
}

} // namespace

// GLX offers no question that is safe to ask about a handle that may be bad.
bool isShareableGlx(void* display, void* context)
{
    return display != nullptr && context != nullptr && glx().complete;
}

std::unique_ptr<GlContext> createGlxContext(void* display, void* shareContext)
{
    if (!isShareableGlx(display, shareContext))
        return nullptr;
    auto* const x = static_cast<Display*>(display);
    auto* const share = static_cast<GLXContext>(shareContext);

    // 3.3 is the oldest version that has all we call, and works without a drawable.
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
