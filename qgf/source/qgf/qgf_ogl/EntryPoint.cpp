#include <string>

#include "qgf/OGLEntryPoint.h"

namespace QGF {
namespace OGL {

Core::Proc EntryPointLookup::find(const char* name, const char* extensionName) const
{
    const Core::Proc proc = getProc(context, name);
    return proc == nullptr && extensionName != nullptr ? getProc(context, extensionName) : proc;
}

void ThrowNotOffered(const char* name, const char* file, int line)
{
    throw LogicalException(std::string(name) +
                           " is not offered by this OpenGL driver (called from " +
                           (file != nullptr ? file : "?") + ":" + std::to_string(line) + ")");
}

} // namespace OGL
} // namespace QGF
