#include "all/gpu/ScopedGLCurrent.h"

#include <boost/make_shared.hpp>

#include "pmutil/Requirement.h"

namespace pmutil {

ScopedGLCurrent::ScopedGLCurrent(QGF::OGL::ContextOffscreen& context)
    : fWrapper(boost::make_shared<QGF::OGL::ScopedContextWrapper>(true)), fContext(&context)
{
    fContext->makeCurrent();
}

ScopedGLCurrentExtensions::ScopedGLCurrentExtensions(QGF::OGL::ContextOffscreen& context)
    : ScopedGLCurrent(context), fExtensions(QGF::OGL::ExtensionManager::Instance())
{}

QGF::OGL::ExtensionManager& RequireExtensions(QGF::OGL::ExtensionManager* extensions)
{
    if (extensions == nullptr)
        RequirementFailed(kNoFile, 0, "QGF::OGL::ExtensionManager::Instance() returned NULL", true);
    // RequirementFailed with true never returns; the analyzer doesn't see that.
    return *extensions; // NOLINT(clang-analyzer-core.uninitialized.UndefReturn)
}

} // namespace pmutil
