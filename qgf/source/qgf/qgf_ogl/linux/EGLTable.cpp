#include "qgf/qgf_ogl/linux/EGLTable.h"

#include <string>
#include <type_traits>

#include "qgf/qgf_core/ObservedCalls.h"

namespace QGF {
namespace OGL {

void FillEGLTable(EGLTable& table, Core::Proc (*getProc)(void* context, const char* name),
                  void* context)
{
    const auto fill = [getProc, context](auto& member, const char* name) {
        member =
            reinterpret_cast<std::remove_reference_t<decltype(member)>>(getProc(context, name));
        if (member == nullptr)
            throw LogicalException(std::string(name) + " is not offered by this EGL library");
    };
    const auto fillExtension = [&table](auto& member, const char* name) {
        const Core::DriverCall call(Core::Interface::kOpenGL);
        member = reinterpret_cast<std::remove_reference_t<decltype(member)>>(
            table.eglGetProcAddress(name));
    };

#define QGF_EGL_FILL(name) fill(table.name, #name);
#define QGF_EGL_FILL_EXTENSION(name) fillExtension(table.name, #name);
    QGF_EGL_ENTRY_POINTS(QGF_EGL_FILL, QGF_EGL_FILL_EXTENSION)
#undef QGF_EGL_FILL
#undef QGF_EGL_FILL_EXTENSION
}

void ObserveCalls(EGLTable& table)
{
#define QGF_EGL_OBSERVE(name) Core::ObserveMember<Core::Interface::kOpenGL, &EGLTable::name>(table);
    QGF_EGL_ENTRY_POINTS(QGF_EGL_OBSERVE, QGF_EGL_OBSERVE)
#undef QGF_EGL_OBSERVE
}

} // namespace OGL
} // namespace QGF
