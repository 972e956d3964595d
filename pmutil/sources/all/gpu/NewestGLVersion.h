// Determines the OpenGL version of a context from its supported versions.
#pragma once

#include <functional>

#include "qgf/OGL.h"

namespace pmutil {

// Calls `isSupported` for the known versions from the newest down and returns the text of the first
// for which it returns true, such as "4.1"; null if there is none.
const char*
NewestGLVersion(const std::function<bool(QGF::OGL::OpenGLExtension version)>& isSupported);

} // namespace pmutil
