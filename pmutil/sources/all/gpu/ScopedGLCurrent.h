// Makes a device's OpenGL context current for a scope and restores the previous context at its end.
// Use it on the thread of the context.
#pragma once

#include <boost/shared_ptr.hpp>

#include "qgf/OGL.h"

namespace pmutil {

class ScopedGLCurrent {
public:
    // The library's exceptions pass through; the previous context is restored first.
    explicit ScopedGLCurrent(QGF::OGL::ContextOffscreen& context);

private:
    boost::shared_ptr<QGF::OGL::ScopedContextWrapper> fWrapper;
    QGF::OGL::ContextOffscreen* fContext; // not owned
};

// The same for a scope that needs the context's extensions.
class ScopedGLCurrentExtensions : public ScopedGLCurrent {
public:
    explicit ScopedGLCurrentExtensions(QGF::OGL::ContextOffscreen& context);

    // Returns the library's extension manager for the context; may be null.
    QGF::OGL::ExtensionManager* Extensions() const { return fExtensions; }

private:
    QGF::OGL::ExtensionManager* fExtensions; // not owned
};

// Returns the manager. For null, reports "QGF::OGL::ExtensionManager::Instance() returned NULL" by
// RequirementFailed, which throws it as std::runtime_error.
QGF::OGL::ExtensionManager& RequireExtensions(QGF::OGL::ExtensionManager* extensions);

} // namespace pmutil
