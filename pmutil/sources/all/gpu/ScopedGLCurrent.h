// Makes a device's OpenGL context current for the length of a scope, and on every way out restores
// what was current before. On the thread that owns the context.
#pragma once

#include <boost/shared_ptr.hpp>

#include "qgf/OGL.h"

namespace pmutil {

// The library's own exceptions pass through; what was current before is restored then too.
class ScopedGLCurrent {
public:
    explicit ScopedGLCurrent(QGF::OGL::ContextOffscreen& context);

private:
    boost::shared_ptr<QGF::OGL::ScopedContextWrapper> fWrapper;
    QGF::OGL::ContextOffscreen* fContext; // not owned
};

// The same for a scope that asks which extensions the context offers.
class ScopedGLCurrentExtensions : public ScopedGLCurrent {
public:
    explicit ScopedGLCurrentExtensions(QGF::OGL::ContextOffscreen& context);

    // Null if the library has none for the context.
    QGF::OGL::ExtensionManager* Extensions() const { return fExtensions; }

private:
    QGF::OGL::ExtensionManager* fExtensions; // not owned
};

// The manager itself. Throws std::runtime_error "QGF::OGL::ExtensionManager::Instance() returned
// NULL" for null, after the failure handler was told.
QGF::OGL::ExtensionManager& RequireExtensions(QGF::OGL::ExtensionManager* extensions);

} // namespace pmutil
