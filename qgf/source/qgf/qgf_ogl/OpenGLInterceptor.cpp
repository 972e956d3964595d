#include "qgf/OGL.h"

namespace QGF {
namespace OGL {

OpenGLInterceptor::OpenGLInterceptor(GetProc getProc, void* context) : fLookup{getProc, context} {}

const OpenGLInterceptor& OpenGLInterceptor::Instance()
{
    const Context* const context = Context::Current();
    if (context == nullptr)
        throw LogicalException("No OpenGL context is current on this thread");
    return context->interceptor();
}

} // namespace OGL
} // namespace QGF
