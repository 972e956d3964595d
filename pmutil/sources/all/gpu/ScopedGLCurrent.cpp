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
    // It threw above: the check sees only that it may return for who doesn't ask it to throw.
    return *extensions; // NOLINT(clang-analyzer-core.uninitialized.UndefReturn)
}

} // namespace pmutil
