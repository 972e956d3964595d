#include "qgf/OGL.h"
#include "qgf/OGLPlatform.h"
#include "qgf/qgf_ogl/Devices.h"

namespace QGF {
namespace OGL {

namespace {

thread_local Context* gCurrentContext = nullptr;

std::unique_ptr<PlatformContext> CreateOffscreen(const DisplayDeviceKey& key)
{
    std::unique_ptr<PlatformContext> context = CurrentPlatform().createOffscreen(key);
    if (!context)
        throw LogicalException("The platform made no context on display device " +
                               key.deviceName());
    return context;
}

} // namespace

Context::Context(std::unique_ptr<PlatformContext> context)
    : fContext(std::move(context)), fSelf(this, [](Context*) {})
{}

Context::~Context()
{
    if (gCurrentContext == this)
        ReleaseCurrent();
}

void Context::ReleaseCurrent() noexcept
{
    if (gCurrentContext == nullptr)
        return;
    gCurrentContext->fContext->release();
    gCurrentContext = nullptr;
}

void Context::makeCurrent()
{
    if (gCurrentContext == this)
        return;
    fContext->makeCurrent();
    gCurrentContext = this;
    if (!fInterceptor) {
        const auto getProc = [](void* context, const char* name) {
            return static_cast<PlatformContext*>(context)->getProc(name);
        };
        fInterceptor = std::make_unique<OpenGLInterceptor>(getProc, fContext.get());
    }
}

Context* Context::Current()
{
    return gCurrentContext;
}

const OpenGLInterceptor& Context::interceptor() const
{
    if (!fInterceptor)
        throw LogicalException("This OpenGL context has not been current yet");
    return *fInterceptor;
}

ExtensionManager& Context::extensionManager()
{
    if (!fExtensionManager)
        fExtensionManager = std::make_unique<ExtensionManager>(interceptor());
    return *fExtensionManager;
}

ContextOffscreen::ContextOffscreen(const DisplayDeviceKey& key) : Context(CreateOffscreen(key)) {}

ContextOffscreen::~ContextOffscreen() = default;

ScopedContextWrapper::ScopedContextWrapper(bool restore) : fRestore(restore)
{
    if (const Context* const current = Context::Current())
        fPrevious = current->fSelf;
}

ScopedContextWrapper::~ScopedContextWrapper()
{
    if (!fRestore)
        return;
    const std::shared_ptr<Context> previous = fPrevious.lock();
    if (Context::Current() == previous.get())
        return;
    if (previous) {
        try {
            previous->makeCurrent();
            return;
        } catch (...) {
            // Leave no context current instead of a wrong one.
        }
    }
    Context::ReleaseCurrent();
}

} // namespace OGL
} // namespace QGF
