#include "Renderer.h"

#include "standalone/GLHost.h"
#include "standalone/NativeContext.h"
#include "tests/support/KeepModulesLoaded.h"

#include <QGuiApplication>
#include <QOffscreenSurface>
#include <QOpenGLContext>

namespace {

class QtRenderer : public Renderer {
public:
    ~QtRenderer() override { keepModulesLoaded(); }

    bool begin()
    {
        fSurface.create();
        if (!fContext.create() || !fContext.makeCurrent(&fSurface))
            return false;
        fHost = std::make_unique<GLHost>(fContext);
        return true;
    }

    void* window() const override { return nullptr; }
    void* context() const override { return nativeContext(fContext); }

private:
    void* function(const char* name) const override
    {
        return reinterpret_cast<void*>(fContext.getProcAddress(name));
    }

    // Destroyed in reverse order: the application outlives all other Qt objects.
    int fArgumentCount = 1;
    char fProgramName[18] = "vyra-opencl-tests";
    char* fArguments[2] = {fProgramName, nullptr};
    QGuiApplication fApplication{fArgumentCount, fArguments};
    QOffscreenSurface fSurface;
    QOpenGLContext fContext;
    std::unique_ptr<GLHost> fHost;
};

} // namespace

std::unique_ptr<Renderer> Renderer::make()
{
    auto renderer = std::make_unique<QtRenderer>();
    return renderer->begin() ? std::move(renderer) : nullptr;
}
