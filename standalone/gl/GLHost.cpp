#include "standalone/GLHost.h"

#include "host/GLFunctionTable.h"
#include "host/ResourceWindow.h"

#include "standalone/gl/SyncFunctions.h"

#include <QOpenGLContext>
#include <QOpenGLWindow>

#include <atomic>
#include <cstdint>
#include <thread>

namespace vyra::host {

struct GLHostState {
    GLHostState(QOpenGLContext& context, QOpenGLWindow* resourceWindow)
        : sync(context), window(resourceWindow)
    {
    }

    SyncFunctions sync;
    GLFunctionTable table;
    QOpenGLWindow* window;
    std::thread::id windowThread = std::this_thread::get_id();
};

namespace {

std::atomic<GLHostState*> active = nullptr;

SyncFunctions& activeSync()
{
    return active.load()->sync;
}

GLsync fenceSync(unsigned int condition, unsigned int flags)
{
    return activeSync().fence(condition, flags);
}

void deleteSync(GLsync sync)
{
    activeSync().remove(sync);
}

unsigned int clientWaitSync(GLsync sync, unsigned int flags, std::uint64_t timeoutNs)
{
    return activeSync().clientWait(sync, flags, timeoutNs);
}

void waitSync(GLsync sync, unsigned int flags, std::uint64_t timeoutNs)
{
    activeSync().serverWait(sync, flags, timeoutNs);
}

GLsync createSyncFromCLEvent(cl_context context, cl_event event, unsigned int flags)
{
    return activeSync().fromCLEvent(context, event, flags);
}

std::unique_ptr<GLHostState> activate(QOpenGLContext& context, QOpenGLWindow* window)
{
    auto state = std::make_unique<GLHostState>(context, window);
    GLFunctionTable& table = state->table;
    table.glFenceSync = fenceSync;
    table.glDeleteSync = deleteSync;
    table.glClientWaitSync = clientWaitSync;
    table.glWaitSync = waitSync;
    table.glCreateSyncFromCLeventARB = createSyncFromCLEvent;
    table.fSyncObjectsUsable = state->sync.usable();
    table.fSyncFromCLEventUsable = state->sync.usable();
    active = state.get();
    GLFunctionTable::fpGlobalFunctionTable = &table;
    return state;
}

} // namespace
} // namespace vyra::host

QOpenGLWindow* Q3dPort::resourceWindow()
{
    const vyra::host::GLHostState* const host = vyra::host::active.load();
    const bool onItsThread = host != nullptr && host->windowThread == std::this_thread::get_id();
    return onItsThread ? host->window : nullptr;
}

GLHost::GLHost(QOpenGLWindow& window) : fState(vyra::host::activate(*window.context(), &window)) {}

GLHost::GLHost(QOpenGLContext& context) : fState(vyra::host::activate(context, nullptr)) {}

GLHost::~GLHost()
{
    GLFunctionTable::fpGlobalFunctionTable = nullptr;
    vyra::host::active = nullptr;
}

bool GLHost::syncObjectsUsable() const
{
    return fState->table.syncObjectsUsable();
}

bool GLHost::syncFromCLEventUsable() const
{
    return fState->table.syncFromCLEventUsable();
}
