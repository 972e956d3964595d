#include "qgf/qgf_ogl/linux/EGLTable.h"

#include <string>
#include <type_traits>

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
        member = reinterpret_cast<std::remove_reference_t<decltype(member)>>(
            table.eglGetProcAddress(name));
    };

    fill(table.eglGetError, "eglGetError");
    fill(table.eglQueryString, "eglQueryString");
    fill(table.eglGetDisplay, "eglGetDisplay");
    fill(table.eglInitialize, "eglInitialize");
    fill(table.eglBindAPI, "eglBindAPI");
    fill(table.eglChooseConfig, "eglChooseConfig");
    fill(table.eglCreateContext, "eglCreateContext");
    fill(table.eglDestroyContext, "eglDestroyContext");
    fill(table.eglCreatePbufferSurface, "eglCreatePbufferSurface");
    fill(table.eglDestroySurface, "eglDestroySurface");
    fill(table.eglMakeCurrent, "eglMakeCurrent");
    fill(table.eglGetProcAddress, "eglGetProcAddress");

    fillExtension(table.eglGetPlatformDisplayEXT, "eglGetPlatformDisplayEXT");
    fillExtension(table.eglQueryDevicesEXT, "eglQueryDevicesEXT");
    fillExtension(table.eglQueryDeviceStringEXT, "eglQueryDeviceStringEXT");
}

} // namespace OGL
} // namespace QGF
