// The OpenGL version of a context, from what it claims to support.
#pragma once

#include <functional>

#include "qgf/OGL.h"

namespace pmutil {

// The text of the newest version, of those that the program knows, for which `isSupported` answers
// true; null if there is none. Asks from the newest down, and no further than the first true
// answer.
const char*
NewestGLVersion(const std::function<bool(QGF::OGL::OpenGLExtension version)>& isSupported);

} // namespace pmutil
