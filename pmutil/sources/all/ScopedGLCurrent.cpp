#include "ScopedGLCurrent.h"

#include <boost/make_shared.hpp>

namespace pmutil {

ScopedGLCurrent::ScopedGLCurrent(QGF::OGL::ContextOffscreen& context)
    : fWrapper(boost::make_shared<QGF::OGL::ScopedContextWrapper>(true)), fContext(&context)
{
    fContext->makeCurrent();
}

ScopedGLCurrentExtensions::ScopedGLCurrentExtensions(QGF::OGL::ContextOffscreen& context)
    : ScopedGLCurrent(context), fExtensions(QGF::OGL::ExtensionManager::Instance())
{}

} // namespace pmutil
